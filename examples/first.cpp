// A first program: a caller's colour pixels go into an image, become grey, and come out again.
#include <cstdio>
#include <kel/kelImage.h>

int main() {
    const unsigned char colour[2 * 2 * 3] = {10, 20, 30, 40, 50, 60, 70, 80, 90, 100, 110, 120};
    kelImage_t* bgr = createKelImage(2, 2, KEL_PIXEL_TYPE_U8XYZ);
    kelImage_t* grey = createKelImage(2, 2, KEL_PIXEL_TYPE_U8G);
    loadKelImageData(bgr, colour, 2, 2, 2);
    convertKelImage(grey, bgr);
    unsigned char out[2 * 2];
    storeKelImageData(out, 2, 2, 2, grey);
    std::printf("%d %d / %d %d, rows of %d pixels\n", out[0], out[1], out[2], out[3], grey->step);
    releaseKelImage(&grey);
    releaseKelImage(&bgr);
}
