// The table of kernels for the instruction set of the file that includes this. Before, it includes its vocabulary of lanes and
// names Wide and KEL_KERNELS_OF, the namespace of the table.
#ifndef KEL_IMAGE_KERNEL_TABLE_H
#define KEL_IMAGE_KERNEL_TABLE_H

#include "kelImage_ConvertKernels.h"
#include "kelImage_Kernels.h"
#include "kelImage_YuvKernels.h"

const kel::Kernels kel::KEL_KERNELS_OF::kernels = {
    greyToThree,
    greyToFour,
    greyToWords,
    magnitudeToGrey,
    magnitudeToThree,
    magnitudeToFour,
    meanOfThree,
    wordMeanOfThree,
    meanOfFourSpread,
    wordMeanOfFourSpread,
    threeReversed,
    threesToFours<kThreeToFour>,
    threesToFours<kThreeToFourReversed>,
    foursToThrees<kFourToThree>,
    foursToThrees<kFourToThreeReversed>,
    fourReversed,
    yuvToGrey,
    yuvToThree<false>,
    yuvToThree<true>,
    yuvToFour<false>,
    yuvToFour<true>,
};

#endif
