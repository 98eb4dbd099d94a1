// The example programs, run as a user runs them: pictures of every format, bad input of every kind, videos, equal seeds.
#include <cmath>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sstream>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include "Warps.h"
#include "common/Scene.h"

namespace {

namespace fs = std::filesystem;
using namespace kel_examples;
using kel_test::meanError;
using kel_test::Plane;
using kel_test::planeOf;
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
        write("command", "cd '" + m_folder.string() +
                             "'; exec > stdout.txt 2> stderr.txt; $KEL_EMULATOR '" KEL_EXAMPLES_DIR "/" + program + "' " +
                             arguments + "\n");
        const int status = std::system(("bash '" + path("command") + "'").c_str());
        return {WIFEXITED(status) ? WEXITSTATUS(status) : -1, contents(path("stdout.txt")), contents(path("stderr.txt"))};
    }

    void write(const std::string& name, const std::string& bytes) const {
        std::ofstream(path(name), std::ios::binary) << bytes;
    }

    // Binary PPM or PGM; `magic` ends with white space.
    void writePnm(const std::string& name, const std::string& magic, const Image& picture) const {
        std::string bytes = magic + std::to_string(picture->width) + " " + std::to_string(picture->height) + "\n255\n";
        for (int y = 0; y < picture->height; ++y)
            bytes.append(reinterpret_cast<const char*>(picture.row(y)), picture.rowBytes());
        write(name, bytes);
    }
    void writeJpeg(const std::string& name, const Image& picture) const {
        const std::vector<uint8_t> bytes = encodeJpeg(picture);
        write(name, std::string(bytes.begin(), bytes.end()));
    }

    // A refusal in one line that holds `text`, nothing else, and no file.
    void expectRefusal(const std::string& program, const std::string& arguments, const std::string& text) const {
        const Outcome result = run(program, arguments);
        EXPECT_EQ(result.status, 1) << arguments;
        EXPECT_EQ(result.out, "") << arguments;
        EXPECT_THAT(result.err, HasSubstr(text)) << arguments;
        EXPECT_EQ(std::count(result.err.begin(), result.err.end(), '\n'), 1) << result.err;
        EXPECT_FALSE(fs::exists(path("kel-out")) || fs::exists(path("out"))) << arguments;
    }

    fs::path m_folder;
};

Plane homographyIn(const std::string& text) {
    Plane H = {};
    std::istringstream in(text);
    for (double& value : H.m)
        in >> value;
    return H;
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
    EXPECT_FALSE(fs::exists(path("kel-out")));
    const Outcome shown = run("register", "--output kel-out");
    EXPECT_THAT(shown.out, HasSubstr("\nwrote kel-out/report.html\nwrote kel-out/keypoints.png\n"));
    for (const char* name : {"keypoints", "matches", "warped", "mosaic"})
        EXPECT_NO_THROW(readPicture(path(std::string("kel-out/") + name + ".png"))) << name;
    const std::string page = contents(path("kel-out/report.html"));
    EXPECT_EQ(page.find("http"), std::string::npos) << "the page needs a network";
    for (const char* part : {"id=\"swipe\"", "id=\"blink\"", "--output kel-out", "patches agree", "data:image/jpeg;base64,"})
        EXPECT_THAT(page, HasSubstr(part));
}

TEST_F(Programs, RegisterPrintsEverythingAsJson) {
    const Scene scene = renderScene(2);
    writePicture(path("a.png"), scene.first);
    writePicture(path("b.png"), scene.second);
    const std::string query = "import json, sys; d = json.load(sys.stdin); f = d['first'] + d['second']; "
                              "print(d['found'], d['reason'], d['homography'] and len(d['homography']), d['share'] > 0.9, "
                              "d['matches'][0]['first'] < len(d['first']), {len(x['descriptor']) for x in f})";
    write("query.py", query);
    EXPECT_EQ(run("register", "a.png b.png --json | python3 query.py").out, "True  9 True True {256}\n");
    const std::string refused =
        run("register", "a.png a.png --threshold 0.1 --features 50 --no-views --working-size 200 --json").out;
    EXPECT_THAT(refused, HasSubstr("\"found\": "));
}

