// Video between streams and planes: y4m (4:2:2 and 4:2:0, eight bits) and raw UYVY, in and out.
#ifndef KEL_EXAMPLES_VIDEO_H
#define KEL_EXAMPLES_VIDEO_H

#include <cstdio>
#include <memory>
#include <string>
#include <vector>

#include "Output.h"
#include "Picture.h"
#include "Warp.h"

namespace kel_examples {

// How colour lies in a frame: pixel c of a colour plane is at factor * c + offset of the brightness, either way.
struct Sampling {
    int factorX, factorY;
    float offsetX, offsetY;
};

struct VideoFormat {
    Size size{};
    Sampling colour{2, 1, 0, 0};
    std::string header; // the y4m header's fields behind the size, such as " F30:1 C420jpeg"; unused for raw frames
    bool raw = true;

    Size colourSize() const {
        return {(size.width + colour.factorX - 1) / colour.factorX, (size.height + colour.factorY - 1) / colour.factorY};
    }
};

// One frame as three U8G pictures. The padding of `y` is filled with each row's last pixel.
struct Frame {
    Image y, u, v;
};

class VideoReader {
public:
    // Opens a file, or standard input where the path is empty or "-". What starts as y4m is y4m; everything else is raw UYVY of
    // `size`, unless it is known to be something else. A size that contradicts the file's is an Error.
    VideoReader(const std::string& path, Size size);

    const VideoFormat& format() const { return m_format; }
    const std::string& name() const { return m_name; }

    // False at the end. A frame that is cut off is an Error.
    bool read(Frame& frame);

private:
    size_t take(void* to, size_t bytes);
    std::string takeLine();
    void parseHeader(Size size);
    void refuseOtherFiles() const;
    void checkLength() const;
    void unpackRaw(Frame& frame);
    [[noreturn]] void fail(const std::string& what) const;

    std::string m_name;
    std::unique_ptr<std::FILE, void (*)(std::FILE*)> m_file;
    std::vector<unsigned char> m_start; // read to tell the format, and taken first
    VideoFormat m_format;
    std::vector<unsigned char> m_bytes;
    long m_frames = 0;
};

class VideoWriter {
public:
    VideoWriter(const std::string& path, const VideoFormat& format);
    void write(const Frame& frame);
    void finish() { m_output.finish(); }

private:
    Output m_output;
    VideoFormat m_format;
    bool m_begun = false;
    std::vector<unsigned char> m_bytes;
};

} // namespace kel_examples

#endif
