// Counting inliers in vectors of 16 bytes on AArch64.
#define KEL_VECTOR_BYTES 16
#define KEL_KERNELS_OF neon
#include "kelMatInlierKernel.h"
