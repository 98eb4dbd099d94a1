// The table of kernels for the instruction set of the file that includes this. Before, it includes its vocabulary of lanes and
// names Wide, Modest and KEL_KERNELS_OF, the namespace of the table.
#ifndef KEL_IMAGE_KERNEL_TABLE_H
#define KEL_IMAGE_KERNEL_TABLE_H

#include "kelImage_ConvertKernels.h"
#include "kelImage_FilterKernels.h"
#include "kelImage_Kernels.h"
#include "kelImage_MoveKernels.h"
#include "kelImage_PointKernels.h"
#include "kelImage_ResampleKernels.h"
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
    rangeOf,
    stretch,
    binarize,
    localMeansAcross,
    binarizeByMeans,
    fiveAcross,
    fiveDown,
    sevenAcross,
    sevenDown,
    sevenDownTwice,
    crossRow,
    sobelRow,
    extremaMasks,
    {reversed<1>, reversed<2>, reversed<3>, reversed<4>},
    {everySecond<false, 1>, everySecond<false, 2>, everySecondThree<false>, everySecond<false, 4>},
    {everySecond<true, 1>, everySecond<true, 2>, everySecondThree<true>, everySecond<true, 4>},
    {warpRow<true, 1>, warpRow<false, 2>, warpRow<false, 3>, warpRow<false, 4>},
    averageOfFour,
    enlargeAcross,
    mixRows,
    reduceAcross<WordBox>,
    reduceAcross<LongBox>,
    reduceDown<WordBox>,
    reduceDown<LongBox>,
    halveBothWays,
};

#endif
