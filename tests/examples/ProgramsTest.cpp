// The example programs, run as a user runs them: pictures of every format, bad input of every kind, videos, equal seeds.
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <jpeglib.h>
#include <sstream>
#include <sys/wait.h>
#include <unistd.h>

#include "common/Registration.h"
#include "common/Scene.h"

namespace {

namespace fs = std::filesystem;
using namespace kel_examples;
using testing::HasSubstr;

std::string contents(const fs::path& path) {
    std::ostringstream out;
    out << std::ifstream(path, std::ios::binary).rdbuf();
    return out.str();
}

struct Outcome {
    int status;
    std::string out, err;
};

class Programs : public testing::Test {
protected:
    Programs() : m_folder(fs::temp_directory_path() / ("kel_programs_" + std::to_string(getpid()))) {
        fs::create_directories(m_folder);
    }
    ~Programs() override {
        fs::permissions(m_folder, fs::perms::owner_all);
        fs::remove_all(m_folder);
    }

    std::string path(const std::string& name) const { return (m_folder / name).string(); }

    Outcome run(const std::string& program, const std::string& arguments) const {
        const std::string command = "cd '" + m_folder.string() + "' && '" KEL_EXAMPLES_DIR "/" + program + "' " + arguments +
                                    " > stdout.txt 2> stderr.txt";
        const int status = std::system(command.c_str());
        return {WIFEXITED(status) ? WEXITSTATUS(status) : -1, contents(path("stdout.txt")), contents(path("stderr.txt"))};
    }

    void write(const std::string& name, const std::string& bytes) const {
        std::ofstream(path(name), std::ios::binary) << bytes;
    }

    // Binary PPM, or PGM of the mean of the channels.
    void writePnm(const std::string& name, const Image& picture, bool colour) const {
        std::string bytes = (colour ? "P6\n# a comment\n" : "P5 ") + std::to_string(picture->width) + " " +
                            std::to_string(picture->height) + "\n255\n";
        for (int y = 0; y < picture->height; ++y)
            for (int x = 0; x < picture->width; ++x) {
                const unsigned char* const p = picture->data + 3 * (y * picture->step + x);
                if (colour)
                    bytes.append(reinterpret_cast<const char*>(p), 3);
                else
                    bytes += static_cast<char>((p[0] + p[1] + p[2]) / 3);
            }
        write(name, bytes);
    }

    void writeJpeg(const std::string& name, const Image& picture) const {
        jpeg_compress_struct jpeg;
        jpeg_error_mgr errors;
        jpeg.err = jpeg_std_error(&errors);
        jpeg_create_compress(&jpeg);
        std::FILE* const file = std::fopen(path(name).c_str(), "wb");
        jpeg_stdio_dest(&jpeg, file);
        jpeg.image_width = static_cast<JDIMENSION>(picture->width);
        jpeg.image_height = static_cast<JDIMENSION>(picture->height);
        jpeg.input_components = 3;
        jpeg.in_color_space = JCS_RGB;
        jpeg_set_defaults(&jpeg);
        jpeg_set_quality(&jpeg, 90, TRUE);
        jpeg_start_compress(&jpeg, TRUE);
        while (jpeg.next_scanline < jpeg.image_height) {
            JSAMPROW row = picture->data + size_t(3) * picture->step * jpeg.next_scanline;
            jpeg_write_scanlines(&jpeg, &row, 1);
        }
        jpeg_finish_compress(&jpeg);
        jpeg_destroy_compress(&jpeg);
        std::fclose(file);
    }

    fs::path m_folder;
};

kelMat homographyIn(const std::string& out) {
    kelMat H(3, 3, true);
    std::istringstream in(out);
    for (int i = 0; i < 9; ++i)
        in >> H.m_Data[i];
    return H;
}

// Mean distance in pixels over the part of the first picture that the second shows.
double meanError(kelMat H, kelMat truth, int width, int height) {
    double sum = 0;
    int count = 0;
    for (float y = 0; y < static_cast<float>(height); y += 16)
        for (float x = 0; x < static_cast<float>(width); x += 16) {
            float u, v, s, t;
            truth.cvtPoint(x, y, &u, &v);
            H.cvtPoint(x, y, &s, &t);
            if (u >= 0 && v >= 0 && u < static_cast<float>(width) && v < static_cast<float>(height)) {
                sum += std::hypot(u - s, v - t);
                ++count;
            }
        }
    return sum / count;
}

std::string firstLine(const std::string& text) {
    return text.substr(0, text.find('\n'));
}

} // namespace

