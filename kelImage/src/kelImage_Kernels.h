// The kernels that image operations are built of, one table of them for each instruction set; all tables give the same bytes.
// Operations fetch the table once a call and know rows, types and routes; kernels know lanes.
#ifndef KEL_IMAGE_KERNELS_H
#define KEL_IMAGE_KERNELS_H

#include <cstddef>
#include <cstdint>

namespace kel {

// Turns `pixels` pixels at s into as many at d. Nothing beside these is read or written, here and in what follows, unless said.
using Run = void (*)(uint8_t* d, const uint8_t* s, ptrdiff_t pixels);

// Least and greatest byte.
struct Range {
    uint8_t least = 255, greatest = 0;
};

// The picture that a warp samples; `step` in pixels.
struct WarpSource {
    const uint8_t* data;
    int32_t width, height, step;
};
using WarpRow = void (*)(uint8_t* d, ptrdiff_t width, float y, const float* h, const WarpSource& src);

using ReduceAcross = void (*)(uint32_t* d, const uint32_t* s, const int32_t* index, const uint16_t* weights, ptrdiff_t groups,
                              ptrdiff_t width, uint32_t box);
using ReduceDown = void (*)(uint8_t* d, const uint8_t* const* row, const uint16_t* weights, ptrdiff_t pairs, ptrdiff_t bytes,
                            uint32_t box);

// What they compute stands where they are defined, in the files named after the families.
struct Kernels {
    // Converters. The fourth channel becomes 0, save where four channels are reversed, which keeps it. A spread goes to every
    // third byte or word; what lies between is not written.
    Run greyToThree, greyToFour, greyToWords, magnitudeToGrey, magnitudeToThree, magnitudeToFour;
    Run meanOfThree, wordMeanOfThree, meanOfFourSpread, wordMeanOfFourSpread;
    Run threeReversed, threeToFour, threeToFourReversed, fourToThree, fourToThreeReversed, fourReversed;
    // YUV, two pixels a pair: the luma; truncated to three channels; rounded by the thread's mode to four. `pixels` is even.
    Run yuvToGrey, yuvToRgb, yuvToBgr, yuvToRgba, yuvToBgra;

    // Points; widths and ends are multiples of 16.
    Range (*rangeOf)(const uint8_t* s, ptrdiff_t pitch, ptrdiff_t width, ptrdiff_t rows);
    void (*stretch)(uint8_t* d, const uint8_t* s, ptrdiff_t width, int least, float scale);
    void (*binarize)(uint8_t* d, const uint8_t* s, ptrdiff_t width, int threshold);
    void (*localMeansAcross)(uint8_t* t, const uint8_t* s, ptrdiff_t begin, ptrdiff_t end); // 8 zeros behind, multiples of 8
    void (*binarizeByMeans)(uint8_t* d, const uint8_t* s, const uint8_t* t, ptrdiff_t pitch, ptrdiff_t begin, ptrdiff_t end);

    // Filters, by rows; columns begin .. end-1 are whole blocks of 16, across of 8, of Sobel 4.
    void (*fiveAcross)(int16_t* t, const uint8_t* s, ptrdiff_t width);
    void (*fiveDown)(uint8_t* d, const int16_t* const* row, ptrdiff_t width);
    void (*sevenAcross)(uint8_t* t, const uint8_t* s, ptrdiff_t begin, ptrdiff_t end); // 8 zeros behind
    void (*sevenDown)(uint8_t* d, const uint8_t* t, ptrdiff_t pitch, ptrdiff_t begin, ptrdiff_t end);
    void (*sevenDownTwice)(uint8_t* first, uint8_t* second, uint8_t* half, const uint8_t* t, ptrdiff_t pitch, ptrdiff_t begin,
                           ptrdiff_t end); // 8 zeros behind in `half`, which may be null
    void (*crossRow)(int16_t* d, const uint8_t* s, ptrdiff_t pitch, ptrdiff_t distance, ptrdiff_t begin, ptrdiff_t end);
    void (*sobelRow)(int16_t* d, const uint8_t* s, ptrdiff_t pitch, ptrdiff_t begin, ptrdiff_t end); // 4 zeros behind
    void (*extremaMasks)(uint64_t* mask, const int16_t* r, ptrdiff_t pitch, ptrdiff_t masks, int strong);

    // Whole pixels of 1 to 4 bytes.
    Run reversed[4], evenPixels[4], oddPixels[4];
    WarpRow warpRow[4];

    // Resampling. Rows that are filled across have a width of a multiple of 4.
    void (*averageOfFour)(uint8_t* d, const uint8_t* s, const uint8_t* below, ptrdiff_t width, ptrdiff_t neighbour,
                          ptrdiff_t ratio);
    void (*enlargeAcross)(uint32_t* d, const uint32_t* s, const int32_t* index, const uint16_t* weights, ptrdiff_t width);
    void (*mixRows)(uint8_t* d, const uint8_t* above, const uint8_t* below, int weight, ptrdiff_t bytes);
    ReduceAcross reduceAcrossByBytes, reduceAcrossByWords;
    ReduceDown reduceDownByBytes, reduceDownByWords;
    void (*halveBothWays)(uint32_t* d, const uint32_t* above, const uint32_t* below, ptrdiff_t width);
};

// What this processor can do at its widest.
const Kernels& kernels();

namespace sse41 {
extern const Kernels kernels;
}
namespace avx2 {
extern const Kernels kernels;
}
namespace avx512 { // F, BW, VL and VBMI
extern const Kernels kernels;
}
namespace neon { // AArch64
extern const Kernels kernels;
}

} // namespace kel

#endif
