// The kernels for AArch64.
#include "kelRegisterKernelBodies.h"

namespace kelRegister {
const Kernels kKernelsNeon = {gradients, describe, differences, correlate};
}
