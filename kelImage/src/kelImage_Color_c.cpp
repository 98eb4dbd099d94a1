// The two colour tables, computed by the compiler and exported as read-only data.
#include "kelImage.h"

namespace {

constexpr unsigned char safe(int i, int c) {
    return static_cast<unsigned char>(51 * (c == 0 ? i / 36 : c == 1 ? i % 6 : (i / 6) % 6));
}

// 255 * clamp(1.5 - |4i/63 - (3 - c)|), formed in units of 1/126 so that ties are exact; they round up.
constexpr unsigned char pseudo(int i, int c) {
    const int distance = 8 * i - 126 * (3 - c);
    int level = 189 - (distance < 0 ? -distance : distance);
    level = level < 0 ? 0 : level > 126 ? 126 : level;
    return static_cast<unsigned char>((2 * 255 * level + 126) / 252);
}

} // namespace

#define ENTRIES_2(entry, i) entry(i), entry(i + 1)
#define ENTRIES_8(entry, i) ENTRIES_2(entry, i), ENTRIES_2(entry, i + 2), ENTRIES_2(entry, i + 4), ENTRIES_2(entry, i + 6)
#define ENTRIES_24(entry, i) ENTRIES_8(entry, i), ENTRIES_8(entry, i + 8), ENTRIES_8(entry, i + 16)
#define ENTRIES_72(entry, i) ENTRIES_24(entry, i), ENTRIES_24(entry, i + 24), ENTRIES_24(entry, i + 48)
#define SAFE(i)                                                                                                                \
    { safe(i, 0), safe(i, 1), safe(i, 2) }
#define PSEUDO(i)                                                                                                              \
    { pseudo(i, 0), pseudo(i, 1), pseudo(i, 2) }

const unsigned char KEL_COLOR_TABLE_SAFE[216][3] = {ENTRIES_72(SAFE, 0), ENTRIES_72(SAFE, 72), ENTRIES_72(SAFE, 144)};

const unsigned char KEL_COLOR_TABLE_PSEUDO[64][3] = {ENTRIES_24(PSEUDO, 0), ENTRIES_24(PSEUDO, 24), ENTRIES_8(PSEUDO, 48),
                                                     ENTRIES_8(PSEUDO, 56)};
