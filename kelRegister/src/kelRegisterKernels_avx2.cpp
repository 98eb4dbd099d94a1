// The kernels for processors with AVX2.
#include "kelRegisterKernelBodies.h"

namespace kelRegister {
const Kernels kKernelsAvx2 = {gradients, describe, differences, correlate};
}
