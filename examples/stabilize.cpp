// Steadies a video of y4m or raw UYVY frames: aligns every frame to a slowly moving reference.
#include <algorithm>
#include <chrono>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <iostream>
#include <memory>
#include <utility>
#include <vector>

#include <kel/kelRegister.h>

#include "common/Program.h"
#include "common/Video.h"
#include "common/Warp.h"

using namespace kel_examples;

namespace {

constexpr int kMostFeatures = 280;
constexpr float kThreshold = 2;    // pixels of the halved picture that features are taken from
constexpr float kFollow = 0.06f;   // share of the way back to the frame as it is, per frame
constexpr float kFarthest = 0.15f; // of the picture's width that a correction may move a corner where nothing is cut off

struct Options {
    std::string size, input, output;
    float crop = 0;
};

Size parseSize(const std::string& text) {
    Size size{};
    char end;
    if (std::sscanf(text.c_str(), "%dx%d%c", &size.width, &size.height, &end) != 2 || size.width < 2 || size.height < 2 ||
        size.width > 16384 || size.height > 16384)
        throw Error("--size " + text + ": not a size such as 1280x720, from 2x2 to 16384x16384");
    return size;
}

// H for a plane that is sampled like that: pixel c of it lies at factor * c + offset of the picture.
kelMat onPlane(const kelMat& H, const Sampling& sampling) {
    kelMat up(3, 3, true);
    up.setDataIdentity(1);
    up[0][0] = static_cast<float>(sampling.factorX);
    up[1][1] = static_cast<float>(sampling.factorY);
    up[0][2] = sampling.offsetX;
    up[1][2] = sampling.offsetY;
    return up.getInversedMatrix() * H * up;
}

// Colour is warped with 0 as neutral, so that what a warp leaves empty has none.
void flipNeutral(const Image& plane) {
    for (int i = 0; i < plane->size; ++i)
        plane->data[i] ^= 0x80;
}

Frame warpFrame(const Frame& frame, const VideoFormat& format, const kelMat& H) {
    const Size size = format.size, colourSize = format.colourSize();
    const kelMat onColour = onPlane(H, format.colour);
    Frame warped{warpPicture(frame.y, H, size), Image(), Image()};
    for (const auto plane : {&Frame::u, &Frame::v}) {
        flipNeutral(frame.*plane);
        warped.*plane = warpPicture(frame.*plane, onColour, colourSize);
        flipNeutral(warped.*plane);
    }
    return warped;
}

// The part that a margin on every side leaves, in whole pairs of pixels.
struct Margin {
    int x, y;
};

Margin marginOf(Size size, float share) {
    const auto even = [share](int length) { return static_cast<int>(share * static_cast<float>(length) / 2) * 2; };
    return {even(size.width), even(size.height)};
}

Image cutPlane(const Image& plane, int left, int top, Size size) {
    Image cut(size.width, size.height, KEL_PIXEL_TYPE_U8G);
    loadKelImageData(cut.get(), plane->data + static_cast<ptrdiff_t>(top) * plane->step + left, size.width, size.height,
                     plane->step);
    return cut;
}

Frame cut(const Frame& frame, const VideoFormat& cutFormat, Margin margin) {
    const int left = margin.x / cutFormat.colour.factorX, top = margin.y / cutFormat.colour.factorY;
    return {cutPlane(frame.y, margin.x, margin.y, cutFormat.size), cutPlane(frame.u, left, top, cutFormat.colourSize()),
            cutPlane(frame.v, left, top, cutFormat.colourSize())};
}

// Follows the camera: correction() takes the newest frame to where a slowly moving reference would show it.
class Stabilizer {
public:
    Stabilizer(Size size, float farthest) : m_size(size), m_farthest(farthest), m_correction(3, 3, true) {
        m_correction.setDataIdentity(1);
    }

    const kelMat& correction() const { return m_correction; }

