// Which table of kernels this processor gets.
#include "kelImage_Kernels.h"

const kel::Kernels& kel::kernels() {
#ifdef KEL_KERNELS // one table whatever the processor, for tests and measurements
    return KEL_KERNELS::kernels;
#else
    if (__builtin_cpu_supports("avx512bw") && __builtin_cpu_supports("avx512vl") && __builtin_cpu_supports("avx512vbmi"))
        return avx512::kernels;
    return __builtin_cpu_supports("avx2") ? avx2::kernels : sse41::kernels;
#endif
}
