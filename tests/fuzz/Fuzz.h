// What the fuzz targets share: numbers from the input's bytes, and twins of an image for library and reference, whose
// comparison stops the run.
#ifndef KEL_TESTS_FUZZ_H
#define KEL_TESTS_FUZZ_H

#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <kel/kelImage.hpp>
#include <random>
#include <vector>

#include "ImageOperations.h"

namespace kel_fuzz {

[[noreturn]] inline void fail(const char* what) {
    std::fprintf(stderr, "differs from the reference: %s\n", what);
    std::abort();
}

// The input as a stream; zeros behind its end.
class Input {
public:
    Input(const uint8_t* data, size_t size) : m_data(data), m_size(size) {}

    uint8_t byte() { return m_size ? (--m_size, *m_data++) : 0; }
    uint32_t word() { return byte() | byte() << 8 | byte() << 16 | static_cast<uint32_t>(byte()) << 24; }
    // low .. high, at most 256 apart.
    int between(int low, int high) { return low + byte() % (high - low + 1); }
    // Mostly harmless numbers, sometimes any bits.
    float number() {
        const uint8_t kind = byte();
        if (kind < 16) {
            const uint32_t bits = word();
            float value;
            std::memcpy(&value, &bits, sizeof value);
            return value;
        }
        const int16_t value = static_cast<int16_t>(byte() | byte() << 8);
        return kind < 64 ? static_cast<float>(value % 8) : static_cast<float>(value) / 256.0f;
    }
    // `count` bytes of a few kinds: the input itself, noise, a run of few values.
    void fill(uint8_t* out, size_t count) {
        const uint8_t kind = byte();
        std::mt19937 random(word());
        uint8_t run = byte();
        for (size_t i = 0; i < count; ++i) {
            if (kind % 4 == 0)
                run = byte();
            else if (kind % 4 == 1 || random() % (kind / 4 + 1) == 0)
                run = static_cast<uint8_t>(kind % 4 == 3 ? (random() % 2) * 255 : random());
            out[i] = run;
        }
    }

private:
    const uint8_t* m_data;
    size_t m_size;
};

using kel::Image;

// Two images with the same bytes: `lib` for the library, `ref` for the reference.
struct Twins {
    Image lib, ref;
    size_t bytes;

    Twins(Input& input, int width, int height, int type, size_t extra = 0)
        : lib(kel_test::imageWithRoom({width, height}, type, extra)),
          ref(kel_test::imageWithRoom({width, height}, type, extra)), bytes(static_cast<size_t>(lib->size) + extra) {
        input.fill(lib->data, bytes);
        std::memcpy(ref->data, lib->data, bytes);
    }
    void expectEqual(const char* what) const {
        if (std::memcmp(lib->data, ref->data, bytes) != 0)
            fail(what);
    }
};

} // namespace kel_fuzz

#endif