// The same picture, held in each of the eight ways that EXIF knows.
TEST_F(Programs, PicturesAreTurnedAsTheirExifOrientationSays) {
    const Image picture = renderScene(4).first;
    writeJpeg("plain.jpg", picture);
    const Image plain = readPicture(path("plain.jpg"));
    const std::string jpeg = contents(path("plain.jpg"));
    for (int orientation = 0; orientation <= 9; ++orientation) {
        const std::string exif = std::string("\xff\xe1\0\x22"
                                             "Exif\0\0MM\0\x2a\0\0\0\x08\0\x01\x01\x12\0\x03\0\0\0\x01\0",
                                             29) +
                                 static_cast<char>(orientation) + std::string(6, '\0');
        write("turned.jpg", jpeg.substr(0, 2) + exif + jpeg.substr(2));
        const Image turned = readPicture(path("turned.jpg"));
        const bool swapped = orientation >= 5 && orientation <= 8;
        ASSERT_EQ(turned->width, swapped ? plain->height : plain->width) << orientation;
        const int right = turned->width - 1, down = turned->height - 1;
        // Where the stored picture's first pixel and the last of its first row come to lie.
        const int places[10][4] = {{0, 0, right, 0},       {0, 0, right, 0}, {right, 0, 0, 0},        {right, down, 0, down},
                                   {0, down, right, down}, {0, 0, 0, down},  {right, 0, right, down}, {right, down, right, 0},
                                   {0, down, 0, 0},        {0, 0, right, 0}};
        const int* const place = places[orientation];
        for (int c = 0; c < 3; ++c) {
            EXPECT_EQ(turned.row(place[1])[3 * place[0] + c], plain.row(0)[c]) << orientation;
            EXPECT_EQ(turned.row(place[3])[3 * place[2] + c], plain.row(0)[3 * (plain->width - 1) + c]) << orientation;
        }
    }
}

TEST_F(Programs, RegisterReadsEveryFormat) {
    const Scene scene = renderScene(7);
    writePnm("a.ppm", "P6\n# a comment\n", scene.first);
    writePnm("a.pgm", "P5 ", greyOf(scene.first));
    writeJpeg("a.jpg", scene.first);
    writePicture(path("b.png"), scene.second);
    for (const char* name : {"a.ppm", "a.pgm", "a.jpg"}) {
        const Outcome result = run("register", std::string(name) + " b.png --output pictures");
        EXPECT_EQ(result.status, 0) << name << result.err;
        EXPECT_LT(meanError(homographyIn(result.out), planeOf(scene.H), scene.first.get(), scene.second.get()), 0.7) << name;
    }
    EXPECT_TRUE(fs::exists(path("pictures/mosaic.png")));
}

TEST_F(Programs, RegisterSaysWhereThereIsNoHomography) {
    writePicture(path("a.png"), renderScene(11).first);
    writePicture(path("b.png"), renderScene(12).first);
    Image blank(100, 80, KEL_PIXEL_TYPE_U8ZYX);
    clearKelImage(blank.get());
    writePicture(path("blank.png"), blank);
    Image tiny(2, 2, KEL_PIXEL_TYPE_U8ZYX);
    clearKelImage(tiny.get());
    writePicture(path("tiny.png"), tiny);
    for (const char* second : {"b.png", "blank.png", "tiny.png"}) {
        fs::create_directory(path("kel-out"));
        write("kel-out/mosaic.png", "of an earlier run");
        const Outcome result = run("register", std::string("a.png ") + second + " --output kel-out");
        EXPECT_EQ(result.status, 2) << second;
        EXPECT_EQ(result.out, "");
        EXPECT_THAT(result.err, HasSubstr("no reliable homography"));
        EXPECT_FALSE(fs::exists(path("kel-out/mosaic.png")));
        EXPECT_THAT(contents(path("kel-out/report.html")), HasSubstr("No reliable homography: "));
        EXPECT_NO_THROW(readPicture(path("kel-out/matches.png")));
    }
}

