// Every image operation of the list beside its reference, byte for byte, padding, margins and neighbours included; and under
// valgrind, with nothing but its source's pixels determined.
#include <cfenv>
#include <climits>
#include <cstdlib>
#include <set>

#include "ImageScene.h"
#include "PointReference.h"
#include "Sweep.h"
#include "TransformReference.h"

namespace {

using namespace kel_test;

// Some way to call an operation on a source of this size.
Setting any(const ImageOperation& o, Size src) {
    static std::mt19937 random = generator(7);
    Setting s = {src, o.parameters[random() % o.parameters.size()]};
    s.guard = random() % 2 ? Guard::Behind : Guard::Before;
    s.fill = random() % 3 ? Fill::Random : kFills[random() % std::size(kFills)];
    s.inPlace = o.inPlace && random() % 3 == 0;
    s.half = o.half && random() % 4 ? 16 * (random() % 2) : -1;
    s.spare = random() % 4 ? 0 : 4; // data need no more alignment than their elements
    return s;
}

// Runs check(operation) for all of the list.
template <class Check> void forEveryOperation(Check check) {
    for (const ImageOperation& o : imageOperations()) {
        SCOPED_TRACE(o.name);
        check(o);
    }
}

} // namespace

TEST(ImageOperations, EqualTheirReferencesAtEverySize) {
    forEveryOperation([](const ImageOperation& o) {
        size_t round = 0;
        const size_t count = RUNNING_ON_VALGRIND ? 1 : std::min<size_t>(o.heights.size(), 5);
        for (int width : widths())
            for (size_t i = 0; i < count; ++i, ++round)
                if (round % o.stride == 0) {
                    ASSERT_TRUE(agrees(o, any(o, {width, o.heights[round % o.heights.size()]})));
                }
    });
}

TEST(ImageOperations, EqualTheirReferencesOnEveryFillAndParameter) {
    KEL_NOT_UNDER_VALGRIND("it adds only time");
    forEveryOperation([](const ImageOperation& o) {
        for (Fill fill : kFills)
            for (int parameter : o.parameters)
                for (int width : {48, 83, 203}) {
                    Setting setting = any(o, {width, 41});
                    setting.fill = fill;
                    setting.parameter = parameter;
                    ASSERT_TRUE(agrees(o, setting));
                }
    });
}

// 7x7 goes by the scratch image's extent and reads the source's memory as far as that makes it.
TEST(ImageOperations, TakeALargerScratchImage) {
    forEveryOperation([](const ImageOperation& o) {
        for (int width : {10, 16, 17, 24, 25, 32, 40})
            for (int height : {3, 6, 7, 12})
                for (int wider : {0, 1, 7, 8, 16, 23})
                    for (int higher : {0, 1, 5})
                        if (o.tmp != kNoType) {
                            Setting setting = any(o, {width, height});
                            setting.scratch = {wider, higher};
                            setting.spare = 6 * 64 + 64;
                            ASSERT_TRUE(agrees(o, setting));
                        }
    });
}

TEST(ImageOperations, GoByTheDestinationsSizeWhereTheyCheckNone) {
    forEveryOperation([](const ImageOperation& o) {
        for (Size dst : {Size{1, 4}, Size{15, 2}, Size{20, 9}, Size{33, 41}, Size{70, 40}}) {
            Setting setting = any(o, {70, 50});
            setting.dst = dst;
            if (!o.checked && !setting.inPlace) {
                ASSERT_TRUE(agrees(o, setting));
            }
        }
    });
}

// Data areas that end with the last row's last pixel instead of its padding.
TEST(ImageOperations, NeedNoPaddingWhereTheyPromiseIt) {
    forEveryOperation([](const ImageOperation& o) {
        for (int width : widths()) {
            Setting setting = any(o, {width, 3});
            setting.guard = Guard::Behind;
            setting.spare = -1;
            if (o.withinPixels && width > 0 && o.size(setting.src, setting.parameter).height > 0) {
                ASSERT_TRUE(agrees(o, setting));
            }
        }
    });
}

TEST(ImageOperations, DoNothingToNegativeHeights) {
    const Image memory(64, 64, 0);
    const Bytes before = memory.bytes();
    forEveryOperation([&](const ImageOperation& o) {
        for (int height : {INT_MIN, INT_MIN + 2, -1})
            if (const Size same = o.size({40, 40}, o.parameters[0]);
                same.width == 40 && same.height == 40 && o.leastWidth < 1) {
                kelImage_t* images[] = {createKelImageHeader(40, height, o.to), createKelImageHeader(40, height, o.from),
                                        createKelImageHeader(40, height, std::max(o.tmp, 0))};
                for (kelImage_t* image : images)
                    image->data = memory.data() + 2048;
                o.call({images[0], images[1], images[2], nullptr, o.parameters[0]});
                EXPECT_TRUE(holds(memory, before)) << height;
                for (kelImage_t* image : images)
                    releaseKelImageHeader(&image);
            }
    });
}

TEST(ImageOperations, FollowTheThreadsRoundingMode) {
    forEveryOperation([](const ImageOperation& o) {
        for (const RoundingMode& mode : kRoundingModes)
            for (int width : {301, 1024})
                if (o.rounds) {
                    ASSERT_TRUE(agrees(o, any(o, {width, 30}), mode.mode)) << "rounding " << mode.name;
                }
    });
}

TEST(ImageOperations, LeaveImagesOfOtherTypesAlone) {
    std::set<std::pair<std::string, int>> handled;
    for (const ImageOperation& o : imageOperations())
        handled.insert({o.function(), o.from});
    forEveryOperation([&](const ImageOperation& o) {
        for (int type = -1; o.byType && type < 50; ++type)
            if (!handled.count({o.function(), type})) {
                const Setting setting = {{41, 40}, o.parameters[0]};
                const Scene untouched(o, setting, type), images(o, setting, type);
                srand(42);
                const int next = rand();
                srand(42);
                images.apply(o.call);
                EXPECT_TRUE(images.equals(untouched)) << "type " << type;
                EXPECT_EQ(rand(), next) << "type " << type;
            }
    });
}

// Nothing but the source's pixels is determined: no byte beside them decides anything, or reaches what is documented to be free of
// it.
TEST(ImageOperations, DecideNothingByIndeterminateBytes) {
    if (!RUNNING_ON_VALGRIND)
        GTEST_SKIP() << "valgrind has something to say here";
    forEveryOperation([](const ImageOperation& o) {
        if (o.settledWidth == 0)
            return;
        const Setting setting = {{o.settledWidth, 50}, o.parameters[0]};
        const Scene images(o, setting, o.from);
        images.makeIndeterminate();
        images.apply(o.call);
        if (o.room == 1) {
            EXPECT_TRUE(images.isSettled());
        }
    });
}
