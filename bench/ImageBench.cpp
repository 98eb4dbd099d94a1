// The image core beside memcpy and memset.
#include "Bench.h"

#include <cstring>
#include <memory>
#include <vector>

namespace {

using namespace kel_bench;

void addLines() {
    for (const ImageSize& size : kImageSizes) {
        const double bytes = 3.0 * size.width * size.height;
        const auto pair = [=] {
            return std::make_pair(image(size.width, size.height, KEL_PIXEL_TYPE_U8XYZ),
                                  image(size.width, size.height, KEL_PIXEL_TYPE_U8XYZ));
        };
        const auto copy = [=] {
            return Body([images = pair()] { memcpy(images.first->data, images.second->data, images.first->size); });
        };
        add("copyKelImage, 3 bytes", size.name, {bytes, bytes},
            {{"kel", [=] { return Body([images = pair()] { copyKelImage(images.first.get(), images.second.get()); }); }},
             {"memcpy", copy}});
        add("clearKelImage, 3 bytes", size.name, {0, bytes},
            {{"kel", [=] { return Body([images = pair()] { clearKelImage(images.first.get()); }); }},
             {"memset", [=] { return Body([images = pair()] { memset(images.first->data, 0, images.first->size); }); }}});
        add("cloneKelImage, 3 bytes", size.name, {bytes, bytes}, {{"kel", [=] {
                                                                       return Body([images = pair()] {
                                                                           kelImage_t* clone =
                                                                               cloneKelImage(images.first.get());
                                                                           releaseKelImage(&clone);
                                                                       });
                                                                   }}});
        add("loadKelImageData, 3 bytes", size.name, {bytes, bytes},
            {{"kel",
              [=] {
                  return Body([images = pair(), size] {
                      loadKelImageData(images.first.get(), images.second->data, size.width, size.height, size.width);
                  });
              }},
             {"memcpy", copy}});
        add("storeKelImageData, 3 bytes", size.name, {bytes, bytes},
            {{"kel",
              [=] {
                  return Body([images = pair(), size] {
                      storeKelImageData(images.first->data, size.width, size.height, size.width, images.second.get());
                  });
              }},
             {"memcpy", copy}});
    }
}

const Lines lines(addLines);

} // namespace
