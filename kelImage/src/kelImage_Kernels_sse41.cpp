// The kernels for processors with SSE4.1, 16 bytes at a time.
#include "kelImage_Lanes_sse41.h"

namespace {
using Wide = Lanes1;
using Modest = Lanes1;
} // namespace
#define KEL_KERNELS_OF sse41

#include "kelImage_KernelTable.h"
