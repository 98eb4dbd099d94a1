/**
 * @file kelImage.hpp
 * An owning, movable image for C++11 over the record and the functions of kelImage.h; a header alone.
 *
 * It is handed to every function of kelImage.h through get(), and its fields are read through `->`:
 * @code
 * kel::Image grey(width, height, KEL_PIXEL_TYPE_U8G), smooth(width, height, KEL_PIXEL_TYPE_U8G);
 * kel::Image scratch(width, height, KEL_PIXEL_TYPE_S16G);
 * grey.load(frame, frameBytesPerLine);
 * applyKelFilterGaussian5X5(smooth.get(), grey.get(), scratch.get());
 * smooth.store(out, outBytesPerLine);
 * @endcode
 */
#ifndef KEL_IMAGE_HPP
#define KEL_IMAGE_HPP

#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <new>
#include <stdexcept>
#include <utility>

#include "kelImage.h"

namespace kel {

/**
 * One image, or none. Moving hands it over and leaves none behind; copying is asked for by clone(). Exceptions leave everything as it was.
 */
class Image {
public:
    /** No image: get() is null. */
    Image() noexcept : m_image(nullptr) {}

    /**
     * An image of that width, height and pixel type; pixels and padding are indeterminate.
     * @throws std::invalid_argument for a width or height below 1, an unknown type, or a size beyond the record's 32 bits
     * @throws std::bad_alloc where there is no memory
     */
    Image(kelValue_s32 width, kelValue_s32 height, kelValue_s32 type) : m_image(nullptr) {
        if (width < 1 || height < 1 || width > INT32_MAX - 15 || type < KEL_PIXEL_TYPE_U8G || type > KEL_PIXEL_TYPE_F64YUV)
            throw std::invalid_argument("kel::Image: no such size or pixel type");
        kelImage_t* header = createKelImageHeader(width, height, type);
        const std::int64_t perPixel = header->channels * header->depth;
        const bool fits = perPixel * header->step <= INT32_MAX / height;
        releaseKelImageHeader(&header);
        if (!fits)
            throw std::invalid_argument("kel::Image: larger than 2^31 - 1 bytes");
        Image made(createKelImage(width, height, type));
        if (!made.m_image->data)
            throw std::bad_alloc();
        swap(made);
    }

    /** Takes over what createKelImage() or cloneKelImage() made, or null. Not for header-only images, whose pixels are another's. */
    explicit Image(kelImage_t* image) noexcept : m_image(image) {}

    /** Takes the other's image and leaves it none. */
    Image(Image&& other) noexcept : m_image(other.release()) {}
    /** Releases its own image and takes the other's. */
    Image& operator=(Image&& other) noexcept {
        Image taken(std::move(other));
        swap(taken);
        return *this;
    }
    Image(const Image&) = delete;            ///< See clone().
    Image& operator=(const Image&) = delete; ///< See clone().
    /** Releases the image. */
    ~Image() { releaseKelImage(&m_image); }

    /** Exchanges two images. */
    void swap(Image& other) noexcept { std::swap(m_image, other.m_image); }

    /** The record, for the functions of kelImage.h; it stays this object's. */
    kelImage_t* get() noexcept { return m_image; }
    /** The same of a constant image. */
    const kelImage_t* get() const noexcept { return m_image; }
    /** Its fields. */
    kelImage_t* operator->() noexcept { return m_image; }
    /** The same of a constant image. */
    const kelImage_t* operator->() const noexcept { return m_image; }

    /** Whether there is an image. */
    explicit operator bool() const noexcept { return m_image != nullptr; }

    /** Gives the record away, to be released by releaseKelImage(). */
    kelImage_t* release() noexcept {
        kelImage_t* const image = m_image;
        m_image = nullptr;
        return image;
    }

    /** First byte of row y. */
    unsigned char* row(kelValue_s32 y) noexcept { return m_image->data + offset(y); }
    /** The same of a constant image. */
    const unsigned char* row(kelValue_s32 y) const noexcept { return m_image->data + offset(y); }

    /** Bytes of a pixel. */
    std::size_t pixelBytes() const noexcept {
        return static_cast<std::size_t>(m_image->channels) * static_cast<std::size_t>(m_image->depth);
    }

    /** Bytes of a row's pixels, padding left out. Rows of YUV are whole pairs: an odd width has half a pair too much. */
    std::size_t rowBytes() const noexcept {
        const bool pairs = m_image->type >= KEL_PIXEL_TYPE_U8YUV;
        return (static_cast<std::size_t>(m_image->width) + (pairs ? m_image->width % 2 : 0)) * pixelBytes();
    }

    /** The same image once more, padding included. */
    Image clone() const {
        if (!m_image)
            return Image();
        Image copy(m_image->width, m_image->height, m_image->type);
        copyKelImage(copy.m_image, m_image);
        return copy;
    }

    /**
     * Copies the pixels of the whole image, of any type, from rows that are `pitch` bytes apart (below 0: from bottom to top, `src` being
     * the top row). Padding is left alone.
     * @throws std::invalid_argument where rows would overlap
     */
    void load(const void* src, std::ptrdiff_t pitch) {
        checkPitch(pitch);
        for (kelValue_s32 y = 0; y < m_image->height; ++y)
            std::memcpy(row(y), static_cast<const unsigned char*>(src) + y * pitch, rowBytes());
    }

    /** The mirror of load(). */
    void store(void* dst, std::ptrdiff_t pitch) const {
        checkPitch(pitch);
        for (kelValue_s32 y = 0; y < m_image->height; ++y)
            std::memcpy(static_cast<unsigned char*>(dst) + y * pitch, row(y), rowBytes());
    }

    /**
     * A new image with a copy of the rectangle from pixel (x, y); its padding is indeterminate. A rectangle of a YUV image starts at
     * an even x, where a pair does.
     * @throws std::out_of_range where the rectangle is not inside the image
     */
    Image crop(kelValue_s32 x, kelValue_s32 y, kelValue_s32 width, kelValue_s32 height) const {
        const bool pairs = m_image->type >= KEL_PIXEL_TYPE_U8YUV;
        if (x < 0 || y < 0 || width < 1 || height < 1 || x > m_image->width - width || y > m_image->height - height ||
            (pairs && x % 2))
            throw std::out_of_range("kel::Image: the rectangle is not inside the image");
        Image part(width, height, m_image->type);
        part.load(row(y) + static_cast<std::size_t>(x) * pixelBytes(),
                  static_cast<std::ptrdiff_t>(static_cast<std::size_t>(m_image->step) * pixelBytes()));
        return part;
    }

private:
    std::ptrdiff_t offset(kelValue_s32 y) const noexcept {
        return static_cast<std::ptrdiff_t>(y) * m_image->step * static_cast<std::ptrdiff_t>(pixelBytes());
    }
    void checkPitch(std::ptrdiff_t pitch) const {
        if (m_image->height > 1 && static_cast<std::size_t>(pitch < 0 ? -pitch : pitch) < rowBytes())
            throw std::invalid_argument("kel::Image: the pitch, in bytes, is smaller than a row");
    }

    kelImage_t* m_image;
};

} // namespace kel

#endif
