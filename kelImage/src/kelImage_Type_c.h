// Channels and element bytes of a pixel-type code.
#ifndef KEL_IMAGE_TYPE_C_H
#define KEL_IMAGE_TYPE_C_H

#include "kelImage.h"

namespace kel {

kelValue_s32 channelsOfType(kelValue_s32 type);
kelValue_s32 depthOfType(kelValue_s32 type);

} // namespace kel

#endif
