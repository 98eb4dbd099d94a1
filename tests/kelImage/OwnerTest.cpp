// kel::Image, the owner of <kel/kelImage.hpp>: pitches in bytes, crops, moves, and what it refuses.
#include <gtest/gtest.h>
#include <kel/kelImage.hpp>
#include <numeric>
#include <type_traits>
#include <vector>

namespace {

static_assert(std::is_nothrow_move_constructible<kel::Image>::value && std::is_nothrow_move_assignable<kel::Image>::value, "");
static_assert(!std::is_copy_constructible<kel::Image>::value && !std::is_copy_assignable<kel::Image>::value, "");

std::vector<unsigned char> ramp(size_t size) {
    std::vector<unsigned char> bytes(size);
    std::iota(bytes.begin(), bytes.end(), static_cast<unsigned char>(1));
    return bytes;
}

} // namespace

TEST(Owner, LoadsCropsAndStoresAtAnyPitchInBytes) {
    const int types[] = {KEL_PIXEL_TYPE_U8G,    KEL_PIXEL_TYPE_S16G, KEL_PIXEL_TYPE_U8XYZ,
                         KEL_PIXEL_TYPE_U8ZYXA, KEL_PIXEL_TYPE_F64G, KEL_PIXEL_TYPE_U8YUV};
    for (const int type : types)
        for (const int width : {1, 7, 16, 33}) {
            kel::Image image(width, 3, type);
            const size_t row = image.rowBytes(), pixel = image.pixelBytes(), pitch = row + 5;
            ASSERT_EQ(row, (static_cast<size_t>(width) + (type == KEL_PIXEL_TYPE_U8YUV ? width % 2 : 0)) * pixel);
            clearKelImage(image.get());
            const std::vector<unsigned char> in = ramp(3 * pitch);
            image.load(in.data(), static_cast<ptrdiff_t>(pitch));
            for (int y = 0; y < 3; ++y)
                for (size_t i = 0; i < static_cast<size_t>(image->step) * pixel; ++i)
                    ASSERT_EQ(image->data[y * image->step * static_cast<int>(pixel) + static_cast<int>(i)],
                              i < row ? in[static_cast<size_t>(y) * pitch + i] : 0);
            std::vector<unsigned char> out(3 * pitch, 99), upsideDown(3 * pitch, 99);
            image.store(out.data(), static_cast<ptrdiff_t>(pitch));
            image.clone().store(&upsideDown[2 * pitch], -static_cast<ptrdiff_t>(pitch));
            for (size_t y = 0; y < 3; ++y)
                for (size_t i = 0; i < pitch; ++i) {
                    ASSERT_EQ(out[y * pitch + i], i < row ? in[y * pitch + i] : 99);
                    ASSERT_EQ(upsideDown[(2 - y) * pitch + i], i < row ? in[y * pitch + i] : 99);
                }
            if (width < 7)
                continue;
            const kel::Image part = image.crop(2, 1, width - 4, 2);
            EXPECT_EQ(part->width, width - 4);
            EXPECT_EQ(part->height, 2);
            EXPECT_EQ(part->type, type);
            for (size_t i = 0; i < part.rowBytes(); ++i)
                ASSERT_EQ(part.row(1)[i], in[2 * pitch + 2 * pixel + i]);
        }
}

TEST(Owner, HandsItsImageOver) {
    kel::Image none, first(5, 4, KEL_PIXEL_TYPE_U8G);
    EXPECT_FALSE(none);
    EXPECT_FALSE(none.clone());
    kelImage_t* const record = first.get();
    kel::Image second(std::move(first));
    EXPECT_EQ(second.get(), record);
    none = std::move(second);
    EXPECT_EQ(none.get(), record);
    none = kel::Image(2, 2, KEL_PIXEL_TYPE_U8G); // the old one is freed here, as the sanitizers see
    kel::Image adopted(createKelImage(3, 3, KEL_PIXEL_TYPE_U8G));
    kelImage_t* given = adopted.release();
    EXPECT_FALSE(adopted);
    releaseKelImage(&given);
}

TEST(Owner, RefusesWhatCannotBe) {
    const int sizes[][3] = {{0, 1, 0},  {1, 0, 0},         {-1, 5, 0},        {5, 5, -1},
                            {5, 5, 48}, {INT32_MAX, 1, 0}, {50000, 50000, 0}, {1 << 15, 1 << 14, 16}};
    for (const auto& size : sizes)
        EXPECT_THROW(kel::Image(size[0], size[1], size[2]), std::invalid_argument)
            << size[0] << " " << size[1] << " " << size[2];
    kel::Image image(10, 6, KEL_PIXEL_TYPE_U8YUV);
    const int crops[][4] = {{-2, 0, 4, 4}, {0, -1, 4, 4}, {8, 0, 4, 4}, {0, 3, 4, 4},
                            {0, 0, 0, 4},  {0, 0, 4, 0},  {1, 0, 4, 4}, {2, 0, INT32_MAX, 1}};
    for (const auto& crop : crops)
        EXPECT_THROW(image.crop(crop[0], crop[1], crop[2], crop[3]), std::out_of_range) << crop[0] << " " << crop[1];
    std::vector<unsigned char> bytes(200);
    EXPECT_THROW(image.load(bytes.data(), 19), std::invalid_argument);
    EXPECT_THROW(image.store(bytes.data(), -19), std::invalid_argument);
}