TEST_F(Programs, RegisterRefusesInOneLineAndWritesNothing) {
    const Scene scene = renderScene(3);
    writePicture(path("good.png"), scene.first);
    writeJpeg("good.jpg", scene.first);
    writePnm("good.ppm", "P6\n", scene.first);
    for (const char* name : {"good.png", "good.jpg", "good.ppm"})
        write(std::string("cut-") + name, contents(path(name)).substr(0, 5000));
    static const char cmyk[] =
        "\xff\xd8\xff\xc0\0\x14\x08\0\x08\0\x08\4\1\x11\0\2\x11\0\3\x11\0\4\x11\0" // frame of 8x8, four colours
        "\xff\xda\0\x0e\4\1\0\2\0\3\0\4\0\0\x3f\0";                                // and its scan
    write("cmyk.jpg", std::string(cmyk, sizeof cmyk));
    write("text.png", "hello\n");
    write("empty.png", "");
    write("zero.pgm", "P5\n0 5\n255\n");
    write("one.pgm", "P5\n1 5\n255\nabcde");
    write("wide.pgm", "P5\n20000 2\n255\n" + std::string(40000, 'x'));
    write("deep.pgm", "P5\n2 2\n65535\n" + std::string(8, 'x'));
    write("header.pgm", "P5\n2 x\n255\nabcd");
    fs::create_directory(path("folder"));
    const std::pair<const char*, const char*> cases[] = {
        {"missing.png good.png", "missing.png"},
        {"good.png missing.png", "missing.png"},
        {"cut-good.png good.png", "cut-good.png"},
        {"cut-good.jpg good.png", "cut-good.jpg"},
        {"good.png cut-good.ppm", "cut-good.ppm"},
        {"text.png good.png", "not a picture"},
        {"empty.png good.png", "empty"},
        {"zero.pgm good.png", "0x5"},
        {"one.pgm good.png", "1x5"},
        {"wide.pgm good.png", "20000x2 pixels is too large; at most 16384"},
        {"deep.pgm good.png", "8 bits"},
        {"header.pgm good.png", "header"},
        {"folder good.png", "folder"},
        {"good.png", "two pictures"},
        {"good.png good.png good.png", "pictures"},
        {"cmyk.jpg good.png", "CMYK"},
        {"/dev/zero good.png", "not a picture"},
        {"--threshold 0", "--threshold"},
        {"--threshold nan", "--threshold"},
        {"--seed x", "--seed"},
        {"--nonsense", "--nonsense"},
        {"good.png good.png --output text.png", "text.png"},
        {"good.png good.png --output /proc/nowhere", "/proc/nowhere"},
    };
    for (const auto& [arguments, text] : cases)
        expectRefusal("register", arguments, text);
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
        write("in.uyvy", video);
        const Outcome toFile = run("stabilize", "--size " + size + " in.uyvy --output out.uyvy");
        EXPECT_EQ(toFile.status, 0) << toFile.err;
        EXPECT_THAT(toFile.err, HasSubstr("frames a second"));
        EXPECT_EQ(std::count(toFile.err.begin(), toFile.err.end(), '\n'), 1) << "no progress but on a terminal";
        const std::string steadied = contents(path("out.uyvy"));
        EXPECT_EQ(steadied.size(), video.size());
        EXPECT_LT(shake(steadied, width, 240), shake(video, width, 240) / 3) << width;
        const size_t middle = frameBytes * 6 + frameBytes / 2 + frameBytes / 240 / 2 / 4 * 4; // of the picture
        EXPECT_EQ(static_cast<unsigned char>(steadied[middle]), 110) << "colour is kept";
        const Outcome piped = run("stabilize", "--size " + size + " < in.uyvy");
        EXPECT_EQ(piped.out, steadied);
    }
}

// The same frames as y4m: 4:2:2 comes out as UYVY does, 4:2:0 with the same brightness; --crop leaves the middle, without edges.
TEST_F(Programs, StabilizeReadsAndWritesY4m) {
    const int width = 333, height = 240, half = (width + 1) / 2;
    const std::string video = shakingVideo(renderScene(21).first, width, height, 12);
    write("in.uyvy", video);
    ASSERT_EQ(run("stabilize", "--size 333x240 in.uyvy --output out.uyvy").status, 0);
    const std::string steady = contents(path("out.uyvy"));
    const auto planes = [&](const std::string& uyvy, const std::string& header, int rowsOfColour) {
        std::string y4m = header;
        const size_t row = static_cast<size_t>(half) * 4;
        for (size_t frame = 0; frame < uyvy.size(); frame += row * height) {
            y4m += "FRAME\n";
            for (size_t y = 0; y < height; ++y)
                for (size_t x = 0; x < width; ++x)
                    y4m += uyvy[frame + y * row + 2 * x + 1];
            for (const size_t plane : {0, 2})
                for (size_t y = 0; y < height; y += static_cast<size_t>(rowsOfColour))
                    for (size_t x = 0; x < half; ++x)
                        y4m += uyvy[frame + y * row + 4 * x + plane];
        }
        return y4m;
    };
    const std::string h422 = "YUV4MPEG2 W333 H240 F30:1 Ip A1:1 C422\n", h420 = "YUV4MPEG2 W333 H240 F25:1 C420jpeg XKEEP=1\n";
    write("422.y4m", planes(video, h422, 1));
    write("420.y4m", planes(video, h420, 2));
    EXPECT_EQ(run("stabilize", "422.y4m").out, planes(steady, h422, 1));
    const std::string out420 = run("stabilize", "--size 333x240 < 420.y4m").out, expected420 = planes(steady, h420, 2);
    ASSERT_EQ(out420.size(), expected420.size());
    EXPECT_EQ(out420.substr(0, h420.size() + 6 + width * height), expected420.substr(0, h420.size() + 6 + width * height));

    const Outcome cropped = run("stabilize", "--crop 0.1 422.y4m");
    EXPECT_THAT(cropped.err, HasSubstr("cut to 269x192"));
    const size_t header = cropped.out.find('\n') + 1, frame = 6 + 192 * (269 + 2 * 135);
    EXPECT_EQ(cropped.out.substr(0, header), "YUV4MPEG2 W269 H192 F30:1 Ip A1:1 C422\n");
    ASSERT_EQ(cropped.out.size(), header + 12 * frame);
    for (size_t at = header; at < cropped.out.size(); at += frame)
        EXPECT_EQ(cropped.out.find('\0', at), std::string::npos) << "empty corners would be black";
}

