// Counting inliers in vectors of 16 bytes.
#define KEL_VECTOR_BYTES 16
#define KEL_KERNELS_OF sse41
#include "kelMatInlierKernel.h"
