// The cross operator under its plain name; there is a vector form only.
#include "kelImage.h"

extern "C" void applyKelFilterLaplacian3X3(kelImage_t* dst, kelImage_t* src) {
    applyKelFilterLaplacianSSE3X3(dst, src);
}
