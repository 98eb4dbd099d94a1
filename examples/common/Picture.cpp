// Decoding and encoding on libpng and libjpeg; PGM and PPM by hand.
#include "Picture.h"

#include <cerrno>
#include <csetjmp>
#include <cstdio>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <jpeglib.h>
#include <png.h>
#include <unistd.h>
#include <vector>

namespace kel_examples {

namespace {

constexpr unsigned kMostPixels = 16384; // either way

[[noreturn]] void fail(const std::string& name, const std::string& what) {
    throw Error(name + ": " + what);
}

Image createPicture(size_t width, size_t height, const std::string& name) {
    const std::string size = std::to_string(width) + "x" + std::to_string(height);
    if (width < 2 || height < 2)
        fail(name, "a picture of " + size + " pixels is too small");
    if (width > kMostPixels || height > kMostPixels || width * height > (size_t(1) << 27))
        fail(name, "a picture of " + size + " pixels is too large");
    Image image = create(static_cast<int>(width), static_cast<int>(height), KEL_PIXEL_TYPE_U8ZYX);
    if (!image->data)
        fail(name, "not enough memory for a picture of " + size + " pixels");
    return image;
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

// Between setjmp and longjmp no object with a destructor is made: `image` and `tooLarge` live outside.
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

Image decodeJpeg(const uint8_t* bytes, size_t size, const std::string& name) {
    JpegErrors errors;
    Image image;
    std::string refusal;
    if (!decodeJpegInto(bytes, size, name, errors, image, refusal)) {
        if (!refusal.empty())
            throw Error(refusal);
        fail(name, std::string("not a readable JPEG file: ") + errors.text);
    }
    return image;
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

std::vector<uint8_t> readFile(const std::string& path) {
    std::error_code code;
    if (std::filesystem::is_directory(path, code))
        fail(path, "is a folder, not a picture");
    errno = 0;
    std::ifstream file(path, std::ios::binary);
    if (!file)
        fail(path, std::string("cannot be opened: ") + std::strerror(errno ? errno : EIO));
    std::vector<uint8_t> bytes((std::istreambuf_iterator<char>(file)), std::istreambuf_iterator<char>());
    if (file.bad())
        fail(path, "cannot be read");
    return bytes;
}

} // namespace

Image decodePicture(const uint8_t* bytes, size_t size, const std::string& name) {
    const auto startsWith = [&](const char* magic, size_t length) {
        return size > length && !std::memcmp(bytes, magic, length);
    };
    if (startsWith("\x89PNG", 4))
        return decodePng(bytes, size, name);
    if (startsWith("\xff\xd8\xff", 3))
        return decodeJpeg(bytes, size, name);
    if (startsWith("P5", 2) || startsWith("P6", 2))
        return decodePnm(bytes, size, name);
    fail(name, size == 0 ? "the file is empty" : "not a picture: neither PNG, JPEG, nor binary PGM or PPM");
}

Image readPicture(const std::string& path) {
    const std::vector<uint8_t> bytes = readFile(path);
    return decodePicture(bytes.data(), bytes.size(), path);
}

void writePicture(const std::string& path, const Image& image) {
    png_image png{};
    png.version = PNG_IMAGE_VERSION;
    png.width = static_cast<png_uint_32>(image->width);
    png.height = static_cast<png_uint_32>(image->height);
    png.format = image->type == KEL_PIXEL_TYPE_U8G ? PNG_FORMAT_GRAY : PNG_FORMAT_RGB;
    png.flags = PNG_IMAGE_FLAG_FAST;
    const std::string unfinished = path + "." + std::to_string(getpid()) + ".tmp";
    std::FILE* const file = std::fopen(unfinished.c_str(), "wb");
    if (!file)
        fail(path, std::string("cannot be written: ") + std::strerror(errno));
    bool written = png_image_write_to_stdio(&png, file, 0, image->data, image->channels * image->step, nullptr) != 0;
    written = std::fclose(file) == 0 && written;
    if (!written || std::rename(unfinished.c_str(), path.c_str()) != 0) {
        std::remove(unfinished.c_str());
        fail(path, "cannot be written");
    }
}

void makeFolder(const std::string& path) {
    std::error_code code;
    std::filesystem::create_directories(path, code);
    if (!std::filesystem::is_directory(path))
        fail(path, "cannot be made: " + (code ? code.message() : std::string("it is no folder")));
    if (access(path.c_str(), W_OK) != 0)
        fail(path, std::string("cannot be written into: ") + std::strerror(errno));
}

Image greyOf(const Image& picture) {
    Image grey = create(picture->width, picture->height, KEL_PIXEL_TYPE_U8G);
    convertKelImage(grey.get(), picture.get());
    for (int y = 0; y < grey->height; ++y) {
        uint8_t* const row = grey->data + static_cast<ptrdiff_t>(y) * grey->step;
        std::memset(row + grey->width, row[grey->width - 1], static_cast<size_t>(grey->step - grey->width));
    }
    return grey;
}

} // namespace kel_examples
