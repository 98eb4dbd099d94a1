// Prepared pictures as bytes and back. The header gives the layout; sizes and places of levels follow from the picture's size, so
// that no bytes lead outside of it.
#include <algorithm>
#include <cstring>

#include "kelRegister_Private.h"

namespace kelRegister {

namespace {

static_assert(__BYTE_ORDER__ == __ORDER_LITTLE_ENDIAN__, "numbers are stored as they lie in memory");
static_assert(sizeof(Feature) == 156, "features have no gaps");

constexpr char kMark[] = {'k', 'e', 'l', 'R', 'e', 'a', 'd', 'y'};
constexpr int32_t kForm = 1;
constexpr int kLeastFeatures = 50, kMostFeatures = 5000; // that may have been asked for

struct Head {
    char mark[sizeof kMark];
    int32_t form, width, height, halvings, mostFeatures, features;
};
static_assert(sizeof(Head) == 32, "the head has no gaps");

// FNV-1a (G. Fowler, L. C. Noll and K.-P. Vo) by words of 64 bits, the last one filled up with zeros.
uint64_t hashOf(const unsigned char* bytes, size_t size) {
    uint64_t hash = 0xcbf29ce484222325;
    for (size_t i = 0; i < size; i += 8) {
        uint64_t word = 0;
        std::memcpy(&word, bytes + i, std::min<size_t>(8, size - i));
        hash = (hash ^ word) * 0x100000001b3;
    }
    return hash;
}

// Calls f(row, bytes) for the rows of all images that are stored.
template <class F> void forEachRow(const Pyramid& pyramid, F f) {
    const auto rows = [&](const Image& image) {
        for (int y = 0; y < image->height; ++y)
            f(rowOf(image.get(), y), static_cast<size_t>(image->width));
    };
    rows(pyramid.working);
    for (const Level& level : pyramid.levels)
        rows(level.smooth);
}

size_t pixelsOf(const Pyramid& pyramid) {
    size_t sum = 0;
    forEachRow(pyramid, [&](const uint8_t*, size_t bytes) { sum += bytes; });
    return sum;
}

Ready refused(const std::string& reason) {
    Ready ready;
    ready.reason = reason;
    return ready;
}

} // namespace

std::vector<unsigned char> store(const Ready& ready) {
    const Pyramid& pyramid = ready.pyramid;
    Head head = {{},
                 kForm,
                 pyramid.width,
                 pyramid.height,
                 static_cast<int32_t>(pyramid.firstWorking),
                 ready.mostFeatures,
                 static_cast<int32_t>(ready.features.size())};
    std::memcpy(head.mark, kMark, sizeof kMark);
    const size_t features = ready.features.size() * sizeof(Feature);
    std::vector<unsigned char> bytes(sizeof head + pixelsOf(pyramid) + features + sizeof(uint64_t));
    unsigned char* to = bytes.data();
    const auto put = [&](const void* from, size_t size) {
        std::memcpy(to, from, size);
        to += size;
    };
    put(&head, sizeof head);
    forEachRow(pyramid, put);
    if (features > 0)
        put(ready.features.data(), features);
    const uint64_t hash = hashOf(bytes.data(), bytes.size() - sizeof hash);
    put(&hash, sizeof hash);
    return bytes;
}

Ready restored(const unsigned char* bytes, size_t size) {
    Head head;
    if (size < sizeof head || std::memcmp(bytes, kMark, sizeof kMark) != 0)
        return refused("the bytes are no prepared picture");
    std::memcpy(&head, bytes, sizeof head);
    if (head.form != kForm)
        return refused("the prepared picture is of form " + std::to_string(head.form) + ", this library reads form " +
                       std::to_string(kForm));
    uint64_t hash;
    std::memcpy(&hash, bytes + size - sizeof hash, sizeof hash);
    if (hash != hashOf(bytes, size - sizeof hash))
        return refused("the prepared picture is cut or was changed");

    // Whoever wrote this meant it; that it came from store() is not said yet.
    const std::string wrong = "the prepared picture contradicts itself";
    if (!whyUnusable(head.width, head.height, "").empty() || !canBeHalved(head.width, head.height, head.halvings) ||
        head.mostFeatures < kLeastFeatures || head.mostFeatures > kMostFeatures || head.features < 0 ||
        static_cast<size_t>(head.width) * static_cast<size_t>(head.height) > size)
        return refused(wrong);
    Ready ready;
    ready.pyramid = blankPyramid(head.width, head.height, head.halvings);
    ready.mostFeatures = head.mostFeatures;
    const size_t count = static_cast<size_t>(head.features);
    if (size != sizeof head + pixelsOf(ready.pyramid) + count * sizeof(Feature) + sizeof hash)
        return refused(wrong);
    const unsigned char* from = bytes + sizeof head;
    const auto take = [&](void* to, size_t n) {
        std::memcpy(to, from, n);
        from += n;
    };
    forEachRow(ready.pyramid, take);
    ready.features.resize(count);
    if (count > 0)
        take(ready.features.data(), count * sizeof(Feature));
    for (const Feature& f : ready.features)
        if (!(f.x >= 0 && f.y >= 0 && f.x < static_cast<float>(head.width) && f.y < static_cast<float>(head.height)))
            return refused(wrong);
    return ready;
}

} // namespace kelRegister
