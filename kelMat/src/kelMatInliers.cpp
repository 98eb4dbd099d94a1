// Which kernels for counting inliers this processor gets.
#include "kelMatInliers.h"
#include "kelInstructionSet.h"

const kel::InlierKernels& kel::inlierKernels() {
#ifdef KEL_KERNELS // one table whatever the processor, for tests and measurements
    return KEL_KERNELS::inlierKernels;
#else
    return widest(sse41::inlierKernels, avx2::inlierKernels, avx512::inlierKernels);
#endif
}
