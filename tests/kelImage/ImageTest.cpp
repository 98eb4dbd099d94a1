// Life cycle of images, load and store.
#include <algorithm>
#include <gtest/gtest.h>
#include <malloc.h>

#include "GuardedImage.h"
#include "TransformReference.h"
#include "Valgrind.h"

using kel_test::Bytes;
using kel_test::Fill;
using kel_test::Guard;
using kel_test::Image;

TEST(ImageRecord, DerivesChannelsDepthStepAndSizeOfEveryType) {
    const int channels[] = {1, 3, 4, 3, 4, 2}, bytes[] = {1, 1, 2, 2, 4, 4, 4, 8};
    for (int type = -2; type < 50; ++type)
        for (int width : {0, 1, 15, 16, 17, 33}) {
            kelImage_t* image = createKelImage(width, 3, type);
            const bool known = type >= 0 && type < 48;
            const int c = known ? channels[type / 8] : 0, d = known ? bytes[type % 8] : 0, step = (width + 15) / 16 * 16;
            EXPECT_EQ(image->type, type);
            EXPECT_EQ(image->width, width);
            EXPECT_EQ(image->height, 3);
            EXPECT_EQ(image->channels, c);
            EXPECT_EQ(image->depth, d);
            EXPECT_EQ(image->step, step);
            EXPECT_EQ(image->size, c * d * 3 * step);
            EXPECT_EQ(reinterpret_cast<uintptr_t>(image->data) % 16, 0u);
            const ptrdiff_t skipped = image->data - static_cast<unsigned char*>(image->buffer);
            EXPECT_GE(skipped, 0);
            EXPECT_LE(skipped, 15);
            clearKelImage(image);
            releaseKelImage(&image);
            EXPECT_EQ(image, nullptr);
            releaseKelImage(&image);
            releaseKelImageHeader(&image);
        }
}

TEST(ImageRecord, WrapsAbsurdSizes) {
    KEL_NOT_UNDER_VALGRIND("it wraps sizes that valgrind asks about");
    kelImage_t* image = createKelImageHeader(-20, 4, KEL_PIXEL_TYPE_U8G);
    EXPECT_EQ(image->step, 0) << "(-20 + 15) / 16 truncates toward zero";
    releaseKelImageHeader(&image);
    image = createKelImageHeader(INT32_MAX, 1, KEL_PIXEL_TYPE_U8G);
    EXPECT_EQ(image->step, -2147483632);
    releaseKelImageHeader(&image);
    image = createKelImageHeader(65536, 65536, KEL_PIXEL_TYPE_U8XYZA);
    EXPECT_EQ(image->size, 0);
    releaseKelImageHeader(&image);
    image = createKelImage(32768, 65536, KEL_PIXEL_TYPE_U8G);
    EXPECT_EQ(image->size, INT32_MIN);
    EXPECT_EQ(image->data, nullptr);
    EXPECT_EQ(image->buffer, nullptr);
    releaseKelImage(&image);
}

TEST(ImageRecord, GivesItsMemoryBack) {
    KEL_NOT_UNDER_VALGRIND("the test hands out memory itself");
    const size_t before = mallinfo2().hblkhd;
    kelImage_t* image = createKelImage(8192, 8192, KEL_PIXEL_TYPE_U8G); // so large that it is a mapping of its own
#if !defined(__SANITIZE_ADDRESS__) && !defined(__SANITIZE_THREAD__)
    EXPECT_GE(mallinfo2().hblkhd, before + 8192u * 8192u);
#endif
    releaseKelImage(&image);
    EXPECT_EQ(mallinfo2().hblkhd, before);
}

TEST(ImageRecord, CopiesClonesAndClearsPaddingToo) {
    Image src(17, 3, KEL_PIXEL_TYPE_U8XYZ), dst(17, 3, KEL_PIXEL_TYPE_U8XYZA);
    Bytes expected = dst.bytes();
    const Bytes source = src.bytes();
    std::copy(source.begin(), source.end(), expected.begin());
    copyKelImage(dst.get(), src.get());
    EXPECT_TRUE(holds(dst, expected));

    kelImage_t* clone = cloneKelImage(src.get());
    EXPECT_EQ(clone->type, src->type);
    EXPECT_EQ(clone->width, 17);
    EXPECT_EQ(clone->height, 3);
    EXPECT_EQ(Bytes(clone->data, clone->data + clone->size), source);
    releaseKelImage(&clone);

    clearKelImage(dst.get());
    EXPECT_TRUE(holds(dst, Bytes(dst.size(), 0)));
}

TEST(ImageData, LoadsAndStoresTheCommonCornerOnly) {
    for (int type = 0; type < 48; ++type)
        for (int width : {-1, 0, 1, 10, 16, 20})
            for (int height : {-1, 0, 1, 4, 8, 10})
                for (int pitch : {16, 20, 23}) {
                    Image image(16, 8, type);
                    const int bytes = kel_ref::wholePixelBytes(type);
                    const int columns = std::min(width, 16), rows = std::min(height, 8);
                    const int pixels = columns > 0 && rows > 0 ? (rows - 1) * pitch + columns : 0; // not one beyond
                    const Bytes buffer = kel_test::filled(static_cast<size_t>(pixels * bytes), Fill::Random, 77);
                    Bytes loaded = image.bytes(), stored = buffer, out = buffer;
                    for (int y = 0; y < rows; ++y)
                        for (int i = 0; i < columns * bytes; ++i)
                            std::swap(stored[y * pitch * bytes + i], loaded[y * 16 * bytes + i]);
                    storeKelImageData(out.data(), width, height, pitch, image.get());
                    EXPECT_EQ(out, stored);
                    loadKelImageData(image.get(), buffer.data(), width, height, pitch);
                    EXPECT_TRUE(holds(image, loaded));
                }
}

// Rows are copied one after the other, so that the first of them runs on where each row's copy is the next row's source.
TEST(ImageData, CopiesRowByRowWithinOneBlock) {
    for (bool load : {true, false}) {
        Image block(16, 9, 0);
        Bytes expected = block.bytes();
        for (int y = 1; y < 9; ++y)
            std::copy_n(expected.begin(), 16, expected.begin() + 16 * y);
        kelImage_t* view = createKelImageHeader(16, 8, 0);
        view->data = block.data() + (load ? 16 : 0);
        if (load)
            loadKelImageData(view, block.data(), 16, 8, 16);
        else
            storeKelImageData(block.data() + 16, 16, 8, 16, view);
        EXPECT_TRUE(holds(block, expected));
        releaseKelImageHeader(&view);
    }
}

TEST(ImageData, FileEntryPointsAreInert) {
    EXPECT_EQ(loadKelImage("no such file"), nullptr);
    storeKelImage("no such file", nullptr);
    EXPECT_NE(access("no such file", F_OK), 0);
}