TEST_F(Programs, RegisterRendersAndRegistersASceneTheSameForEqualSeeds) {
    for (const char* seed : {"1", "2", "3"}) {
        const Outcome first = run("register", std::string("--seed ") + seed),
                      again = run("register", std::string("--seed ") + seed);
        EXPECT_EQ(first.status, 0) << first.err;
        EXPECT_EQ(firstLine(first.out), firstLine(again.out));
        const size_t at = first.out.find("truth: ");
        ASSERT_NE(at, std::string::npos);
        EXPECT_LT(std::stod(first.out.substr(at + 7)), 0.5);
    }
    for (const char* name : {"keypoints", "matches", "warped", "mosaic"})
        EXPECT_NO_THROW(readPicture(path(std::string("kel-out/") + name + ".png"))) << name;
}

TEST_F(Programs, RegisterReadsEveryFormat) {
    const Scene scene = renderScene(7);
    writePnm("a.ppm", scene.first, true);
    writePnm("a.pgm", scene.first, false);
    writeJpeg("a.jpg", scene.first);
    writePicture(path("b.png"), scene.second);
    for (const char* name : {"a.ppm", "a.pgm", "a.jpg"}) {
        const Outcome result = run("register", std::string(name) + " b.png --output pictures");
        EXPECT_EQ(result.status, 0) << name << result.err;
        EXPECT_LT(meanError(homographyIn(result.out), scene.H, 640, 480), 0.7) << name;
    }
    EXPECT_TRUE(fs::exists(path("pictures/mosaic.png")));
}

TEST_F(Programs, RegisterBearsTurnsScalesAndTilts) {
    const Scene scene = renderScene(5);
    writePicture(path("a.png"), scene.first);
    kelMat centre(3, 3, true), turn, change(3, 3, true);
    centre.setDataIdentity(1);
    centre[0][2] = 320;
    centre[1][2] = 240;
    const struct {
        float degrees, scale, perspective;
    } views[] = {{90, 1, 0}, {170, 1, 0}, {0, 2.2f, 0}, {30, 0.45f, 0}, {10, 1, 1e-3f}};
    for (const auto& view : views) {
        turn.setDataRotationMatrix_Z_3x3(view.degrees);
        change.setDataIdentity(view.scale);
        change[2][2] = 1;
        change[2][0] = view.perspective;
        kelMat truth = centre * change * turn * centre.getInversedMatrix();
        writePicture(path("b.png"), warpPicture(scene.first, truth, {640, 480}));
        const Outcome result = run("register", "a.png b.png");
        EXPECT_EQ(result.status, 0) << view.degrees << " " << view.scale << " " << view.perspective << result.err;
        if (result.status == 0) {
            EXPECT_LT(meanError(homographyIn(result.out), truth, 640, 480), 1.5)
                << view.degrees << " " << view.scale << " " << view.perspective;
        }
    }
}

TEST_F(Programs, RegisterSaysWhereThereIsNoHomography) {
    writePicture(path("a.png"), renderScene(11).first);
    writePicture(path("b.png"), renderScene(12).first);
    Image blank = create(100, 80, KEL_PIXEL_TYPE_U8ZYX);
    clearKelImage(blank.get());
    writePicture(path("blank.png"), blank);
    Image tiny = create(2, 2, KEL_PIXEL_TYPE_U8ZYX);
    clearKelImage(tiny.get());
    writePicture(path("tiny.png"), tiny);
    for (const char* second : {"b.png", "blank.png", "tiny.png"}) {
        const Outcome result = run("register", std::string("a.png ") + second);
        EXPECT_EQ(result.status, 2) << second;
        EXPECT_EQ(result.out, "");
        EXPECT_THAT(result.err, HasSubstr("no reliable homography"));
        EXPECT_FALSE(fs::exists(path("kel-out/mosaic.png")));
    }
}

