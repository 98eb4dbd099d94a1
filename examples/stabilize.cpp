// Steadies a video of raw UYVY frames: aligns every frame to a slowly moving reference.
#include <algorithm>
#include <chrono>
#include <cmath>
#include <csignal>
#include <cstdio>
#include <cstring>
#include <filesystem>
#include <iostream>
#include <unistd.h>
#include <vector>

#include "common/Program.h"
#include "common/Registration.h"

using namespace kel_examples;

namespace {

constexpr int kMostFeatures = 300;
constexpr float kThreshold = 2;    // pixels of the halved picture that features are taken from
constexpr float kFollow = 0.06f;   // share of the way back to the frame as it is, per frame
constexpr float kFarthest = 0.15f; // of the picture's width that a correction may move a corner

struct Options {
    std::string size, input, output;
};

Size parseSize(const std::string& text) {
    Size size{};
    char end;
    if (std::sscanf(text.c_str(), "%dx%d%c", &size.width, &size.height, &end) != 2 || size.width < 2 || size.height < 2 ||
        size.width > 16384 || size.height > 16384)
        throw Error("--size " + text + ": not a size such as 1280x720, from 2x2 to 16384x16384");
    return size;
}

struct HeaderRelease {
    void operator()(kelImage_t* image) const { releaseKelImageHeader(&image); }
};

// One frame as it comes: rows of pairs U, Y0, V, Y1 without gaps; an odd width has half a pair too much.
class Frame {
public:
    explicit Frame(Size size)
        : m_size(size), m_rowBytes(static_cast<size_t>(size.width + 1) / 2 * 4),
          m_bytes(m_rowBytes * static_cast<size_t>(size.height)),
          m_header(createKelImageHeader(size.width, size.height, KEL_PIXEL_TYPE_U8YUV)) {
        const size_t rowOfImage = static_cast<size_t>(m_header->step) * 2;
        if (rowOfImage != m_rowBytes) // rows of an image are padded to 16 pixels: only frames that are so by themselves fit
            m_padded.resize(rowOfImage * static_cast<size_t>(size.height));
        m_header->data = m_padded.empty() ? m_bytes.data() : m_padded.data();
    }

    std::vector<unsigned char>& bytes() { return m_bytes; }

    // The frame as an image, its pixels where they were read unless the rows had to be padded.
    const kelImage_t* image() {
        const size_t rowOfImage = static_cast<size_t>(m_header->step) * 2;
        for (int y = 0; y < m_size.height && !m_padded.empty(); ++y)
            std::memcpy(&m_padded[static_cast<size_t>(y) * rowOfImage], row(y), m_rowBytes);
        return m_header.get();
    }

