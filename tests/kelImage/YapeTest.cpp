// YAPE keypoints beside a plain walk over the pixels, and cases worked out by hand.
#include <cstring>
#include <gtest/gtest.h>

#include "GuardedImage.h"
#include "Stops.h"
#include "YapeReference.h"

using kel_test::Bytes;
using kel_test::Fill;
using kel_test::Guard;
using kel_test::Image;

namespace {

using Keypoints = std::vector<kelKeypoint2DF32_t>;

// A detector's records; the array behind the first `max` must stay as it was.
template <class Detector> Keypoints detected(Detector detect, int max) {
    const kelKeypoint2DF32_t untouched{-7, -7, -7, -7};
    Keypoints found(static_cast<size_t>(std::max(max, 0)) + 4, untouched);
    const int count = detect(found.data());
    EXPECT_LE(count, std::max(max, 0));
    for (size_t i = static_cast<size_t>(count); i < found.size(); ++i)
        EXPECT_EQ(found[i].tag, -7) << "record " << i << " of " << count;
    found.resize(static_cast<size_t>(count));
    return found;
}

testing::AssertionResult sameBits(const Keypoints& actual, const Keypoints& expected) {
    if (actual.size() != expected.size())
        return testing::AssertionFailure() << actual.size() << " keypoints, expected " << expected.size();
    for (size_t i = 0; i < actual.size(); ++i)
        if (std::memcmp(&actual[i], &expected[i], sizeof actual[i]) != 0)
            return testing::AssertionFailure()
                   << "keypoint " << i << " is (" << actual[i].x << ", " << actual[i].y << ", " << actual[i].score << ", "
                   << actual[i].tag << "), expected (" << expected[i].x << ", " << expected[i].y << ", " << expected[i].score
                   << ", " << expected[i].tag << ")";
    return testing::AssertionSuccess();
}

testing::AssertionResult equalsReference(const Image& gaussian, const Image& laplacian, int max, kel_ref::YapeTally& tally) {
    const Bytes g = gaussian.bytes(), l = laplacian.bytes();
    const Keypoints expected =
        detected([&](kelKeypoint2DF32_t* out) { return kel_ref::yape(out, max, gaussian.get(), laplacian.get(), tally); }, max);
    const Keypoints actual = detected(
        [&](kelKeypoint2DF32_t* out) { return applyKelDetectorKeypointYape(out, max, gaussian.get(), laplacian.get()); }, max);
    const testing::AssertionResult same = sameBits(actual, expected);
    return !same ? same : !holds(gaussian, g) ? holds(gaussian, g) : holds(laplacian, l);
}

// Responses for every gate: weak runs of both parities between values on either side of the thresholds.
void fillGates(const Image& laplacian, uint32_t salt) {
    const int16_t values[] = {0, 0, 5, 19, -19, 20, -20, 25, 30, -30, 31, -31, 32, 45, -60, 100, 400, -1020};
    std::mt19937 random = kel_test::generator(salt);
    const unsigned range = random() % 2 ? 18 : 12;
    const unsigned calm = 1 + random() % 8;
    int16_t* const data = reinterpret_cast<int16_t*>(laplacian.data());
    for (size_t i = 0; i < laplacian.size() / 2; ++i)
        data[i] = random() % calm ? values[random() % 5] : values[random() % range];
}

// Waves, smooth enough that refinement converges, moves on or wanders off.
void fillWaves(const Image& laplacian, uint32_t salt) {
    std::mt19937 random = kel_test::generator(salt);
    const double fx = 0.1 + random() % 100 * 0.01, fy = 0.1 + random() % 100 * 0.01, cross = random() % 100 * 0.01;
    for (int y = 0; y < laplacian->height; ++y)
        for (int x = 0; x < laplacian->step; ++x)
            laplacian.at<int16_t>(x, y) =
                static_cast<int16_t>(400 * std::sin(x * fx + y * cross) * std::cos(y * fy) + random() % 30);
}

struct Frame {
    Frame(int width, int height) : gaussian(width, height, KEL_PIXEL_TYPE_U8G), laplacian(width, height, KEL_PIXEL_TYPE_S16G) {
        gaussian.set(Bytes(gaussian.size(), 90));
        laplacian.fill(Fill::Zero, 0);
    }
    int16_t& response(int x, int y) { return laplacian.at<int16_t>(x, y); }
    Keypoints keypoints(int max = 100) {
        return detected(
            [&](kelKeypoint2DF32_t* out) { return applyKelDetectorKeypointYape(out, max, gaussian.get(), laplacian.get()); },
            max);
    }
    Image gaussian, laplacian;
};

} // namespace