TEST_F(Programs, RegisterAnswersBadInputWithOneLineAndWritesNothing) {
    const Scene scene = renderScene(3);
    writePicture(path("good.png"), scene.first);
    writeJpeg("good.jpg", scene.first);
    writePnm("good.ppm", scene.first, true);
    for (const char* name : {"good.png", "good.jpg", "good.ppm"})
        write(std::string("cut-") + name, contents(path(name)).substr(0, 5000));
    write("text.png", "hello\n");
    write("empty.png", "");
    write("zero.pgm", "P5\n0 5\n255\n");
    write("one.pgm", "P5\n1 5\n255\nabcde");
    write("wide.pgm", "P5\n20000 2\n255\n" + std::string(40000, 'x'));
    write("deep.pgm", "P5\n2 2\n65535\n" + std::string(8, 'x'));
    write("header.pgm", "P5\n2 x\n255\nabcd");
    fs::create_directory(path("folder"));
    const struct {
        const char *arguments, *text;
    } cases[] = {
        {"missing.png good.png", "missing.png"},
        {"good.png missing.png", "missing.png"},
        {"cut-good.png good.png", "cut-good.png"},
        {"cut-good.jpg good.png", "cut-good.jpg"},
        {"good.png cut-good.ppm", "cut-good.ppm"},
        {"text.png good.png", "not a picture"},
        {"empty.png good.png", "empty"},
        {"zero.pgm good.png", "0x5"},
        {"one.pgm good.png", "1x5"},
        {"wide.pgm good.png", "20000x2"},
        {"deep.pgm good.png", "8 bits"},
        {"header.pgm good.png", "header"},
        {"folder good.png", "folder"},
        {"good.png", "two pictures"},
        {"good.png good.png good.png", "pictures"},
        {"--threshold 0", "--threshold"},
        {"--seed x", "--seed"},
        {"--nonsense", "--nonsense"},
        {"good.png good.png --output text.png", "text.png"},
        {"good.png good.png --output /proc/nowhere", "/proc/nowhere"},
    };
    for (const auto& c : cases) {
        const Outcome result = run("register", c.arguments);
        EXPECT_EQ(result.status, 1) << c.arguments;
        EXPECT_EQ(result.out, "") << c.arguments;
        EXPECT_THAT(result.err, HasSubstr(c.text)) << c.arguments;
        EXPECT_EQ(std::count(result.err.begin(), result.err.end(), '\n'), 1) << result.err;
        EXPECT_FALSE(fs::exists(path("kel-out"))) << c.arguments;
    }
    EXPECT_EQ(run("register", "--help").status, 0);
}

namespace {

// Frames that show a picture through a shaking window.
std::string shakingVideo(const Image& picture, int width, int height, int frames) {
    std::string video;
    for (int frame = 0; frame < frames; ++frame) {
        const int left = 60 + (frame * 7919 % 13) - 6, top = 60 + (frame * 104729 % 11) - 5;
        for (int y = 0; y < height; ++y)
            for (int x = 0; x < (width + 1) / 2 * 2; ++x) {
                video += static_cast<char>(x % 2 ? 140 : 110); // U and V, the same throughout
                video += static_cast<char>(picture->data[3 * ((top + y) * picture->step + left + x) + 1]);
            }
    }
    return video;
}

// Mean change of brightness between frames in their middle.
double shake(const std::string& video, int width, int height) {
    const size_t rowBytes = static_cast<size_t>((width + 1) / 2 * 4), frameBytes = rowBytes * static_cast<size_t>(height);
    double sum = 0;
    int count = 0;
    for (size_t frame = 1; (frame + 1) * frameBytes <= video.size(); ++frame)
        for (int y = height / 4; y < height * 3 / 4; y += 3)
            for (int x = width / 4; x < width * 3 / 4; x += 3) {
                const size_t at = frame * frameBytes + static_cast<size_t>(y) * rowBytes + static_cast<size_t>(2 * x + 1);
                sum += std::abs(static_cast<unsigned char>(video[at]) - static_cast<unsigned char>(video[at - frameBytes]));
                ++count;
            }
    return sum / count;
}

} // namespace

TEST_F(Programs, StabilizeSteadiesFramesOfAnyWidth) {
    const Scene scene = renderScene(21);
    for (int width : {320, 333, 350, 400}) {
        const std::string size = std::to_string(width) + "x240", video = shakingVideo(scene.first, width, 240, 12);
        const size_t frameBytes = video.size() / 12;
        write("in.uyvy", video + video.substr(0, frameBytes / 2)); // the last frame is cut off
        const Outcome toFile = run("stabilize", "--size " + size + " in.uyvy --output out.uyvy");
        EXPECT_EQ(toFile.status, 0) << toFile.err;
        EXPECT_THAT(toFile.err, HasSubstr("incomplete"));
        EXPECT_THAT(toFile.err, HasSubstr("frames a second"));
        const std::string steadied = contents(path("out.uyvy"));
        EXPECT_EQ(steadied.size(), video.size());
        EXPECT_LT(shake(steadied, width, 240), shake(video, width, 240) / 3) << width;
        const size_t middle = frameBytes * 6 + frameBytes / 2 + frameBytes / 240 / 2 / 4 * 4; // of the picture
        EXPECT_EQ(static_cast<unsigned char>(steadied[middle]), 110) << "colour is kept";
        const Outcome piped = run("stabilize", "--size " + size + " < in.uyvy");
        EXPECT_EQ(piped.out, steadied);
    }
}