    unsigned char* row(int y) { return &m_bytes[static_cast<size_t>(y) * m_rowBytes]; }

private:
    Size m_size;
    size_t m_rowBytes;
    std::vector<unsigned char> m_bytes, m_padded;
    std::unique_ptr<kelImage_t, HeaderRelease> m_header;
};

// Grey values of a frame, padding filled.
Image lumaOf(Frame& frame, Size size) {
    Image luma = create(size.width, size.height, KEL_PIXEL_TYPE_U8G);
    convertKelImage(luma.get(), frame.image());
    for (int y = 0; y < size.height; ++y) {
        unsigned char* const row = luma->data + static_cast<ptrdiff_t>(y) * luma->step;
        std::memset(row + size.width, row[size.width - 1], static_cast<size_t>(luma->step - size.width));
    }
    return luma;
}

// Chroma of a frame, one value a pair, with 0 as neutral, so that what a warp leaves empty has no colour.
constexpr unsigned char kNeutral = 0x80;

Image chromaOf(Frame& frame, Size size, int offset) {
    Image chroma = create((size.width + 1) / 2, size.height, KEL_PIXEL_TYPE_U8G);
    for (int y = 0; y < size.height; ++y) {
        const unsigned char* from = frame.row(y) + offset;
        unsigned char* const to = chroma->data + static_cast<ptrdiff_t>(y) * chroma->step;
        for (int x = 0; x < chroma->width; ++x)
            to[x] = from[4 * x] ^ kNeutral;
    }
    return chroma;
}

// H for a picture whose columns are `factor` of the full ones, pixel centres on pixel centres of the first of each pair.
kelMat withColumnsScaled(const kelMat& H, float factor) {
    kelMat down(3, 3, true), up(3, 3, true);
    down.setDataIdentity(1);
    up.setDataIdentity(1);
    down[0][0] = factor;
    up[0][0] = 1 / factor;
    return down * H * up;
}

void warpFrame(Frame& frame, const Image& luma, Size size, const kelMat& H) {
    const kelMat half = withColumnsScaled(H, 0.5f);
    const Size halfSize = {(size.width + 1) / 2, size.height};
    const Image y = warpPicture(luma, H, size), u = warpPicture(chromaOf(frame, size, 0), half, halfSize),
                v = warpPicture(chromaOf(frame, size, 2), half, halfSize);
    for (int row = 0; row < size.height; ++row) {
        unsigned char* to = frame.row(row);
        const unsigned char *const py = y->data + static_cast<ptrdiff_t>(row) * y->step,
                                   *const pu = u->data + static_cast<ptrdiff_t>(row) * u->step,
                                   *const pv = v->data + static_cast<ptrdiff_t>(row) * v->step;
        for (int pair = 0; pair < halfSize.width; ++pair, to += 4) {
            to[0] = pu[pair] ^ kNeutral;
            to[1] = py[2 * pair];
            to[2] = pv[pair] ^ kNeutral;
            if (2 * pair + 1 < size.width)
                to[3] = py[2 * pair + 1];
        }
    }
}

// Follows the camera: correction() takes the newest frame to where a slowly moving reference would show it.
class Stabilizer {
public:
    explicit Stabilizer(Size size) : m_size(size), m_correction(3, 3, true) { m_correction.setDataIdentity(1); }

    const kelMat& correction() const { return m_correction; }

    void add(const Image& luma) {
        const Image half = create(m_size.width / 2, m_size.height / 2, KEL_PIXEL_TYPE_U8G);
        if (half->width < 2 || half->height < 2)
            return;
        clearKelImage(half.get()); // its padding counts for the contrast
        resizeKelImageHalf(half.get(), luma.get());
        std::vector<Feature> features = findFeatures(half, kMostFeatures);
        const Size halfSize = {half->width, half->height};
        const std::vector<Match> matches = matchFeatures(features, m_before);
        const Registration motion = fitHomography(features, m_before, matches, halfSize, halfSize, kThreshold);
        m_before = std::move(features);
        if (motion.H.m_IsCreated)
            follow(m_correction * fullSize(motion.H));
        else
            m_correction.setDataIdentity(1); // a cut: start anew
    }

private:
    // Pixel p of the halved picture is pixel 2p of the full one.
    static kelMat fullSize(const kelMat& H) {
        kelMat up(3, 3, true), down(3, 3, true);
        up.setDataIdentity(2);
        down.setDataIdentity(0.5f);
        up[2][2] = down[2][2] = 1;
        return up * H * down;
    }

    // Goes part of the way back to the frame as it is, farther where the picture would move too far.
    void follow(kelMat H) {
        H.setDataUnitize();
        float farthest = 0;
        for (const float x : {0.0f, static_cast<float>(m_size.width)})
            for (const float y : {0.0f, static_cast<float>(m_size.height)}) {
                float u, v;
                H.cvtPoint(x, y, &u, &v);
                farthest = std::max(farthest, std::hypot(u - x, v - y));
            }
        const float limit = kFarthest * static_cast<float>(m_size.width);
        if (!std::isfinite(farthest)) {
            m_correction.setDataIdentity(1);
            return;
        }
        const float follow = farthest > limit ? 1 - limit / farthest * (1 - kFollow) : kFollow;
        kelMat identity(3, 3, true);
        identity.setDataIdentity(1);
        m_correction = H * (1 - follow) + identity * follow;
    }

