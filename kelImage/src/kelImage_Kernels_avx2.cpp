// The kernels for processors with AVX2, 32 bytes at a time.
#include "kelImage_Lanes_avx2.h"

namespace {
using Wide = Lanes2;
using Modest = Lanes2;
} // namespace
#define KEL_KERNELS_OF avx2

#include "kelImage_KernelTable.h"