TEST(Yape, EqualsTheWalkAtEverySizeOnEveryKindOfResponse) {
    kel_ref::YapeTally tally;
    uint32_t salt = 0;
    for (int width = 15; width <= 90; ++width)
        for (int height : {0, 1, 18, 19, 20, 21, 26, 47}) {
            const Guard guard = ++salt % 2 ? Guard::Behind : Guard::Before;
            Image gaussian(width, height, KEL_PIXEL_TYPE_U8G, guard), laplacian(width, height, KEL_PIXEL_TYPE_S16G, guard);
            fillGates(laplacian, salt);
            ASSERT_TRUE(equalsReference(gaussian, laplacian, 2000, tally));
            gaussian.fill(Fill::Runs, salt);
            fillWaves(laplacian, salt);
            ASSERT_TRUE(equalsReference(gaussian, laplacian, 2000, tally));
            laplacian.fill(kel_test::kFills[salt % std::size(kel_test::kFills)], salt);
            ASSERT_TRUE(equalsReference(gaussian, laplacian, static_cast<int>(salt % 5) - 1, tally));
        }
    // The comparison is worth something only where every branch was taken.
    EXPECT_GT(tally.weakExtremum, 100);
    EXPECT_GT(tally.edge, 100);
    EXPECT_GT(tally.moved, 100);
    EXPECT_GT(tally.leftImage, 20);
    EXPECT_GT(tally.unfinished, 5);
    EXPECT_GT(tally.reset, 5);
    EXPECT_GT(tally.dropped, 100);
}

// Every pixel of a chessboard is beyond its direct neighbours; chance decides about the diagonal ones.
TEST(Yape, EqualsTheWalkWhereEveryPixelIsACandidate) {
    kel_ref::YapeTally tally;
    Image gaussian(700, 24, KEL_PIXEL_TYPE_U8G), laplacian(700, 24, KEL_PIXEL_TYPE_S16G);
    gaussian.fill(Fill::Runs, 1);
    std::mt19937 random = kel_test::generator(2);
    for (int y = 0; y < 24; ++y)
        for (int x = 0; x < laplacian->step; ++x)
            laplacian.at<int16_t>(x, y) = static_cast<int16_t>((x + y) % 2 ? 200 + random() % 90 : -200 - int(random() % 90));
    ASSERT_TRUE(equalsReference(gaussian, laplacian, 5000, tally));
    EXPECT_GT(tally.edge, 50);
}

// In a flat row columns 9, 11, 13, ... are examined; a strong column makes the scan go on with the next one.
TEST(Yape, StepsOverTheColumnAfterAWeakOne) {
    for (int x = 9; x < 40 - 9; ++x) {
        Frame frame(40, 30);
        frame.response(x, 15) = 100;
        const Keypoints found = frame.keypoints();
        const Keypoints expected{{static_cast<float>(x), 15, 100, -1}};
        EXPECT_TRUE(sameBits(found, x % 2 ? expected : Keypoints())) << "column " << x;
        frame.response(x - 1, 15) = 20; // strong enough to be no gap, too weak to be a point
        EXPECT_EQ(frame.keypoints().size(), 1u) << "column " << x;
        frame.response(x - 1, 15) = 19;
        EXPECT_EQ(frame.keypoints().size(), x % 2 ? 1u : 0u) << "column " << x;
    }
}

// e of the edge test: a from the diagonals at distance 3, b from the axes at distance 5, sqrt(b^2 + 4a^2) truncated.
TEST(Yape, TakesTheWeakerCurvatureForTheScore) {
    struct {
        int dx, dy, brighter, response, score; // score 0: rejected
    } const cases[] = {
        {3, 3, 10, 100, 80},   {-3, 3, 10, 100, 80},  {3, -3, 37, 100, 26},  {-3, -3, 37, -100, 26},
        {3, 3, 38, 100, 0},    {5, 0, 74, 100, 26},   {0, 5, 74, -100, 26},  {-5, 0, 75, 100, 0},
        {0, -5, 150, 100, 50}, {5, 0, 165, -100, 65}, {4, 4, 165, 100, 100}, {1, 0, 165, 100, 100},
    };
    for (const auto& c : cases) {
        Frame frame(40, 30);
        frame.response(21, 15) = static_cast<int16_t>(c.response);
        frame.gaussian.at(21 + c.dx, 15 + c.dy) = static_cast<uint8_t>(90 + c.brighter);
        EXPECT_TRUE(sameBits(frame.keypoints(), c.score ? Keypoints{{21, 15, c.score, -1}} : Keypoints()))
            << c.dx << ", " << c.dy << ", " << c.brighter;
    }
    Frame frame(40, 30); // a = 10, b = 7: sqrt(449) = 21.19
    frame.response(21, 15) = 100;
    frame.gaussian.at(24, 18) = 100;
    frame.gaussian.at(26, 15) = 97;
    EXPECT_TRUE(sameBits(frame.keypoints(), {{21, 15, 79, -1}}));
}