    Size m_size;
    kelMat m_correction;
    std::vector<Feature> m_before;
};

// Standard output, or a file that appears under its name when it is whole.
class Output {
public:
    explicit Output(const std::string& path) : m_path(path), m_file(stdout) {
        if (path.empty())
            return;
        if (std::filesystem::is_directory(path))
            throw Error(path + ": is a folder");
        m_unfinished = path + "." + std::to_string(getpid()) + ".tmp";
        m_file = std::fopen(m_unfinished.c_str(), "wb");
        if (!m_file)
            throw Error(path + ": cannot be written: " + std::strerror(errno));
    }
    ~Output() {
        if (!m_unfinished.empty()) {
            if (m_file)
                std::fclose(m_file);
            std::remove(m_unfinished.c_str());
        }
    }
    Output(const Output&) = delete;
    Output& operator=(const Output&) = delete;

    void write(const std::vector<unsigned char>& bytes) {
        if (std::fwrite(bytes.data(), 1, bytes.size(), m_file) != bytes.size())
            fail();
    }
    void finish() {
        if (std::fflush(m_file) != 0)
            fail();
        if (m_unfinished.empty())
            return;
        std::FILE* const file = m_file;
        m_file = nullptr;
        if (std::fclose(file) != 0 || std::rename(m_unfinished.c_str(), m_path.c_str()) != 0)
            fail();
        m_unfinished.clear();
    }

private:
    [[noreturn]] void fail() const {
        throw Error((m_path.empty() ? std::string("standard output") : m_path) +
                    ": cannot be written: " + std::strerror(errno));
    }
    std::string m_path, m_unfinished;
    std::FILE* m_file;
};

struct Close {
    void operator()(std::FILE* file) const {
        if (file != stdin)
            std::fclose(file);
    }
};

std::unique_ptr<std::FILE, Close> openInput(const std::string& path) {
    if (path.empty() || path == "-")
        return std::unique_ptr<std::FILE, Close>(stdin);
    if (std::filesystem::is_directory(path))
        throw Error(path + ": is a folder, not a file of frames");
    std::FILE* const file = std::fopen(path.c_str(), "rb");
    if (!file)
        throw Error(path + ": cannot be opened: " + std::strerror(errno));
    return std::unique_ptr<std::FILE, Close>(file);
}

int stabilize(const Options& options) {
    const Size size = parseSize(options.size);
    const auto input = openInput(options.input);
    const std::string name = options.input.empty() ? "standard input" : options.input;
    Output output(options.output);
    Frame frame(size);
    Stabilizer stabilizer(size);
    std::srand(1);
    double seconds = 0;
    long frames = 0;
    size_t got;
    while ((got = std::fread(frame.bytes().data(), 1, frame.bytes().size(), input.get())) == frame.bytes().size()) {
        const auto begin = std::chrono::steady_clock::now();
        const Image luma = lumaOf(frame, size);
        stabilizer.add(luma);
        warpFrame(frame, luma, size, stabilizer.correction());
        seconds += std::chrono::duration<double>(std::chrono::steady_clock::now() - begin).count();
        output.write(frame.bytes());
        if (++frames % 30 == 0)
            std::cerr << "frame " << frames << ", " << static_cast<int>(static_cast<double>(frames) / seconds)
                      << " frames a second\n";
    }
    if (std::ferror(input.get()))
        throw Error(name + ": cannot be read");
    if (frames == 0)
        throw Error(name + ": holds no whole frame of " + options.size + " (" + std::to_string(frame.bytes().size()) +
                    " bytes)");
    output.finish();
    if (got > 0)
        std::cerr << "stabilize: " << name << ": the last frame is incomplete (" << got << " of " << frame.bytes().size()
                  << " bytes) and left out\n";
    std::cerr << frames << " frames, " << static_cast<int>(static_cast<double>(frames) / seconds) << " frames a second\n";
    return 0;
}

} // namespace

int main(int argc, char** argv) {
    std::signal(SIGPIPE, SIG_IGN); // a reader that goes away is an error of writing
    Options options;
    CLI::App app("Steadies raw UYVY frames, for example from: ffmpeg -i clip.mp4 -f rawvideo -pix_fmt uyvy422 -\n"
                 "Writes frames of the same format; progress goes to standard error.",
                 "stabilize");
    app.add_option("input", options.input, "file of frames; standard input without");
    app.add_option("--size", options.size, "of a frame, WIDTHxHEIGHT")->required();
    app.add_option("--output", options.output, "file for the frames; standard output without");
    return runProgram(app, argc, argv, [&] { return stabilize(options); });
}
