// Registration of any two pictures: an answer in words or one that can be used, never a stop; and the same for the same seed.
#include <cmath>
#include <kel/kelImage.hpp>
#include <kel/kelRegister.h>

#include "Fuzz.h"

namespace {

using namespace kel_fuzz;

// Any type, the unprocessed ones included, any small size; patterns of blocks, so that there are keypoints.
kel::Image anyPicture(Input& in) {
    static const int types[] = {KEL_PIXEL_TYPE_U8G,   KEL_PIXEL_TYPE_S16G,   KEL_PIXEL_TYPE_U8XYZ, KEL_PIXEL_TYPE_U8XYZA,
                                KEL_PIXEL_TYPE_U8ZYX, KEL_PIXEL_TYPE_U8ZYXA, KEL_PIXEL_TYPE_U8YUV};
    const int type = in.byte() < 250 ? types[in.between(0, 6)] : in.between(0, 47);
    const int width = in.byte() < 240 ? in.between(40, 200) : in.between(1, 45),
              height = in.byte() < 240 ? in.between(40, 200) : in.between(1, 45);
    kel::Image image(width, height, type);
    in.fill(image->data, static_cast<size_t>(image->size));
    const int block = in.between(1, 24);
    std::mt19937 numbers(in.word());
    std::vector<uint8_t> values(4096);
    for (uint8_t& value : values)
        value = static_cast<uint8_t>(numbers());
    if (in.byte() % 4)
        for (int y = 0; y < height; ++y)
            for (size_t x = 0; x < image.rowBytes(); ++x)
                image.row(y)[x] =
                    values[(x / (static_cast<size_t>(block) * image.pixelBytes()) * 31 + static_cast<size_t>(y / block) * 97) %
                           4096];
    return image;
}

void check(const kelRegister::Result& r) {
    if (r.found != r.reason.empty() || r.found != r.H.m_IsCreated || !(r.share >= 0 && r.share <= 1))
        fail("a result contradicts itself");
    for (int i = 0; r.found && i < 9; ++i)
        if (!std::isfinite(r.H.m_Data[i]))
            fail("a homography is not finite");
    for (const kelRegister::Match& m : r.matches)
        if (m.first < 0 || m.second < 0 || m.first >= static_cast<int>(r.first.size()) ||
            m.second >= static_cast<int>(r.second.size()))
            fail("a match joins what is not there");
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    Input in(data, size);
    const kel::Image first = anyPicture(in), second = in.byte() % 3 ? anyPicture(in) : first.clone();
    kelRegister::Options options;
    options.threshold = in.byte() < 200 ? 3 : in.number();
    options.mostFeatures = in.byte() < 200 ? 300 : in.between(-50, 200);
    options.workingSize = in.byte() < 128 ? 1000 : in.between(150, 300);
    const unsigned seed = in.word();
    std::srand(seed);
    const kelRegister::Result r = kelRegister::registerPictures(first.get(), second.get(), options);
    check(r);
    if (in.byte() % 4 == 0) {
        std::srand(seed);
        const kelRegister::Result again = kelRegister::registerPictures(first.get(), second.get(), options);
        if (again.found != r.found || again.reason != r.reason || (r.found && std::memcmp(again.H.m_Data, r.H.m_Data, 36) != 0))
            fail("the same seed gives something else");
    }
    return 0;
}
