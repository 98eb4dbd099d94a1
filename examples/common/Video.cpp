// y4m and raw UYVY, on the library's own conversion to grey.
#include "Video.h"

#include <algorithm>
#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <iostream>
#include <sstream>
#include <sys/stat.h>
#include <unistd.h>

namespace kel_examples {

namespace {

constexpr char kMagic[] = "YUV4MPEG2";
constexpr size_t kMagicLength = sizeof kMagic - 1, kStart = 512;
constexpr int kMostPixels = 16384; // either way

// Colour fields of the y4m header that are understood. Where colour lies between pixels is part of their meaning.
const struct {
    const char* name;
    Sampling sampling;
} kSamplings[] = {{"422", {2, 1, 0, 0}},
                  {"420jpeg", {2, 2, 0.5f, 0.5f}},
                  {"420mpeg2", {2, 2, 0, 0.5f}},
                  {"420paldv", {2, 2, 0, 0}},
                  {"420", {2, 2, 0.5f, 0.5f}}};

// Starts of files that hold no raw frames; "?" stands for any byte.
const struct {
    std::string start;
    const char* what;
} kOtherFiles[] = {{"????ftyp", "an MP4 or QuickTime file"},
                   {"????moov", "a QuickTime file"},
                   {"????mdat", "a QuickTime file"},
                   {"????wide", "a QuickTime file"},
                   {"\x1a\x45\xdf\xa3", "a Matroska or WebM file"},
                   {"RIFF????", "an AVI or other RIFF file"},
                   {"OggS", "an Ogg file"},
                   {"FLV\x01", "a Flash video"},
                   {std::string("\0\0\x01\xba", 4), "an MPEG programme stream"},
                   {std::string("\0\0\x01\xb3", 4), "an MPEG video stream"},
                   {std::string("\0\0\0\x01", 4), "an H.264 or H.265 stream"},
                   {"\x30\x26\xb2\x75\x8e\x66\xcf\x11", "an ASF or WMV file"},
                   {"DKIF", "an IVF file"},
                   {"\x89PNG", "a PNG picture"},
                   {"\xff\xd8\xff", "a JPEG picture"},
                   {"GIF8", "a GIF picture"},
                   {"\x1f\x8b\x08", "compressed by gzip"},
                   {"\xfd"
                    "7zXZ",
                    "compressed by xz"},
                   {"BZh", "compressed by bzip2"},
                   {"\x28\xb5\x2f\xfd", "compressed by zstd"},
                   {"PK\x03\x04", "a ZIP archive"},
                   {"\x7f"
                    "ELF",
                    "a program"},
                   {"%PDF", "a PDF file"}};

bool startsWith(const std::vector<unsigned char>& bytes, const std::string& start) {
    if (bytes.size() < start.size())
        return false;
    for (size_t i = 0; i < start.size(); ++i)
        if (start[i] != '?' && static_cast<char>(bytes[i]) != start[i])
            return false;
    return true;
}

std::string text(Size size) {
    return std::to_string(size.width) + "x" + std::to_string(size.height);
}

size_t rawRowBytes(Size size) { // an odd width has half a pair too much
    return static_cast<size_t>(size.width + 1) / 2 * 4;
}

size_t area(Size size) {
    return static_cast<size_t>(size.width) * static_cast<size_t>(size.height);
}

size_t frameBytes(const VideoFormat& format) {
    return format.raw ? rawRowBytes(format.size) * static_cast<size_t>(format.size.height)
                      : area(format.size) + 2 * area(format.colourSize());
}

unsigned char* rowOf(const Image& plane, int y) {
    return plane->data + static_cast<ptrdiff_t>(y) * plane->step;
}

void padRows(const Image& plane) {
    for (int y = 0; y < plane->height; ++y)
        std::memset(rowOf(plane, y) + plane->width, rowOf(plane, y)[plane->width - 1],
                    static_cast<size_t>(plane->step - plane->width));
}

struct HeaderRelease {
    void operator()(kelImage_t* image) const { releaseKelImageHeader(&image); }
};

// Brightness varies more than colour: true where the bytes that should be colour vary much more than the others.
bool looksLikeYuyv(const std::vector<unsigned char>& bytes) {
    long change[2] = {};
    for (size_t i = 0; i + 4 < bytes.size(); ++i)
        change[i % 2] += std::abs(bytes[i + 4] - bytes[i]);
    return change[0] > 4 * change[1] + static_cast<long>(bytes.size());
}

} // namespace

VideoReader::VideoReader(const std::string& path, Size size)
    : m_name(path.empty() || path == "-" ? "standard input" : path), m_file(nullptr, [](std::FILE* file) {
          if (file != stdin)
              std::fclose(file);
      }) {
    if (m_name != path) {
        if (isatty(STDIN_FILENO))
            fail("is a terminal; name a file or a pipe of frames");
        m_file.reset(stdin);
    } else {
        if (std::filesystem::is_directory(path))
            fail("is a folder, not a file of frames");
        m_file.reset(std::fopen(path.c_str(), "rb"));
        if (!m_file)
            fail(std::string("cannot be opened: ") + std::strerror(errno));
    }
    std::vector<unsigned char> start(kStart);
    start.resize(take(start.data(), start.size()));
    m_start = std::move(start);
    if (startsWith(m_start, kMagic)) {
        parseHeader(size);
    } else {
        refuseOtherFiles();
        if (size.width == 0)
            fail("frames that are not y4m need their size: --size WIDTHxHEIGHT");
        m_format.size = size;
        checkLength();
    }
    m_bytes.resize(frameBytes(m_format));
}

void VideoReader::fail(const std::string& what) const {
    throw Error(m_name + ": " + what);
}

size_t VideoReader::take(void* to, size_t bytes) {
    const size_t kept = std::min(bytes, m_start.size());
    std::copy_n(m_start.begin(), kept, static_cast<unsigned char*>(to));
    m_start.erase(m_start.begin(), m_start.begin() + static_cast<ptrdiff_t>(kept));
    const size_t got = kept == bytes ? 0 : std::fread(static_cast<unsigned char*>(to) + kept, 1, bytes - kept, m_file.get());
    if (std::ferror(m_file.get()))
        fail(std::string("cannot be read: ") + std::strerror(errno));
    return kept + got;
}

// A line of a y4m stream without its end; empty at the end of the stream.
std::string VideoReader::takeLine() {
    std::string line;
    char c;
    while (take(&c, 1) == 1) {
        if (c == '\n')
            return line;
        line += c;
        if (line.size() > 4096)
            break;
    }
    if (!line.empty())
        fail("a y4m header has no end");
    return line;
}

void VideoReader::parseHeader(Size size) {
    std::istringstream fields(takeLine().substr(kMagicLength));
    std::string field, colour = "420";
    m_format.raw = false;
    while (fields >> field) {
        const std::string value = field.substr(1);
        const bool isSize = field[0] == 'W' || field[0] == 'H';
        if (isSize)
            (field[0] == 'W' ? m_format.size.width : m_format.size.height) = std::atoi(value.c_str());
        else
            m_format.header += " " + field;
        if (field[0] == 'C')
            colour = value;
        else if (field[0] == 'I' && value != "p" && value != "?")
            fail("interlaced video; make it progressive first");
    }
    const Size found = m_format.size;
    if (found.width < 2 || found.height < 2 || found.width > kMostPixels || found.height > kMostPixels)
        fail("frames of " + text(found) + " pixels; from 2x2 to 16384x16384 are read");
    if (size.width != 0 && (size.width != found.width || size.height != found.height))
        fail("its frames are " + text(found) + ", not " + text(size));
    const auto* const known =
        std::find_if(std::begin(kSamplings), std::end(kSamplings), [&](const auto& s) { return colour == s.name; });
    if (known == std::end(kSamplings))
        fail("y4m with colour " + colour + "; 4:2:2 and 4:2:0 of eight bits are read (C422, C420jpeg, C420mpeg2, C420paldv)");
    m_format.colour = known->sampling;
}

void VideoReader::refuseOtherFiles() const {
    const auto* const other = std::find_if(std::begin(kOtherFiles), std::end(kOtherFiles),
                                           [&](const auto& o) { return startsWith(m_start, o.start); });
    const auto isPacket = [&](size_t at) { return m_start.size() > at && m_start[at] == 0x47; };
    const bool transport = isPacket(0) && isPacket(188) && isPacket(376);
    if (transport || other != std::end(kOtherFiles))
        fail(std::string(transport ? "an MPEG transport stream" : other->what) +
             ", not raw frames; decode it first, for example with: ffmpeg -i FILE -f yuv4mpegpipe -pix_fmt yuv420p -");
}

// Of a regular file: it holds whole frames and nothing else.
void VideoReader::checkLength() const {
    struct stat file;
    const size_t frame = frameBytes(m_format);
    if (fstat(fileno(m_file.get()), &file) != 0 || !S_ISREG(file.st_mode))
        return;
    const auto bytes = static_cast<size_t>(file.st_size - ftello(m_file.get())) + m_start.size();
    if (bytes == 0 || bytes % frame != 0)
        fail(std::to_string(bytes) + " bytes are no whole number of UYVY frames of " + text(m_format.size) + " (" +
             std::to_string(frame) + " bytes)");
}

bool VideoReader::read(Frame& frame) {
    if (!m_format.raw) {
        const std::string line = takeLine();
        if (line.empty() && m_frames > 0)
            return false;
        if (line.compare(0, 5, "FRAME") != 0)
            fail("no frame follows frame " + std::to_string(m_frames));
    }
    const size_t got = take(m_bytes.data(), m_bytes.size());
    if (m_format.raw && got == 0 && m_frames > 0)
        return false;
    ++m_frames;
    if (got != m_bytes.size())
        fail("frame " + std::to_string(m_frames) + " is incomplete (" + std::to_string(got) + " of " +
             std::to_string(m_bytes.size()) + " bytes)");
    const Size size = m_format.size, colour = m_format.colourSize();
    frame.y = Image(size.width, size.height, KEL_PIXEL_TYPE_U8G);
    frame.u = Image(colour.width, colour.height, KEL_PIXEL_TYPE_U8G);
    frame.v = Image(colour.width, colour.height, KEL_PIXEL_TYPE_U8G);
    if (m_format.raw) {
        unpackRaw(frame);
    } else {
        loadKelImageData(frame.y.get(), m_bytes.data(), size.width, size.height, size.width);
        const unsigned char* const u = m_bytes.data() + area(size);
        loadKelImageData(frame.u.get(), u, colour.width, colour.height, colour.width);
        loadKelImageData(frame.v.get(), u + area(colour), colour.width, colour.height, colour.width);
    }
    padRows(frame.y);
    return true;
}

void VideoReader::unpackRaw(Frame& frame) {
    if (m_frames == 1 && looksLikeYuyv(m_bytes))
        std::cerr << m_name << ": the frames look like YUYV, not UYVY; y4m leaves no doubt\n";
    const Size size = m_format.size;
    const size_t rowBytes = rawRowBytes(size);
    const std::unique_ptr<kelImage_t, HeaderRelease> header(
        createKelImageHeader(size.width, size.height, KEL_PIXEL_TYPE_U8YUV));
    const size_t rowOfImage = static_cast<size_t>(header->step) * 2;
    std::vector<unsigned char> padded; // rows of an image are padded to 16 pixels: only frames that are so by themselves fit
    if (rowOfImage != rowBytes) {
        padded.resize(rowOfImage * static_cast<size_t>(size.height));
        for (int y = 0; y < size.height; ++y)
            std::memcpy(&padded[static_cast<size_t>(y) * rowOfImage], &m_bytes[static_cast<size_t>(y) * rowBytes], rowBytes);
    }
    header->data = padded.empty() ? m_bytes.data() : padded.data();
    convertKelImage(frame.y.get(), header.get());
    for (int y = 0; y < size.height; ++y) {
        const unsigned char* from = &m_bytes[static_cast<size_t>(y) * rowBytes];
        unsigned char *const u = rowOf(frame.u, y), *const v = rowOf(frame.v, y);
        for (int pair = 0; pair < frame.u->width; ++pair, from += 4) {
            u[pair] = from[0];
            v[pair] = from[2];
        }
    }
}

VideoWriter::VideoWriter(const std::string& path, const VideoFormat& format) : m_output(path), m_format(format) {
    m_bytes.resize(frameBytes(format));
}

void VideoWriter::write(const Frame& frame) {
    const Size size = m_format.size, colour = m_format.colourSize();
    if (m_format.raw) {
        unsigned char* to = m_bytes.data();
        for (int y = 0; y < size.height; ++y) {
            const unsigned char *const py = rowOf(frame.y, y), *const pu = rowOf(frame.u, y), *const pv = rowOf(frame.v, y);
            for (int pair = 0; pair < colour.width; ++pair, to += 4) {
                to[0] = pu[pair];
                to[1] = py[2 * pair];
                to[2] = pv[pair];
                to[3] = py[std::min(2 * pair + 1, size.width - 1)];
            }
        }
    } else {
        const std::string header =
            "YUV4MPEG2 W" + std::to_string(size.width) + " H" + std::to_string(size.height) + m_format.header + "\n";
        if (!m_begun)
            m_output.write(header.data(), header.size());
        m_output.write("FRAME\n", 6);
        storeKelImageData(m_bytes.data(), size.width, size.height, size.width, frame.y.get());
        unsigned char* const u = m_bytes.data() + area(size);
        storeKelImageData(u, colour.width, colour.height, colour.width, frame.u.get());
        storeKelImageData(u + area(colour), colour.width, colour.height, colour.width, frame.v.get());
    }
    m_begun = true;
    m_output.write(m_bytes.data(), m_bytes.size());
}

} // namespace kel_examples
