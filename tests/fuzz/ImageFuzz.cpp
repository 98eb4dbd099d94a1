// Image operations beside their references, within their preconditions.
#include <algorithm>
#include <cstring>
#include <kel/kelImage.h>

#include "Fuzz.h"
#include "ImageOperations.h"
#include "TransformReference.h"
#include "YapeReference.h"

using kel_fuzz::Input;
using kel_fuzz::Twins;

namespace {

constexpr int kTypes[] = {0, 3, 8, 16, 24, 32, 40};

int someType(Input& input) {
    const int choice = input.byte();
    return choice < 240 ? kTypes[choice % 7] : choice % 48;
}
int someSize(Input& input) {
    const int choice = input.byte();
    return choice < 200 ? choice % 71 : choice - 100;
}

// Any operation of the list, on images of any size and contents.
void operation(Input& input) {
    const auto& all = kel_test::imageOperations();
    const kel_test::ImageOperation& o = all[(input.byte() | input.byte() << 8) % all.size()];
    const kel_test::Size src = {std::max(someSize(input), o.leastWidth), std::max(input.between(0, 60), o.leastWidth)};
    const int parameter = o.parameters[input.byte() % o.parameters.size()];
    const kel_test::Size dst = o.size(src, parameter);
    if (dst.width < 0 || dst.height < 0)
        return;
    Twins from(input, src.width, src.height, o.from, o.behind),
        to(input, dst.width, dst.height, o.to, kel_test::roomFor(o, dst) / o.room * (o.room - 1)),
        tmp(input, src.width, src.height, std::max(o.tmp, 0)), half(input, (src.width + 1) / 2, (src.height + 1) / 2, 0);
    const bool inPlace = o.inPlace && input.byte() % 4 == 0, withHalf = o.half && input.byte() % 2;
    const unsigned seed = input.word();
    const auto call = [&](const kel_test::ImageCall& function, kel_fuzz::Image Twins::*which) {
        srand(seed);
        function({inPlace ? (from.*which).get() : (to.*which).get(), (from.*which).get(), (tmp.*which).get(),
                  withHalf ? (half.*which).get() : nullptr, parameter});
        return rand();
    };
    if (call(o.call, &Twins::lib) != call(o.reference, &Twins::ref))
        kel_fuzz::fail((o.name + ": draws").c_str());
    for (const Twins* images : {&from, &to, &tmp, &half})
        images->expectEqual(o.name.c_str());
}

void keypoints(Input& input) {
    const int width = input.between(0, 90), height = input.between(0, 60), max = input.between(0, 200);
    Twins grey(input, width, height, 0), response(input, width, height, 3);
    if (input.byte() % 2) // responses of the usual size
        for (int i = 0; i < response.lib->size / 2; ++i) {
            int16_t& value = reinterpret_cast<int16_t*>(response.lib->data)[i];
            value = static_cast<int16_t>(value % 256);
        }
    std::vector<kelKeypoint2DF32_t> lib(static_cast<size_t>(max)), ref(lib);
    kel_ref::YapeTally tally;
    const int count = applyKelDetectorKeypointYape(lib.data(), max, grey.lib.get(), response.lib.get());
    if (count != kel_ref::yape(ref.data(), max, grey.lib.get(), response.lib.get(), tally))
        kel_fuzz::fail("number of keypoints");
    for (int i = 0; i < count; ++i)
        if (std::memcmp(&lib[i], &ref[i], sizeof lib[i]) != 0)
            kel_fuzz::fail("keypoint");
}

void warp(Input& input) {
    const int type = someType(input);
    Twins src(input, someSize(input), input.between(0, 40), type), dst(input, someSize(input), input.between(0, 40), type);
    float h[9];
    for (int i = 0; i < 9; ++i)
        h[i] = i < 8 || input.byte() % 2 ? input.number() / (i >= 6 ? 64 : 1) : 1;
    rotateKelImageHomography(dst.lib.get(), src.lib.get(), h[0], h[1], h[2], h[3], h[4], h[5], h[6], h[7], h[8]);
    kel_ref::warp(dst.ref.get(), src.ref.get(), h);
    dst.expectEqual("rotateKelImageHomography");
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    Input input(data, size);
    void (*const targets[])(Input&) = {operation, operation, operation, operation, keypoints, warp};
    targets[input.byte() % (sizeof targets / sizeof *targets)](input);
    return 0;
}
