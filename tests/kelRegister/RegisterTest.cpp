// Registration as a user sees it: known geometry in both directions, refusals, types, seeds; features and matches alone.
#include <algorithm>
#include <array>
#include <cmath>
#include <cstdlib>
#include <cstring>
#include <functional>
#include <gtest/gtest.h>
#include <kel/kelRegister.h>
#include <limits>
#include <random>
#include <set>
#include <string>
#include <vector>

#include "Valgrind.h"
#include "Warps.h"

using namespace kel_test;
using kel::Image;
using kelRegister::Feature;
using kelRegister::Match;
using kelRegister::Options;
using kelRegister::registerPictures;
using kelRegister::Result;

namespace {

// The error in pixels; enormous, with the reason on record, where nothing was found.
double errorOf(const Result& r, const Plane& truth, const kelImage_t* first, const kelImage_t* second) {
    if (!r.found) {
        ADD_FAILURE() << r.reason;
        return 1e9;
    }
    return meanError(planeOf(r.H), truth, first, second);
}

const Image& scene() {
    static const Image picture = drawnScene(640, 480, 4);
    return picture;
}

struct Known {
    const char* name;
    Look look;
    double allowed; // pixels of the coarser of the two
};

class Geometry : public ::testing::TestWithParam<Known> {};

TEST_P(Geometry, IsFoundInBothDirections) {
    if (std::string(GetParam().name) != "SteepAlongX")
        KEL_NOT_UNDER_VALGRIND("one look takes every way through the code");
    Plane H;
    const Image view = warped(scene().get(), GetParam().look, 1000, H);
    const double scale = std::max(1.0, GetParam().look.scale), shrink = std::min(1.0, GetParam().look.scale);
    for (const unsigned seed : {1u, 2u}) {
        std::srand(seed);
        const Result there = registerPictures(scene().get(), view.get());
        EXPECT_LT(errorOf(there, H, scene().get(), view.get()), GetParam().allowed * scale);
        const Result back = registerPictures(view.get(), scene().get());
        EXPECT_LT(errorOf(back, H.inverse(), view.get(), scene().get()), GetParam().allowed / shrink);
        EXPECT_GT(std::min(there.share, back.share), 0.6f);
        EXPECT_LT(there.expectedError, 1);
        const Plane is = planeOf(there.H), undo = is.inverse();
        for (const Match& match : there.matches) { // within three pixels of either picture
            const Feature &a = there.first[match.first], &b = there.second[match.second];
            double nearest = 1e9;
            is.at(a.x, a.y, [&](double u, double v) { nearest = std::hypot(u - b.x, v - b.y); });
            undo.at(b.x, b.y, [&](double u, double v) { nearest = std::min(nearest, std::hypot(u - a.x, v - a.y)); });
            ASSERT_TRUE(match.inlier ? nearest < 3.01 : nearest > 2.99);
        }
    }
}

INSTANTIATE_TEST_SUITE_P(
    Looks, Geometry,
    ::testing::Values(Known{"Same", {1, 0, 0, 1}, 0.05}, Known{"TurnedAQuarter", {1, 0, 90, 1}, 0.05},
                      Known{"Turned", {1, 0, 137, 1.03}, 0.1}, Known{"Small", {1, 0, -20, 0.25}, 0.15},
                      Known{"Half", {1, 0, 60, 0.5}, 0.1}, Known{"Large", {1, 0, 200, 4}, 0.15},
                      Known{"Tilted", {1.6, 30, 45, 1}, 0.15}, Known{"TiltedTwice", {2, 75, -80, 1.1}, 0.15},
                      Known{"TiltedAslant", {3, 45, 10, 1.2}, 0.4}, Known{"TiltedAcross", {3, 120, 100, 1.2}, 0.4},
                      Known{"SteepAlongX", {4, 0, 0, 1.3}, 0.5}, Known{"SteepAlongY", {4, 90, 0, 1.3}, 0.5}),
    [](const auto& info) { return info.param.name; });

TEST(Register, PicturesBeyondTheWorkingSizeAreRefinedAtTheirOwn) {
    const Image large = drawnScene(1500, 1100, 9);
    Plane H;
    const Image view = warped(large.get(), {1.2, 20, 15, 1}, 2000, H);
    Options options;
    options.workingSize = 500;
    EXPECT_LT(errorOf(registerPictures(large.get(), view.get(), options), H, large.get(), view.get()), 0.1);
    EXPECT_LT(errorOf(registerPictures(view.get(), large.get()), H.inverse(), view.get(), large.get()), 0.1);
}

TEST(Register, LightNoiseAndHiddenPartsAreBorne) {
    Plane H;
    Image view = warped(scene().get(), {1.3, 10, 30, 0.9}, 1000, H);
    std::mt19937 numbers(2);
    for (int y = 0; y < view->height; ++y)
        for (int x = 0; x < view->width; ++x) {
            const double bright = 0.5 * view.row(y)[x] + 60 + static_cast<int>(numbers() % 9) - 4;
            view.row(y)[x] = static_cast<uint8_t>(x < view->width / 4 ? 77 : bright);
        }
    EXPECT_LT(errorOf(registerPictures(scene().get(), view.get()), H, scene().get(), view.get()), 0.2);
}

uint64_t hashOf(const std::vector<unsigned char>& bytes, size_t size) {
    uint64_t hash = 14695981039346656037u;
    for (size_t i = 0; i < size; i += 8) {
        uint64_t word = 0;
        for (size_t k = 0; k < 8 && i + k < size; ++k)
            word |= uint64_t(bytes[i + k]) << (8 * k);
        hash = (hash ^ word) * 1099511628211u;
    }
    return hash;
}

std::string reasonOf(const std::vector<unsigned char>& bytes, size_t size) {
    return kelRegister::Prepared::restored(
               std::vector<unsigned char>(bytes.begin(), bytes.begin() + static_cast<ptrdiff_t>(size)).data(), size)
        .reason();
}

void expectSameBits(const Result& r, const Result& expected) {
    ASSERT_TRUE(r.found && expected.found) << r.reason;
    EXPECT_EQ(std::memcmp(r.H.m_Data, expected.H.m_Data, 9 * sizeof(float)), 0);
    EXPECT_EQ(r.H.m_Data[8], 1);
    EXPECT_EQ(r.agreeing, expected.agreeing);
    EXPECT_EQ(r.share, expected.share);
    EXPECT_EQ(r.expectedError, expected.expectedError);
    ASSERT_EQ(r.matches.size(), expected.matches.size());
    for (size_t i = 0; i < r.matches.size(); ++i) {
        const Match &a = r.matches[i], &b = expected.matches[i];
        EXPECT_TRUE(a.first == b.first && a.second == b.second && a.inlier == b.inlier);
    }
}

// For equal seeds.
TEST(Register, PreparedPicturesGiveTheSameBitsAndComeBackFromTheirBytes) {
    using kelRegister::Prepared;
    Options small;
    small.workingSize = 200;
    Plane H;
    const Image view = warped(scene().get(), {1.3, 40, 30, 0.9}, 1000, H), tiny(7, 7, KEL_PIXEL_TYPE_U8G);
    for (const Options& options : {Options(), small}) { // with finer levels than the working picture and without
        std::srand(3);
        const Result expected = registerPictures(scene().get(), view.get(), options);
        Prepared first(scene().get(), options);
        const Prepared moved(std::move(first)), second(view.get(), options);
        const std::vector<unsigned char> bytes = moved.store(), others = second.store();
        const Prepared again = Prepared::restored(bytes.data(), bytes.size()),
                       other = Prepared::restored(others.data(), others.size());
        EXPECT_EQ(second.reason() + again.reason(), "");
        EXPECT_EQ(again.store(), bytes);
        std::srand(3);
        expectSameBits(registerPictures(moved, second, options), expected);
        std::srand(3);
        expectSameBits(registerPictures(again, other, options), expected);
        const Prepared none(tiny.get());
        EXPECT_EQ(none.reason(), "the given picture is too small: 7 x 7 pixels, at least 40 either way are needed");
        EXPECT_EQ(registerPictures(moved, none).reason, none.reason());
        EXPECT_TRUE(none.store().empty());
    }
}

TEST(Register, BytesThatAreNoPreparedPictureAreRefused) {
    using kelRegister::Prepared;
    const Image picture = drawnScene(90, 60, 4);
    const std::vector<unsigned char> bytes = Prepared(picture.get()).store();
    const std::string changed = "the prepared picture is cut or was changed";
    EXPECT_EQ(std::string(bytes.begin(), bytes.begin() + 8), "kelReady");
    EXPECT_EQ(std::vector<int>(bytes.begin() + 8, bytes.begin() + 20),
              (std::vector<int>{1, 0, 0, 0, 90, 0, 0, 0, 60, 0, 0, 0}));
    for (size_t size = 0; size < bytes.size(); size += size < 64 ? 1 : 997)
        EXPECT_EQ(reasonOf(bytes, size), size < 32 ? "the bytes are no prepared picture" : changed) << size;
    std::vector<unsigned char> other = bytes;
    other.push_back(0);
    EXPECT_EQ(reasonOf(other, other.size()), changed);
    for (size_t i = 0; i < bytes.size(); i += i < 40 ? 1 : 499) {
        other = bytes;
        other[i] ^= 1;
        EXPECT_EQ(reasonOf(other, other.size()), i < 8    ? "the bytes are no prepared picture"
                                                 : i == 8 ? "the prepared picture is of form 0, this library reads form 1"
                                                 : i < 12 ? "the prepared picture is of form " +
                                                                std::to_string(1 + (1 << 8 * (i - 8))) +
                                                                ", this library reads form 1"
                                                          : changed);
    }
    // With a hash that fits: sizes and places that do not; other numbers are as good as any and lead nowhere wrong.
    std::mt19937 random(5);
    std::srand(1);
    for (int round = 0; round < 100; ++round) {
        other = bytes;
        const size_t tail = 8 + 156 * 4; // the last four features
        const size_t place = round % 3 == 0   ? 12 + random() % 20
                             : round % 3 == 1 ? other.size() - tail + random() % (tail - 8)
                                              : 32 + random() % (other.size() - 40);
        other[place] = static_cast<unsigned char>(random());
        const uint64_t hash = hashOf(other, other.size() - 8);
        for (size_t k = 0; k < 8; ++k)
            other[other.size() - 8 + k] = static_cast<unsigned char>(hash >> 8 * k);
        const Prepared made = Prepared::restored(other.data(), other.size());
        if (!made.reason().empty())
            EXPECT_EQ(made.reason(), "the prepared picture contradicts itself");
        else
            registerPictures(made, made);
    }
}

// Grey values alone count, and padding does not, however wide it is.
TEST(Register, AllTypesOfOnePictureGiveTheSame) {
    Plane H;
    const Image view = warped(scene().get(), {1.2, 0, 20, 0.9}, 333, H);
    std::srand(1);
    const Result expected = registerPictures(scene().get(), view.get());
    ASSERT_TRUE(expected.found);
    const int types[] = {KEL_PIXEL_TYPE_U8G,   KEL_PIXEL_TYPE_S16G,   KEL_PIXEL_TYPE_U8XYZ, KEL_PIXEL_TYPE_U8XYZA,
                         KEL_PIXEL_TYPE_U8ZYX, KEL_PIXEL_TYPE_U8ZYXA, KEL_PIXEL_TYPE_U8YUV};
    for (const int type : types) {
        Image other(view->width + 40, view->height, type);
        other->width = view->width;
        std::memset(other->data, 201, static_cast<size_t>(other->size));
        const bool wide = type == KEL_PIXEL_TYPE_S16G;
        const int pixel = other->channels * other->depth, last = type == KEL_PIXEL_TYPE_U8XYZA || type == KEL_PIXEL_TYPE_U8ZYXA;
        for (int y = 0; y < view->height; ++y)
            for (int x = 0; x < view->width; ++x) {
                uint8_t* const p = other.row(y) + x * pixel;
                const uint8_t grey = view.row(y)[x];
                if (type == KEL_PIXEL_TYPE_U8YUV)
                    p[1] = grey;
                else if (wide)
                    reinterpret_cast<int16_t*>(p)[0] = static_cast<int16_t>(100 * grey - 9000);
                else
                    std::fill_n(p, pixel - last, grey);
            }
        std::srand(1);
        const Result r = registerPictures(scene().get(), other.get());
        ASSERT_TRUE(r.found) << type << ' ' << r.reason;
        EXPECT_LT(meanError(planeOf(r.H), planeOf(expected.H), scene().get(), view.get()), wide ? 0.05 : 1e-9) << type;
    }
}

Image painted(int width, int height, int type, const std::function<int(int, int)>& value) {
    Image image(width, height, type);
    clearKelImage(image.get());
    for (int y = 0; y < height && type == KEL_PIXEL_TYPE_U8G; ++y)
        for (int x = 0; x < width; ++x)
            image.row(y)[x] = static_cast<uint8_t>(value(x, y));
    return image;
}

TEST(Register, RefusesInWordsWhatCannotBeRegistered) {
    const auto flat = [](int, int) { return 99; };
    struct {
        int width, height, type;
        const char* reason;
    } const table[] = {
        {1, 1, KEL_PIXEL_TYPE_U8G, "the first picture is too small: 1 x 1 pixels, at least 40 either way are needed"},
        {1, 5000, KEL_PIXEL_TYPE_U8XYZ, "the first picture is too small: 1 x 5000 pixels, at least 40 either way are needed"},
        {39, 400, KEL_PIXEL_TYPE_U8YUV, "the first picture is too small: 39 x 400 pixels, at least 40 either way are needed"},
        {64, 64, KEL_PIXEL_TYPE_F32G, "the first picture has pixel type 6, which cannot be registered"},
        {64, 64, KEL_PIXEL_TYPE_S8XYZ, "the first picture has pixel type 9, which cannot be registered"},
        {40, 40, KEL_PIXEL_TYPE_U8G, "only 0 matches that support each other of 0"},
        {40, 3000, KEL_PIXEL_TYPE_S16G, "only 0 matches that support each other of 0"},
        {41, 30000, KEL_PIXEL_TYPE_U8XYZ, "only 0 matches that support each other of 0"},
        {3000, 41, KEL_PIXEL_TYPE_U8ZYXA, "only 0 matches that support each other of 0"},
    };
    for (const auto& row : table) {
        const Image picture = painted(row.width, row.height, row.type, flat);
        const Result r = registerPictures(picture.get(), scene().get());
        EXPECT_FALSE(r.found);
        EXPECT_EQ(r.reason, row.reason);
        EXPECT_FALSE(r.H.m_IsCreated);
        std::string mirrored = row.reason, reason;
        if (mirrored.find("first") != std::string::npos)
            mirrored.replace(mirrored.find("first"), 5, "second");
        EXPECT_EQ(registerPictures(scene().get(), picture.get()).reason, mirrored);
        EXPECT_TRUE(kelRegister::findFeatures(picture.get(), Options(), &reason).empty());
        EXPECT_EQ(reason.empty(), std::string(row.reason).find("picture") == std::string::npos);
    }
    kelImage_t* header = createKelImageHeader(100, 100, KEL_PIXEL_TYPE_U8G);
    header->data = nullptr;
    EXPECT_EQ(registerPictures(header, scene().get()).reason, "the first picture has no pixels");
    releaseKelImageHeader(&header);
    const std::function<void(Options&)> faults[] = {
        [](Options& o) { o.threshold = 0; }, [](Options& o) { o.threshold = std::numeric_limits<float>::quiet_NaN(); },
        [](Options& o) { o.mostFeatures = -1; }, [](Options& o) { o.workingSize = 0; }};
    for (const auto& fault : faults) {
        Options options;
        fault(options);
        EXPECT_NE(registerPictures(scene().get(), scene().get(), options).reason.find(" is not between "), std::string::npos);
    }
}

TEST(Register, RefusesPicturesThatDoNotBelongTogether) {
    KEL_NOT_UNDER_VALGRIND("many pairs, the same code");
    std::mt19937 numbers(6);
    const auto noise = [&](int, int) { return static_cast<int>(numbers() % 256); };
    const auto checks = [](int x, int y) { return (x / 16 + y / 16) % 2 ? 200 : 60; };
    const auto larger = [](int x, int y) { return (x / 40 + y / 40) % 2 ? 220 : 40; };
    const auto dots = [](int x, int y) { return std::hypot(x % 32 - 16, y % 32 - 16) < 8 ? 240 : 20; };
    const auto ramp = [](int x, int y) { return (x + y) / 5; };
    std::vector<Image> pictures;
    for (const auto& value :
         {std::function<int(int, int)>(noise), std::function<int(int, int)>(noise), {checks}, {larger}, {dots}, {ramp}})
        pictures.push_back(painted(640, 480, KEL_PIXEL_TYPE_U8G, value));
    for (const unsigned seed : {1u, 2u, 3u})
        pictures.push_back(drawnScene(640, 480, seed));
    const size_t every = std::getenv("KEL_FEWER_PAIRS") ? 7 : 1; // where each takes seconds
    for (size_t i = 0; i < pictures.size(); ++i)
        for (size_t j = 0; j < pictures.size(); ++j)
            if (i != j && (i + j) % every == 0) {
                const Result r = registerPictures(pictures[i].get(), pictures[j].get());
                EXPECT_FALSE(r.found) << i << ' ' << j;
                EXPECT_FALSE(r.reason.empty());
                EXPECT_TRUE(std::none_of(r.matches.begin(), r.matches.end(), [](const Match& m) { return m.inlier; }));
            }
}

TEST(Register, FeaturesFollowTheOptions) {
    Options options;
    for (const int most : {50, 100, 400}) {
        options.mostFeatures = most;
        std::set<std::array<float, 3>> keypoints;
        for (const Feature& f : kelRegister::findFeatures(scene().get(), options))
            keypoints.insert({f.x, f.y, f.scale});
        EXPECT_EQ(keypoints.size(), static_cast<size_t>(most));
    }
    for (const Feature& f : kelRegister::findFeatures(scene().get())) {
        ASSERT_TRUE(f.x >= 0 && f.y >= 0 && f.x < 640 && f.y < 480 && f.scale >= 1 && f.squeeze == 1 && f.score >= 26);
        ASSERT_TRUE(f.angle >= -0.2f && f.angle < 6.5f);
    }
}

// Matches against their definition, in plain loops.
TEST(Register, MatchesAreMutualAndStandOut) {
    std::mt19937 numbers(3);
    const auto some = [&](int count) {
        std::vector<Feature> features(static_cast<size_t>(count));
        for (Feature& f : features) {
            f = Feature{static_cast<float>(numbers() % 60), static_cast<float>(numbers() % 60), 1, 0, 1, 0, 30, {}};
            for (unsigned char& value : f.descriptor) // few kinds, so that neighbours and ties exist
                value = static_cast<unsigned char>((&f - features.data()) % 9 * 20 + numbers() % 30);
        }
        return features;
    };
    const auto distance = [](const Feature& a, const Feature& b) {
        int sum = 0;
        for (int i = 0; i < 128; ++i)
            sum += std::abs(a.descriptor[i] - b.descriptor[i]);
        return sum;
    };
    const auto apart = [](const Feature& a, const Feature& b) { return std::hypot(a.x - b.x, a.y - b.y) >= 6; };
    for (const int count : {0, 1, 3, 61, 130}) {
        const std::vector<Feature> first = some(count), second = some(count + 2);
        for (const Match& m : kelRegister::matchFeatures(first, second)) {
            const Feature &a = first[m.first], &b = second[m.second];
            const int own = distance(a, b);
            EXPECT_FALSE(m.inlier);
            for (const Feature& other : second)
                EXPECT_TRUE(distance(a, other) >= own && (!apart(other, b) || own < 0.95 * distance(a, other)));
            for (const Feature& other : first)
                EXPECT_TRUE(distance(other, b) >= own && (!apart(other, a) || own < 0.95 * distance(other, b)));
        }
    }
    const std::vector<Feature> all = kelRegister::findFeatures(scene().get());
    const std::vector<Match> matches = kelRegister::matchFeatures(all, all);
    EXPECT_GT(matches.size(), all.size() / 5); // a picture and itself, repeats of a place left out
    for (const Match& m : matches)
        EXPECT_FALSE(apart(all[m.first], all[m.second]));
}

} // namespace
