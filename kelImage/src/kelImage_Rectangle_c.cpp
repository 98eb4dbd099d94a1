// Rectangles between two corners (pp1), corner and size (ps1), and centre and size (ps2).
#include <cstdint>

#include "kelImage.h"

namespace {

using Wide = int64_t; // of the integer forms: no sum or difference of two coordinates overflows

template <class T, class Value> void set(T* rectangle, Value a, Value b, Value c, Value d) {
    rectangle[0] = static_cast<T>(a);
    rectangle[1] = static_cast<T>(b);
    rectangle[2] = static_cast<T>(c);
    rectangle[3] = static_cast<T>(d);
}

} // namespace

extern "C" {

void kel_rectangle_translate_pp1_to_ps1_s32(kelValue_s32* dst, const kelValue_s32* src) {
    set<kelValue_s32, Wide>(dst, src[0], src[1], Wide(src[2]) - src[0], Wide(src[3]) - src[1]);
}

void kel_rectangle_translate_pp1_to_ps2_s32(kelValue_s32* dst, const kelValue_s32* src) {
    set<kelValue_s32, Wide>(dst, (Wide(src[0]) + src[2]) / 2, (Wide(src[1]) + src[3]) / 2, Wide(src[2]) - src[0],
                            Wide(src[3]) - src[1]);
}

void kel_rectangle_translate_ps1_to_pp1_s32(kelValue_s32* dst, const kelValue_s32* src) {
    set<kelValue_s32, Wide>(dst, src[0], src[1], Wide(src[0]) + src[2], Wide(src[1]) + src[3]);
}

void kel_rectangle_translate_ps1_to_ps2_s32(kelValue_s32* dst, const kelValue_s32* src) {
    set<kelValue_s32, Wide>(dst, Wide(src[0]) + src[2] / 2, Wide(src[1]) + src[3] / 2, src[2], src[3]);
}

void kel_rectangle_translate_pp1_to_ps1_f32(float* dst, const float* src) {
    set(dst, src[0], src[1], src[2] - src[0], src[3] - src[1]);
}

void kel_rectangle_translate_pp1_to_ps2_f32(float* dst, const float* src) {
    set(dst, (src[0] + src[2]) * 0.5f, (src[1] + src[3]) * 0.5f, src[2] - src[0], src[3] - src[1]);
}

void kel_rectangle_translate_ps1_to_pp1_f32(float* dst, const float* src) {
    set(dst, src[0], src[1], src[0] + src[2], src[1] + src[3]);
}

void kel_rectangle_translate_ps1_to_ps2_f32(float* dst, const float* src) {
    set(dst, src[0] + src[2] * 0.5f, src[1] + src[3] * 0.5f, src[2], src[3]);
}

// Out of the centre form nothing is converted: callers rely on their destination staying as it is.
void kel_rectangle_translate_ps2_to_pp1_s32(kelValue_s32*, const kelValue_s32*) {}
void kel_rectangle_translate_ps2_to_ps1_s32(kelValue_s32*, const kelValue_s32*) {}
void kel_rectangle_translate_ps2_to_pp1_f32(float*, const float*) {}
void kel_rectangle_translate_ps2_to_ps1_f32(float*, const float*) {}

} // extern "C"
