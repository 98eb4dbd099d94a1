// The Sobel magnitude under its plain name; there is a vector form only.
#include "kelImage.h"

extern "C" void applyKelFilterSobel3X3(kelImage_t* dst, kelImage_t* src) {
    applyKelFilterSobelSSE3X3(dst, src);
}
