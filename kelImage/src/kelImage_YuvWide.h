// The arithmetic of YUV to colour, and its wider variants for processors that have them. All give the same bytes.
#ifndef KEL_IMAGE_YUV_WIDE_H
#define KEL_IMAGE_YUV_WIDE_H

#include <stddef.h>
#include <stdint.h>

namespace kel {

// With U' = U - 128 and V' = V - 128:
//   C = (Y - 16) * kLuma, R = C + kRedV * V', G = C + kGreenU * U' + kGreenV * V', B = C + kBlueU * U',
// each product rounded to single precision. The portable and the vector form differ in how they sum up G and in how they round.
constexpr float kLuma = 1.164f, kRedV = 1.793f, kGreenU = -0.213f, kGreenV = -0.534f, kBlueU = 2.115f;

// Converts whole blocks of a run to four channels, moves both pointers behind them and returns the pixels left. A variant may be
// called where the processor has its instructions.
using YuvRun = ptrdiff_t (*)(uint8_t*& d, const uint8_t*& s, ptrdiff_t pixels, bool blueFirst);
ptrdiff_t yuvToFourChannels128(uint8_t*& d, const uint8_t*& s, ptrdiff_t pixels, bool blueFirst); // SSE4.1
ptrdiff_t yuvToFourChannels256(uint8_t*& d, const uint8_t*& s, ptrdiff_t pixels, bool blueFirst); // AVX2
ptrdiff_t yuvToFourChannels512(uint8_t*& d, const uint8_t*& s, ptrdiff_t pixels, bool blueFirst); // AVX-512 F and BW

// The widest that this processor has.
inline YuvRun widestYuvRun() {
    if (__builtin_cpu_supports("avx512f") && __builtin_cpu_supports("avx512bw"))
        return yuvToFourChannels512;
    return __builtin_cpu_supports("avx2") ? yuvToFourChannels256 : yuvToFourChannels128;
}

} // namespace kel

#endif