TEST_F(Programs, StabilizeRefusesInOneLineAndWritesNothing) {
    const std::string bytes(64 * 48 * 2, 'x'), y4m = "YUV4MPEG2 W64 H48 F30:1";
    const std::pair<const char*, std::string> files[] = {
        {"short.uyvy", "abc"},
        {"empty.uyvy", ""},
        {"frame.uyvy", bytes},
        {"half.uyvy", bytes + bytes.substr(9)},
        {"clip.mp4", std::string("\0\0\0\x20", 4) + "ftypisom" + bytes.substr(12)},
        {"clip.ts", "G" + std::string(187, 'x') + "G" + std::string(187, 'x') + "G" + bytes.substr(377)},
        {"deep.y4m", y4m + " C420p10\nFRAME\n" + bytes},
        {"fields.y4m", y4m + " It\nFRAME\n" + bytes},
        {"cut.y4m", y4m + " C422\nFRAME\n" + bytes + "FRAME\n" + bytes.substr(9)},
        {"none.y4m", y4m + "\n"},
        {"open.y4m", y4m},
    };
    for (const auto& [name, content] : files)
        write(name, content);
    const std::pair<const char*, const char*> cases[] = {
        {"short.uyvy --size 64x48", "no whole number"},
        {"--size 64x48 < empty.uyvy", "no whole number"},
        {"half.uyvy --size 64x48", "no whole number"},
        {"--size 64x48 < half.uyvy", "no whole number"},
        {"--size 64x48 - < <(cat half.uyvy)", "frame 2 is incomplete"},
        {"missing --size 64x48", "missing"},
        {"frame.uyvy --size 64", "64"},
        {"frame.uyvy --size 64x48x2", "64x48x2"},
        {"frame.uyvy", "--size"},
        {"frame.uyvy --size 1x48", "1x48"},
        {"frame.uyvy --size 99999x48", "99999x48"},
        {"frame.uyvy --size 64x48 --crop nan", "--crop"},
        {". --size 64x48", "folder"},
        {"frame.uyvy --size 64x48 --output .", "folder"},
        {"frame.uyvy --size 64x48 --output /proc/nowhere", "No such file"},
        {"clip.mp4 --size 64x48", "MP4"},
        {"clip.ts --size 64x48", "transport stream"},
        {"deep.y4m", "420p10"},
        {"fields.y4m", "interlaced"},
        {"cut.y4m", "frame 2"},
        {"none.y4m", "no frame"},
        {"open.y4m", "no end"},
        {"cut.y4m --size 32x48", "64x48, not 32x48"},
    };
    for (const auto& [arguments, text] : cases)
        expectRefusal("stabilize", arguments + std::string(std::strstr(arguments, "output") ? "" : " --output out"), text);
    EXPECT_EQ(run("stabilize", "frame.uyvy --size 64x48 --output out").status, 0) << "one frame without features";
    EXPECT_EQ(contents(path("out")), contents(path("frame.uyvy")));
    std::string yuyv = shakingVideo(renderScene(21).first, 320, 240, 1);
    for (size_t i = 0; i < yuyv.size(); i += 2)
        std::swap(yuyv[i], yuyv[i + 1]);
    write("in.yuyv", yuyv);
    EXPECT_THAT(run("stabilize", "in.yuyv --size 320x240 --output out").err, HasSubstr("look like YUYV"));
}

