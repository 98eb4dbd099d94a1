// Registration from C++: a picture and the same picture moved.
#include <cstdio>
#include <cstdlib>
#include <kel/kelRegister.h>

int main() {
    kelImage_t *first = createKelImage(200, 160, KEL_PIXEL_TYPE_U8G), *second = createKelImage(180, 150, KEL_PIXEL_TYPE_U8G);
    clearKelImage(first);
    for (int i = 0; i < 400; ++i) {
        const int x = rand() % 190, y = rand() % 150, side = 3 + rand() % 8, value = rand() % 256;
        for (int v = y; v < y + side; ++v)
            for (int u = x; u < x + side; ++u)
                first->data[v * first->step + u] = static_cast<unsigned char>(value);
    }
    loadKelImageData(second, first->data + 7 * first->step + 12, 180, 150, first->step);
    const kelRegister::Result r = kelRegister::registerPictures(first, second);
    if (!r.found)
        std::printf("refused: %s\n", r.reason.c_str());
    else
        std::printf("found, %.0f %.0f\n", r.H.m_Data[2], r.H.m_Data[5]);
    releaseKelImage(&first);
    releaseKelImage(&second);
}
