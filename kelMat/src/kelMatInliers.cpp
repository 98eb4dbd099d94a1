// Which kernels for counting inliers this processor gets.
#include "kelMatInliers.h"
#include "kelInstructionSet.h"

const kel::InlierKernels& kel::inlierKernels() {
    return KEL_TABLE(inlierKernels);
}