    void add(const Image& luma) {
        Image half(m_size.width / 2, m_size.height / 2, KEL_PIXEL_TYPE_U8G);
        if (half->width < 2 || half->height < 2)
            return;
        resizeKelImageHalf(half.get(), luma.get());
        kelRegister::Options options;
        options.threshold = kThreshold;
        options.mostFeatures = kMostFeatures;
        options.views = false;
        kelRegister::Prepared now(half.get(), options);
        if (m_before) {
            const kelRegister::Result motion = kelRegister::registerPictures(now, *m_before, options);
            if (motion.found)
                follow(m_correction * fullSize(motion.H));
            else
                m_correction.setDataIdentity(1); // a cut: start anew
        }
        m_before.reset(new kelRegister::Prepared(std::move(now)));
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
        if (!std::isfinite(farthest)) {
            m_correction.setDataIdentity(1);
            return;
        }
        const float follow = farthest > m_farthest ? 1 - m_farthest / farthest * (1 - kFollow) : kFollow;
        kelMat identity(3, 3, true);
        identity.setDataIdentity(1);
        m_correction = H * (1 - follow) + identity * follow;
    }

    Size m_size;
    float m_farthest; // pixels that a correction may move a corner
    kelMat m_correction;
    std::unique_ptr<kelRegister::Prepared> m_before; // halved
};

int stabilize(const Options& options) {
    VideoReader input(options.input, options.size.empty() ? Size{} : parseSize(options.size));
    const VideoFormat& format = input.format();
    const Margin margin = marginOf(format.size, options.crop);
    VideoFormat cutFormat = format;
    cutFormat.size = {format.size.width - 2 * margin.x, format.size.height - 2 * margin.y};
    if (cutFormat.size.width < 2 || cutFormat.size.height < 2)
        throw Error("--crop leaves nothing of frames of " + std::to_string(format.size.width) + "x" +
                    std::to_string(format.size.height));
    VideoWriter output(options.output, cutFormat);
    Stabilizer stabilizer(format.size, options.crop > 0 ? static_cast<float>(std::min(margin.x, margin.y))
                                                        : kFarthest * static_cast<float>(format.size.width));
    std::srand(1);
    double seconds = 0;
    long frames = 0;
    const auto speed = [&] {
        return std::to_string(frames) + " frames, " +
               std::to_string(static_cast<long>(static_cast<double>(frames) / std::max(seconds, 1e-6))) + " frames a second";
    };
    for (Frame frame; input.read(frame);) {
        const auto begin = std::chrono::steady_clock::now();
        stabilizer.add(frame.y);
        Frame steady = warpFrame(frame, format, stabilizer.correction());
        seconds += std::chrono::duration<double>(std::chrono::steady_clock::now() - begin).count();
        if (options.crop > 0)
            steady = cut(steady, cutFormat, margin);
        output.write(steady);
        if (++frames % 10 == 0)
            showProgress(speed());
    }
    output.finish();
    showProgress("");
    std::cerr << speed();
    if (options.crop > 0)
        std::cerr << ", cut to " << cutFormat.size.width << "x" << cutFormat.size.height;
    std::cerr << '\n';
    return 0;
}

} // namespace

int main(int argc, char** argv) {
    Options options;
    CLI::App app("Steadies a video of y4m (4:2:2, 4:2:0) or raw UYVY frames and writes the same format, for example:\n"
                 "  ffmpeg -i clip.mp4 -f yuv4mpegpipe -pix_fmt yuv420p - | stabilize --crop 0.08 | ffmpeg -i - steady.mp4\n"
                 "Progress goes to standard error.",
                 "stabilize");
    app.add_option("input", options.input, "file of frames; standard input without");
    app.add_option("--size", options.size, "of a raw frame, WIDTHxHEIGHT; y4m names its own");
    app.add_option("--output", options.output, "file for the frames; standard output without");
    app.add_option("--crop", options.crop,
                   "share of the width and the height to cut off at every side; the picture is then moved no farther than "
                   "that, so that its edges stay out of sight")
        ->check(numberIn(0, 0.45))
        ->capture_default_str();
    return runProgram(app, argc, argv, [&] { return stabilize(options); });
}
