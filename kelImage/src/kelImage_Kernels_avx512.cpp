// The kernels for processors with AVX-512 (F, BW, VL and VBMI), 64 bytes at a time.
#include "kelImage_Lanes_avx512.h"

namespace {
using Wide = Lanes4;
using Modest = Lanes2;
} // namespace
#define KEL_KERNELS_OF avx512

#include "kelImage_KernelTable.h"
