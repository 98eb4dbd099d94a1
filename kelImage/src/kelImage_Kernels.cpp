// Which table of kernels this processor gets.
#include "kelImage_Kernels.h"
#include "kelInstructionSet.h"

const kel::Kernels& kel::kernels() {
#ifdef KEL_KERNELS // one table whatever the processor, for tests and measurements
    return KEL_KERNELS::kernels;
#else
    return widest(sse41::kernels, avx2::kernels, avx512::kernels);
#endif
}
