// The kernels for every x86 processor: SSE4.1.
#include "kelRegisterKernelBodies.h"

namespace kelRegister {
const Kernels kKernelsSse = {gradients, describe, differences, correlate};
}
