// Decoding and encoding on libpng, libjpeg and libexif; PGM and PPM by hand.
#include "Picture.h"

#include <algorithm>
#include <cctype>
#include <cerrno>
#include <csetjmp>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <jpeglib.h>
#include <libexif/exif-data.h>
#include <new>
#include <png.h>
#include <utility>
#include <vector>
#include <zlib.h>

namespace kel_examples {

namespace {

constexpr size_t kMostPixels = 16384, kMostInAll = size_t(1) << 27; // either way; in all

[[noreturn]] void fail(const std::string& name, const std::string& what) {
    throw Error(name + ": " + what);
}

Image createPicture(size_t width, size_t height, const std::string& name) {
    const std::string size = std::to_string(width) + "x" + std::to_string(height);
    if (width < 2 || height < 2)
        fail(name, "a picture of " + size + " pixels is too small");
    if (width > kMostPixels || height > kMostPixels || width * height > kMostInAll)
        fail(name, "a picture of " + size + " pixels is too large; at most " + std::to_string(kMostPixels) +
                       " either way and " + std::to_string(kMostInAll) + " in all");
    try {
        return Image(static_cast<int>(width), static_cast<int>(height), KEL_PIXEL_TYPE_U8ZYX);
    } catch (const std::bad_alloc&) {
        fail(name, "not enough memory for a picture of " + size + " pixels");
    }
}

Image decodePng(const uint8_t* bytes, size_t size, const std::string& name) {
    struct Decoder {
        png_image png{};
        ~Decoder() { png_image_free(&png); }
    } decoder;
    png_image& png = decoder.png;
    png.version = PNG_IMAGE_VERSION;
    if (!png_image_begin_read_from_memory(&png, bytes, size))
        fail(name, std::string("not a readable PNG file: ") + png.message);
    Image image = createPicture(png.width, png.height, name);
    png.format = PNG_FORMAT_RGB;
    const png_color background = {255, 255, 255}; // shows through where the picture is transparent
    if (!png_image_finish_read(&png, &background, image->data, 3 * image->step, nullptr))
        fail(name, std::string("not a readable PNG file: ") + png.message);
    return image;
}

// libjpeg reports through callbacks; a warning (truncated or corrupt data) counts as an error here.
struct JpegErrors : jpeg_error_mgr {
    std::jmp_buf leave;
    char text[JMSG_LENGTH_MAX];
};

[[noreturn]] void leaveJpeg(j_common_ptr info) {
    JpegErrors* const errors = static_cast<JpegErrors*>(info->err);
    errors->format_message(info, errors->text);
    std::longjmp(errors->leave, 1);
}

// Between setjmp and longjmp no object with a destructor is made: `image` and `refusal` live outside.
bool decodeJpegInto(const uint8_t* bytes, size_t size, const std::string& name, JpegErrors& errors, Image& image,
                    std::string& refusal) {
    jpeg_decompress_struct jpeg;
    jpeg.err = jpeg_std_error(&errors);
    errors.error_exit = leaveJpeg;
    errors.emit_message = [](j_common_ptr info, int level) {
        if (level < 0)
            leaveJpeg(info);
    };
    if (setjmp(errors.leave)) {
        jpeg_destroy_decompress(&jpeg);
        return false;
    }
    jpeg_create_decompress(&jpeg);
    jpeg_mem_src(&jpeg, bytes, size);
    jpeg_read_header(&jpeg, TRUE);
    if (jpeg.jpeg_color_space == JCS_CMYK || jpeg.jpeg_color_space == JCS_YCCK) {
        refusal = name + ": a JPEG file in the four printing colours (CMYK); save it as RGB first";
        jpeg_destroy_decompress(&jpeg);
        return false;
    }
    jpeg.out_color_space = JCS_RGB;
    try {
        image = createPicture(jpeg.image_width, jpeg.image_height, name);
    } catch (const Error& error) {
        refusal = error.what();
        jpeg_destroy_decompress(&jpeg);
        return false;
    }
    jpeg_start_decompress(&jpeg);
    while (jpeg.output_scanline < jpeg.output_height) {
        JSAMPROW row = image->data + size_t(3) * image->step * jpeg.output_scanline;
        jpeg_read_scanlines(&jpeg, &row, 1);
    }
    jpeg_finish_decompress(&jpeg);
    jpeg_destroy_decompress(&jpeg);
    return true;
}

// How the camera was held, 1 .. 8 as EXIF counts; 1, upright, where the file does not say.
int orientationOf(const uint8_t* bytes, size_t size) {
    const std::unique_ptr<ExifData, void (*)(ExifData*)> exif(exif_data_new_from_data(bytes, static_cast<unsigned>(size)),
                                                              exif_data_unref);
    const ExifEntry* const entry = exif ? exif_content_get_entry(exif->ifd[EXIF_IFD_0], EXIF_TAG_ORIENTATION) : nullptr;
    if (!entry || entry->format != EXIF_FORMAT_SHORT || entry->components < 1)
        return 1;
    const int orientation = exif_get_short(entry->data, exif_data_get_byte_order(exif.get()));
    return orientation >= 1 && orientation <= 8 ? orientation : 1;
}

Image transposed(const Image& image) {
    Image result(image->height, image->width, image->type);
    for (int y = 0; y < result->height; ++y)
        for (int x = 0; x < result->width; ++x)
            std::copy_n(image.row(x) + 3 * y, 3, result.row(y) + 3 * x);
    return result;
}

// From 5 on rows and columns have changed places; within each four the picture is as it is, mirrored, turned by half, upside
// down.
Image upright(Image image, int orientation) {
    if (orientation > 4)
        image = transposed(image);
    const int flip = (orientation - 1) % 4;
    if (flip == 0)
        return image;
    Image result(image->width, image->height, image->type);
    (flip == 1 ? rotateKelImageH : flip == 2 ? rotateKelImageVH : rotateKelImageV)(result.get(), image.get());
    return result;
}

Image decodeJpeg(const uint8_t* bytes, size_t size, const std::string& name) {
    JpegErrors errors;
    Image image;
    std::string refusal;
    if (!decodeJpegInto(bytes, size, name, errors, image, refusal)) {
        if (!refusal.empty())
            throw Error(refusal);
        fail(name, std::string("not a readable JPEG file: ") + errors.text);
    }
    return upright(std::move(image), orientationOf(bytes, size));
}

// A number of a PGM or PPM header, after blanks and comments.
size_t headerNumber(const uint8_t*& p, const uint8_t* end, const std::string& name) {
    while (p < end && (std::isspace(*p) || *p == '#'))
        if (*p++ == '#')
            while (p < end && *p != '\n')
                ++p;
    size_t number = 0;
    const uint8_t* const begin = p;
    for (; p < end && std::isdigit(*p) && number < 1000000; ++p)
        number = 10 * number + static_cast<size_t>(*p - '0');
    if (p == begin || p == end || std::isdigit(*p))
        fail(name, "not a readable PGM or PPM file: bad header");
    return number;
}

Image decodePnm(const uint8_t* bytes, size_t size, const std::string& name) {
    const size_t channels = bytes[1] == '6' ? 3 : 1;
    const uint8_t *p = bytes + 2, *const end = bytes + size;
    const size_t width = headerNumber(p, end, name), height = headerNumber(p, end, name), most = headerNumber(p, end, name);
    if (most < 1 || most > 255)
        fail(name, "PGM and PPM files with more than 8 bits a channel are not supported");
    ++p; // one blank behind the header
    Image image = createPicture(width, height, name);
    if (static_cast<size_t>(end - p) < width * height * channels)
        fail(name, "not a readable PGM or PPM file: it ends early");
    for (size_t y = 0; y < height; ++y) {
        uint8_t* to = image->data + 3 * y * static_cast<size_t>(image->step);
        for (size_t x = 0; x < width; ++x, p += channels)
            for (size_t c = 0; c < 3; ++c)
                *to++ = static_cast<uint8_t>(std::min<size_t>(p[channels == 3 ? c : 0], most) * 255 / most);
    }
    return image;
}

enum class Format { unknown, png, jpeg, pnm };

Format formatOf(const uint8_t* bytes, size_t size) {
    const auto startsWith = [&](const char* magic, size_t length) {
        return size > length && !std::memcmp(bytes, magic, length);
    };
    if (startsWith("\x89PNG", 4))
        return Format::png;
    if (startsWith("\xff\xd8\xff", 3))
        return Format::jpeg;
    return startsWith("P5", 2) || startsWith("P6", 2) ? Format::pnm : Format::unknown;
}

[[noreturn]] void failAsUnknown(const std::string& name, size_t size) {
    fail(name, size == 0 ? "the file is empty" : "not a picture: neither PNG, JPEG, nor binary PGM or PPM");
}

// The whole file, read only where it starts as a picture does, and never more than a picture can have.
std::vector<uint8_t> readFile(const std::string& path) {
    constexpr size_t kSignature = 8, kPiece = size_t(1) << 20, kMostBytes = size_t(1) << 30;
    std::error_code code;
    if (std::filesystem::is_directory(path, code))
        fail(path, "is a folder, not a picture");
    const std::unique_ptr<std::FILE, int (*)(std::FILE*)> file(std::fopen(path.c_str(), "rb"), std::fclose);
    if (!file)
        fail(path, std::string("cannot be opened: ") + std::strerror(errno));
    std::vector<uint8_t> bytes;
    size_t wanted = kSignature, got = 0;
    do {
        const size_t before = bytes.size();
        bytes.resize(before + wanted);
        got = std::fread(&bytes[before], 1, wanted, file.get());
        bytes.resize(before + got);
        if (std::ferror(file.get()))
            fail(path, std::string("cannot be read: ") + std::strerror(errno));
        if (formatOf(bytes.data(), bytes.size()) == Format::unknown)
            failAsUnknown(path, bytes.size());
        if (bytes.size() > kMostBytes || (before == 0 && std::filesystem::is_regular_file(path, code) &&
                                          std::filesystem::file_size(path, code) > kMostBytes))
            fail(path, "is larger than a picture may be, " + std::to_string(kMostBytes) + " bytes");
    } while (got == std::exchange(wanted, kPiece));
    return bytes;
}

} // namespace

Image decodePicture(const uint8_t* bytes, size_t size, const std::string& name) {
    switch (formatOf(bytes, size)) {
    case Format::png:
        return decodePng(bytes, size, name);
    case Format::jpeg:
        return decodeJpeg(bytes, size, name);
    case Format::pnm:
        return decodePnm(bytes, size, name);
    default:
        failAsUnknown(name, size);
    }
}

Image readPicture(const std::string& path) {
    try {
        const std::vector<uint8_t> bytes = readFile(path);
        return decodePicture(bytes.data(), bytes.size(), path);
    } catch (const std::bad_alloc&) {
        fail(path, "not enough memory to read it");
    }
}

std::vector<uint8_t> encodeJpeg(const Image& image) {
    constexpr int kQuality = 85;
    JpegErrors errors;
    jpeg_compress_struct jpeg;
    unsigned char* buffer = nullptr;
    unsigned long size = 0;
    jpeg.err = jpeg_std_error(&errors);
    errors.error_exit = leaveJpeg;
    if (setjmp(errors.leave)) {
        jpeg_destroy_compress(&jpeg);
        std::free(buffer);
        throw Error(std::string("a picture cannot be encoded: ") + errors.text);
    }
    jpeg_create_compress(&jpeg);
    jpeg_mem_dest(&jpeg, &buffer, &size);
    jpeg.image_width = static_cast<JDIMENSION>(image->width);
    jpeg.image_height = static_cast<JDIMENSION>(image->height);
    jpeg.input_components = 3;
    jpeg.in_color_space = JCS_RGB;
    jpeg_set_defaults(&jpeg);
    jpeg_set_quality(&jpeg, kQuality, TRUE);
    jpeg_start_compress(&jpeg, TRUE);
    while (jpeg.next_scanline < jpeg.image_height) {
        JSAMPROW row = image->data + size_t(3) * image->step * jpeg.next_scanline;
        jpeg_write_scanlines(&jpeg, &row, 1);
    }
    jpeg_finish_compress(&jpeg);
    jpeg_destroy_compress(&jpeg);
    std::vector<uint8_t> bytes(buffer, buffer + size);
    std::free(buffer);
    return bytes;
}

namespace {

// libpng's own fast settings search for repeats, which photographs do not have: differences from the row above and runs of them
// cost a third of the time. Between setjmp and longjmp no object with a destructor is made: `bytes` lives outside.
bool encodePngInto(std::vector<uint8_t>& bytes, const Image& image) {
    png_structp png = png_create_write_struct(PNG_LIBPNG_VER_STRING, nullptr, nullptr, nullptr);
    png_infop info = png ? png_create_info_struct(png) : nullptr;
    if (!info || setjmp(png_jmpbuf(png))) {
        png_destroy_write_struct(&png, &info);
        return false;
    }
    png_set_write_fn(
        png, &bytes,
        [](png_structp p, png_bytep data, size_t length) {
            std::vector<uint8_t>* const to = static_cast<std::vector<uint8_t>*>(png_get_io_ptr(p));
            to->insert(to->end(), data, data + length);
        },
        nullptr);
    png_set_IHDR(png, info, static_cast<png_uint_32>(image->width), static_cast<png_uint_32>(image->height), 8,
                 image->type == KEL_PIXEL_TYPE_U8G ? PNG_COLOR_TYPE_GRAY : PNG_COLOR_TYPE_RGB, PNG_INTERLACE_NONE,
                 PNG_COMPRESSION_TYPE_DEFAULT, PNG_FILTER_TYPE_DEFAULT);
    png_set_filter(png, PNG_FILTER_TYPE_BASE, PNG_FILTER_UP);
    png_set_compression_level(png, 1);
    png_set_compression_strategy(png, Z_RLE);
    png_set_compression_buffer_size(png, size_t(1) << 20);
    png_write_info(png, info);
    for (int y = 0; y < image->height; ++y)
        png_write_row(png, image.row(y));
    png_write_end(png, info);
    png_destroy_write_struct(&png, &info);
    return true;
}

} // namespace

void writePicture(const std::string& path, const Image& image) {
    std::vector<uint8_t> bytes;
    bytes.reserve(static_cast<size_t>(image->size));
    if (!encodePngInto(bytes, image))
        fail(path, "cannot be encoded");
    Output file(path);
    file.write(bytes.data(), bytes.size());
    file.finish();
}

Image greyOf(const Image& picture) {
    Image grey(picture->width, picture->height, KEL_PIXEL_TYPE_U8G);
    convertKelImage(grey.get(), picture.get());
    for (int y = 0; y < grey->height; ++y) {
        uint8_t* const row = grey->data + static_cast<ptrdiff_t>(y) * grey->step;
        std::memset(row + grey->width, row[grey->width - 1], static_cast<size_t>(grey->step - grey->width));
    }
    return grey;
}

} // namespace kel_examples
