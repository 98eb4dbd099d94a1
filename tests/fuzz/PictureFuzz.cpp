// The decoders of the example programs on arbitrary bytes: a picture or an Error, never anything else.
#include <common/Picture.h>
#include <cstdlib>

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    try {
        const kel_examples::Image image = kel_examples::decodePicture(data, size, "fuzz");
        if (!image || image->type != KEL_PIXEL_TYPE_U8ZYX || image->width < 2 || image->height < 2)
            std::abort();
        unsigned sum = 0; // every pixel is there to be read
        for (int y = 0; y < image->height; ++y)
            for (int x = 0; x < 3 * image->width; ++x)
                sum += image->data[3 * static_cast<ptrdiff_t>(y) * image->step + x];
        volatile unsigned used = sum;
        (void)used;
    } catch (const kel_examples::Error&) {
    }
    return 0;
}
