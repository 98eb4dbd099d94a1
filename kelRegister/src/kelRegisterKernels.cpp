// The choice between the kernels, made by what the processor has.
#include "kelRegisterKernels.h"

namespace kelRegister {

const Kernels& kernels() {
    return __builtin_cpu_supports("avx2") ? kKernelsAvx2 : kKernelsSse;
}

} // namespace kelRegister
