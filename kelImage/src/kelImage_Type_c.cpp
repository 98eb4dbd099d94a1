// Channels and element bytes of a pixel-type code, 8 x layout + kind.
#include <cstdint>

#include "kelImage_Private.h"

namespace kel {

namespace {
constexpr uint32_t kTypes = 48;
constexpr kelValue_s32 kChannelsOfLayout[kTypes / 8] = {1, 3, 4, 3, 4, 2}; // G, XYZ, XYZA, ZYX, ZYXA, YUV
constexpr kelValue_s32 kBytesOfKind[8] = {1, 1, 2, 2, 4, 4, 4, 8};         // U8, S8, U16, S16, U32, S32, F32, F64
} // namespace

kelValue_s32 channelsOfType(kelValue_s32 type) {
    const uint32_t code = static_cast<uint32_t>(type);
    return code < kTypes ? kChannelsOfLayout[code / 8] : 0;
}

kelValue_s32 depthOfType(kelValue_s32 type) {
    const uint32_t code = static_cast<uint32_t>(type);
    return code < kTypes ? kBytesOfKind[code % 8] : 0;
}

} // namespace kel
