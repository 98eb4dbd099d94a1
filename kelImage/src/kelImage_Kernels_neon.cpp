// The kernels for AArch64, 16 bytes at a time.
#include "kelImage_Lanes_neon.h"

namespace {
using Wide = Lanes1;
using Modest = Lanes1;
} // namespace
#define KEL_KERNELS_OF neon

#include "kelImage_KernelTable.h"
