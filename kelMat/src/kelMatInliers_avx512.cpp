// Counting inliers in vectors of 64 bytes.
#define KEL_VECTOR_BYTES 64
#define KEL_KERNELS_OF avx512
#include "kelMatInlierKernel.h"
