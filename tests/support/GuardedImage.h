// Images for differential tests: pixel data flush against a protected page, a patterned margin on the other side, and
// pathological fills.
#ifndef KEL_TESTS_GUARDED_IMAGE_H
#define KEL_TESTS_GUARDED_IMAGE_H

#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <gtest/gtest.h>
#include <kel/kelImage.h>
#include <ostream>
#include <sys/mman.h>
#include <unistd.h>
#include <vector>

#include "Random.h"

namespace kel_test {

using Bytes = std::vector<uint8_t>;

enum class Guard { Behind, Before }; // where the protected page touches the data; pages further out are protected, too
enum class Fill { Random, Zero, Max, Alternating, Ramp, Runs, Extremes };
constexpr Fill kFills[] = {Fill::Random, Fill::Zero, Fill::Max, Fill::Alternating, Fill::Ramp, Fill::Runs, Fill::Extremes};

inline Bytes filled(size_t bytes, Fill fill, uint32_t salt) {
    // as 16 bits: -32768, -1, 0, 32767, and neighbours
    static const uint8_t extremes[] = {0x00, 0x80, 0xff, 0xff, 0x00, 0x00, 0xff, 0x7f, 0x01, 0x80, 0x7f, 0x00, 0x80, 0x00};
    Bytes result(bytes);
    std::mt19937 random = generator(salt);
    uint32_t run = 0, bits = 0;
    const auto next = [&](size_t i) -> uint32_t {
        switch (fill) {
        case Fill::Zero:
            return 0;
        case Fill::Max:
            return 255;
        case Fill::Alternating:
            return i % 2 ? 255 : 0;
        case Fill::Ramp:
            return static_cast<uint32_t>(i * 3);
        case Fill::Runs:
            return run = random() % 8 == 0 ? random() : run;
        case Fill::Extremes:
            return extremes[(random() % 7) * 2 + i % 2];
        default:
            return (bits = i % 4 == 0 ? random() : bits) >> 8 * (i % 4);
        }
    };
    for (size_t i = 0; i < bytes; ++i)
        result[i] = static_cast<uint8_t>(next(i));
    return result;
}

class Image {
public:
    // `extra` bytes behind `size` belong to the data area, for the operations that reach beyond it.
    Image(int width, int height, int type, Guard guard = Guard::Behind, size_t extra = 0)
        : m_image(createKelImageHeader(width, height, type)), m_bytes(static_cast<size_t>(m_image->size) + extra) {
        const size_t page = static_cast<size_t>(sysconf(_SC_PAGESIZE));
        m_inner = (m_bytes + kMargin + page - 1) / page * page;
        m_mapped = m_inner + 2 * page;
        m_base = static_cast<uint8_t*>(mmap(nullptr, m_mapped, PROT_NONE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0));
        if (m_base == MAP_FAILED || mprotect(m_base + page, m_inner, PROT_READ | PROT_WRITE) != 0)
            std::abort();
        m_open = m_base + page;
        std::memset(m_open, kPattern, m_inner);
        m_image->data = guard == Guard::Behind ? m_open + m_inner - m_bytes : m_open;
        fill(Fill::Random,
             static_cast<uint32_t>(width) * 7919 + static_cast<uint32_t>(height) * 131 + static_cast<uint32_t>(type));
    }
    ~Image() {
        munmap(m_base, m_mapped);
        releaseKelImageHeader(&m_image);
    }
    Image(const Image&) = delete;
    Image& operator=(const Image&) = delete;

    kelImage_t* get() const { return m_image; }
    kelImage_t* operator->() const { return m_image; }
    uint8_t* data() const { return m_image->data; }
    size_t size() const { return m_bytes; } // `extra` included

    // Element c of pixel (x, y) by step, elements of T.
    template <class T = uint8_t> T& at(int x, int y, int c = 0) const {
        const int perPixel = m_image->channels * m_image->depth / static_cast<int>(sizeof(T));
        return reinterpret_cast<T*>(data())[(static_cast<ptrdiff_t>(y) * m_image->step + x) * perPixel + c];
    }

    void fill(Fill fill, uint32_t salt) const { set(filled(m_bytes, fill, salt)); }
    void set(const Bytes& bytes) const { std::copy(bytes.begin(), bytes.end(), data()); }
    Bytes bytes() const { return Bytes(data(), data() + m_bytes); }

    // Whether every byte beside the data still holds the pattern.
    bool marginIntact() const {
        for (const uint8_t* p = m_open; p < m_open + m_inner; ++p)
            if ((p < data() || p >= data() + m_bytes) && *p != kPattern)
                return false;
        return true;
    }

private:
    static constexpr size_t kMargin = 256;
    static constexpr uint8_t kPattern = 0xa5;
    kelImage_t* m_image;
    size_t m_bytes, m_inner, m_mapped;
    uint8_t* m_base;
    uint8_t* m_open;
};

// Whether an image holds exactly the expected bytes, padding included, with its margin intact; names the first difference.
inline testing::AssertionResult holds(const Image& image, const Bytes& expected) {
    if (!image.marginIntact())
        return testing::AssertionFailure() << "bytes beside the data were written";
    if (expected.size() != image.size())
        return testing::AssertionFailure() << "sizes differ: " << image.size() << ", expected " << expected.size();
    for (size_t i = 0; i < expected.size(); ++i)
        if (image.data()[i] != expected[i]) {
            const size_t perPixel = image->channels * image->depth, pixel = i / perPixel;
            return testing::AssertionFailure()
                   << image->width << "x" << image->height << " type " << image->type << ", step " << image->step << ": byte "
                   << i % perPixel << " of pixel (" << pixel % image->step << ", " << pixel / image->step << ") is "
                   << int(image.data()[i]) << ", expected " << int(expected[i]);
        }
    return testing::AssertionSuccess();
}

} // namespace kel_test

#endif
