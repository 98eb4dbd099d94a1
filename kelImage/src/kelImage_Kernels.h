// The kernels that image operations are built of, one table of them for each instruction set; all tables give the same bytes.
// Operations fetch the table once a call and know rows, types and routes; kernels know lanes.
#ifndef KEL_IMAGE_KERNELS_H
#define KEL_IMAGE_KERNELS_H

#include <stddef.h>
#include <stdint.h>

namespace kel {

// Turns `pixels` pixels at s into as many at d. Nothing beside these is read or written.
using Run = void (*)(uint8_t* d, const uint8_t* s, ptrdiff_t pixels);

// Least and greatest byte so far.
struct Range {
    uint8_t least = 255, greatest = 0;
};

struct Kernels {
    // Converters. The fourth channel becomes 0, save where four channels are reversed, which keeps it.
    Run greyToThree, greyToFour, greyToWords;
    Run magnitudeToGrey, magnitudeToThree, magnitudeToFour; // low 8 bits of abs(s) >> 7
    Run meanOfThree, wordMeanOfThree;                       // (s0 + s1 + s2) / 3, rounding down
    Run meanOfFourSpread, wordMeanOfFourSpread;             // the same of four channels, to every third byte or word
    Run threeReversed, threeToFour, threeToFourReversed, fourToThree, fourToThreeReversed, fourReversed;
    // YUV, two pixels a pair: the luma; truncated to three channels; rounded by the thread's mode to four. `pixels` is even.
    Run yuvToGrey, yuvToRgb, yuvToBgr, yuvToRgba, yuvToBgra;
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

} // namespace kel

#endif
