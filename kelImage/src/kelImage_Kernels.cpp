// Which table of kernels this processor gets.
#include "kelImage_Kernels.h"
#include "kelInstructionSet.h"

const kel::Kernels& kel::kernels() {
    return KEL_TABLE(kernels);
}