TEST_F(Programs, StabilizeAnswersBadInputWithOneLineAndWritesNothing) {
    write("short.uyvy", "abc");
    write("frame.uyvy", std::string(64 * 48 * 2, 'x'));
    for (const char* arguments :
         {"short.uyvy --size 64x48", "missing --size 64x48", "frame.uyvy --size 64", "frame.uyvy --size 64x48x2", "frame.uyvy",
          "frame.uyvy --size 1x48", "frame.uyvy --size 99999x48", ". --size 64x48", "frame.uyvy --size 64x48 --output .",
          "frame.uyvy --size 64x48 --output /proc/nowhere"}) {
        const Outcome result =
            run("stabilize", arguments + std::string(std::strstr(arguments, "output") ? "" : " --output out"));
        EXPECT_EQ(result.status, 1) << arguments;
        EXPECT_EQ(std::count(result.err.begin(), result.err.end(), '\n'), 1) << result.err;
        EXPECT_FALSE(fs::exists(path("out")));
    }
    EXPECT_EQ(run("stabilize", "frame.uyvy --size 64x48 --output out").status, 0) << "one frame without features";
    EXPECT_EQ(contents(path("out")), contents(path("frame.uyvy")));
}

TEST_F(Programs, CalibrateRecoversTheCamera) {
    const Outcome first = run("calibrate", "--seed 4"), again = run("calibrate", "--seed 4"),
                  other = run("calibrate", "--seed 5");
    EXPECT_EQ(first.status, 0) << first.err;
    EXPECT_EQ(first.out, again.out);
    EXPECT_NE(first.out, other.out);
    EXPECT_NO_THROW(readPicture(path("kel-out/reprojection.png")));
    const Outcome exact = run("calibrate", "--noise 0 --outliers 0 --pairs 60");
    std::istringstream lines(exact.out);
    std::string line;
    int parameters = 0;
    while (std::getline(lines, line))
        if (line.find(" px ") != std::string::npos || line.find(" deg ") != std::string::npos) {
            if (line.find("pairs fit") == std::string::npos) {
                ++parameters;
                EXPECT_LT(std::fabs(std::stod(line.substr(line.rfind(' ')))), 1.0) << line;
            }
        }
    EXPECT_EQ(parameters, 8);
    EXPECT_EQ(run("calibrate", "--outliers 1").status, 2);
    for (const char* arguments :
         {"--pairs 5", "--pairs 10001", "--noise -1", "--outliers 1.5", "--output /proc/nowhere", "extra"})
        EXPECT_EQ(run("calibrate", arguments).status, 1) << arguments;
}

// Real photographs, where a folder of them is named at configure time.
TEST_F(Programs, RegisterFindsKnownHomographiesOfPhotographs) {
    const fs::path photos = fs::path(KEL_DATA_DIR) / "photos";
    if (!*KEL_DATA_DIR || !fs::exists(photos))
        GTEST_SKIP() << "KEL_DATA_DIR names no folder with photos";
    const std::pair<const char*, const char*> pairs[] = {{"graf1", "graf3"}, {"cityA", "cityB"}, {"dogman1", "dogman2"}};
    for (const auto& [first, second] : pairs) {
        const std::string a = (photos / (std::string(first) + ".pgm")).string(),
                          b = (photos / (std::string(second) + ".pgm")).string();
        const Image picture = readPicture(a);
        const kelMat truth = homographyIn(contents(photos / (std::string(first) + "_to_" + second + ".txt")));
        const Outcome result = run("register", a + " " + b);
        EXPECT_EQ(result.status, 0) << result.err;
        EXPECT_LT(meanError(homographyIn(result.out), truth, picture->width, picture->height), 3) << first;
    }
    EXPECT_EQ(run("register", (photos / "graf1.pgm").string() + " " + (photos / "cityA.pgm").string()).status, 2);
}