// With the peak at (x, y) dx = dy = 12, dxx = dyy = -36, dxy = 28: the first step is (1.5, 1.5), which moves on to
// (x+1, y+1). There dx = dy = 1, dxx = dyy = -8, dxy = 0: the last step is (0.125, 0.125), and it counts from (x, y). A move
// that enters the border ends the refinement without an offset.
TEST(Yape, AddsTheLastStepToThePixelWhereItStarted) {
    const int16_t around[4][4] = {{199, 170, 143, 0}, {170, 200, 194, 150}, {143, 194, 199, 196}, {0, 150, 196, 100}};
    struct {
        int x, y, toRight, toBottom; // 1 or -1
        bool leaves;
    } const cases[] = {
        {30, 20, 1, 1, false}, {30, 20, -1, 1, false}, {30, 20, 1, -1, false}, {49, 20, 1, 1, false},
        {50, 20, 1, 1, true},  {11, 20, -1, 1, false}, {10, 20, -1, 1, true},  {30, 29, 1, 1, false},
        {30, 30, 1, 1, true},  {30, 11, 1, -1, false}, {30, 10, 1, -1, true},
    };
    for (const auto& c : cases) {
        Frame frame(60, 40);
        for (int v = 0; v < 4; ++v)
            for (int u = 0; u < 4; ++u)
                frame.response(c.x + c.toRight * (u - 1), c.y + c.toBottom * (v - 1)) = around[v][u];
        const float offset = c.leaves ? 0 : 0.125f, x = static_cast<float>(c.x), y = static_cast<float>(c.y);
        const Keypoints expected{
            {x + offset * static_cast<float>(c.toRight), y + offset * static_cast<float>(c.toBottom), 200, -1}};
        EXPECT_TRUE(sameBits(frame.keypoints(), expected)) << c.x << ", " << c.y;
    }
}

TEST(Yape, FindsNothingWhereThereIsNothing) {
    EXPECT_TRUE(Frame(100, 60).keypoints().empty());
    for (int type = 1; type < 48; ++type) {
        Image gaussian(60, 40, type), laplacian(60, 40, KEL_PIXEL_TYPE_S16G);
        kelKeypoint2DF32_t point{1, 2, 3, 4};
        EXPECT_EQ(applyKelDetectorKeypointYape(&point, 1, gaussian.get(), laplacian.get()), 0);
        EXPECT_EQ(point.tag, 4);
    }
}

TEST(YapeDeath, StopsOnShapes) {
    Image gaussian(60, 40, KEL_PIXEL_TYPE_U8G), wide(61, 40, KEL_PIXEL_TYPE_S16G), high(60, 41, KEL_PIXEL_TYPE_S16G);
    for (const Image* laplacian : {&wide, &high})
        EXPECT_STOPS(applyKelDetectorKeypointYape(nullptr, 0, gaussian.get(), laplacian->get()),
                     "gaussian->width == laplacian->width && gaussian->height == laplacian->height",
                     "kelImage/src/kelImage_DetectorKeypointYape_c_legacy.cpp",
                     "kelValue_s32 applyKelDetectorKeypointYape(kelKeypoint2DF32_t*, kelValue_s32, kelImage_t*, kelImage_t*)");
}

// Padding decides nothing, not even which way a branch goes.
TEST(Yape, LooksAtPixelsOnly) {
    if (!RUNNING_ON_VALGRIND)
        GTEST_SKIP() << "valgrind has something to say here";
    for (int width : {60, 61, 70}) {
        const Image grey(width, 50, KEL_PIXEL_TYPE_U8G), response(width, 50, KEL_PIXEL_TYPE_S16G);
        for (int y = 0; y < 50; ++y) {
            VALGRIND_MAKE_MEM_UNDEFINED(&grey.at(width, y), grey->step - width);
            VALGRIND_MAKE_MEM_UNDEFINED(&response.at<int16_t>(width, y), 2 * (response->step - width));
        }
        kelKeypoint2DF32_t keypoints[500];
        const int count = applyKelDetectorKeypointYape(keypoints, 500, grey.get(), response.get());
        EXPECT_GT(count, 0);
        EXPECT_EQ(VALGRIND_CHECK_MEM_IS_DEFINED(keypoints, static_cast<size_t>(count) * sizeof keypoints[0]), 0u);
    }
}
