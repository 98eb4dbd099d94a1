// The choice between the kernels, made by what the processor has.
#include "kelRegisterKernels.h"

namespace kelRegister {

const Kernels& kernels() {
#if defined(KEL_KERNELS) // one table whatever the processor, for tests
    return KEL_KERNELS;
#elif defined(__aarch64__)
    return kKernelsNeon;
#else
    return __builtin_cpu_supports("avx2") && __builtin_cpu_supports("fma") ? kKernelsAvx2 : kKernelsSse;
#endif
}

} // namespace kelRegister