// Links stay, what is no regular file is written into, modes are kept; nothing else remains in the folder.
TEST_F(Programs, WriteIntoWhatIsNoRegularFileAndThroughLinks) {
    const std::string video = shakingVideo(renderScene(21).first, 320, 240, 3), call = "--size 320x240 in.uyvy --output ";
    write("in.uyvy", video);
    ASSERT_EQ(run("stabilize", "--size 320x240 in.uyvy --output plain").status, 0);
    const std::string steady = contents(path("plain"));
    fs::create_directory(path("elsewhere"));
    write("elsewhere/old", "old");
    fs::permissions(path("elsewhere/old"), fs::perms(0640));
    fs::create_symlink("elsewhere/old", path("link"));
    fs::create_symlink("elsewhere/new", path("dangling"));
    ASSERT_EQ(mkfifo(path("pipe").c_str(), 0600), 0);
    EXPECT_EQ(run("stabilize", call + "link").status, 0);
    EXPECT_EQ(run("stabilize", call + "dangling").status, 0);
    EXPECT_EQ(run("stabilize", call + "pipe & cat pipe > read; wait").status, 0);
    EXPECT_EQ(run("stabilize", call + "/dev/stdout").out, steady);
    EXPECT_EQ(contents(path("elsewhere/old")), steady);
    EXPECT_EQ(contents(path("elsewhere/new")), steady);
    EXPECT_EQ(contents(path("read")), steady);
    EXPECT_TRUE(fs::is_symlink(path("link")) && fs::is_symlink(path("dangling")));
    EXPECT_TRUE(fs::is_fifo(path("pipe")));
    EXPECT_EQ(fs::status(path("elsewhere/old")).permissions(), fs::perms(0640));

    fs::create_directory(path("kel-out"));
    fs::create_symlink("../mosaic", path("kel-out/mosaic.png"));
    EXPECT_EQ(run("register", "--output kel-out").status, 0);
    EXPECT_TRUE(fs::is_symlink(path("kel-out/mosaic.png")));
    EXPECT_NO_THROW(readPicture(path("mosaic")));
    for (const auto& entry : fs::recursive_directory_iterator(m_folder))
        EXPECT_NE(entry.path().filename().string().substr(0, 5), ".kel-") << entry;
}

TEST_F(Programs, SayWhereResultsAreLost) {
    write("in.uyvy", shakingVideo(renderScene(21).first, 320, 240, 12));
    fs::create_directory(path("sets"));
    write("sets/a_pts.txt", "0 0 1 0 0 1 1\n0 0 1 0 0 1 0\n");
    const std::pair<const char*, const char*> programs[] = {{"register", ""},
                                                            {"calibrate", ""},
                                                            {"robustness", "sets --seeds 2"},
                                                            {"register", "--help"},
                                                            {"stabilize", "--size 320x240 in.uyvy"}};
    for (const auto& [program, arguments] : programs)
        for (const char* to : {" > /dev/full", " >&-"}) {
            const Outcome result = run(program, std::string(arguments) + to);
            EXPECT_EQ(result.status, 1) << program << arguments << to;
            EXPECT_THAT(result.err, HasSubstr("standard output: cannot be written: ")) << program << arguments << to;
        }
}

TEST_F(Programs, LeaveNothingBehindWhenInterrupted) {
    write("in.uyvy", shakingVideo(renderScene(21).first, 320, 240, 12));
    write("out", "old");
    for (const char* signal : {"INT", "TERM", "HUP"}) {
        const std::string command = "cd '" + m_folder.string() + "' && (cat in.uyvy; sleep 1) | (timeout -s " + signal +
                                    " 0.5 $KEL_EMULATOR '" KEL_EXAMPLES_DIR "/stabilize' --size 320x240 --output out; true)";
        EXPECT_EQ(std::system(command.c_str()), 0);
        EXPECT_EQ(contents(path("out")), "old");
        EXPECT_EQ(std::distance(fs::directory_iterator(m_folder), fs::directory_iterator()), 2) << signal;
    }
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
    fs::remove_all(path("kel-out"));
    for (const std::string arguments :
         {"--pairs 5", "--pairs 10001", "--noise nan", "--outliers nan", "--noise -1", "--outliers 1.5", "extra"})
        expectRefusal("calibrate", arguments, arguments.substr(0, arguments.find(' ')));
    expectRefusal("calibrate", "--output /proc/nowhere", "/proc/nowhere: cannot be made");
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
        const Image left = readPicture(a), right = readPicture(b);
        const Plane truth = homographyIn(contents(photos / (std::string(first) + "_to_" + second + ".txt")));
        const Outcome result = run("register", a + " " + b);
        EXPECT_EQ(result.status, 0) << result.err;
        EXPECT_LT(meanError(homographyIn(result.out), truth, left.get(), right.get()), 3) << first;
    }
    EXPECT_EQ(run("register", (photos / "graf1.pgm").string() + " " + (photos / "cityA.pgm").string()).status, 2);
}
