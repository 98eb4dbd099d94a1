// Counting inliers in vectors of 32 bytes.
#define KEL_VECTOR_BYTES 32
#define KEL_KERNELS_OF avx2
#include "kelMatInlierKernel.h"
