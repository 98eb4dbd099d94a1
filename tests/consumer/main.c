/* The image half from C. */
#include <kel/kelImage.h>
#include <stdio.h>

int main(void) {
    const unsigned char pixel[3] = {10, 20, 31};
    unsigned char out[4] = {0, 0, 0, 9}, grey = 0;
    kelImage_t *colour = createKelImage(1, 1, KEL_PIXEL_TYPE_U8XYZ), *other = createKelImage(1, 1, KEL_PIXEL_TYPE_U8ZYXA),
               *g = createKelImage(1, 1, KEL_PIXEL_TYPE_U8G);
    loadKelImageData(colour, pixel, 1, 1, 1);
    convertKelImage_U8XYZ_to_U8ZYXA(other, colour); /* the one decorated symbol */
    storeKelImageData(out, 1, 1, 1, other);
    convertKelImage(g, colour);
    storeKelImageData(&grey, 1, 1, 1, g);
    printf("%d %d %d %d, grey %d, table %d\n", out[0], out[1], out[2], out[3], grey, KEL_COLOR_TABLE_SAFE[7][2]);
    releaseKelImage(&colour);
    releaseKelImage(&other);
    releaseKelImage(&g);
    return 0;
}
