// Direction classes of UTF-16 units: which units start or continue a
// right-to-left run, which a left-to-right run, and which follow their
// neighbours.
#pragma once

#include <array>
#include <cstdint>

#include "textconv.h"

namespace textconv::direction {

struct UnitRange {
    uint16_t first;
    uint16_t last;  // inclusive
    uint8_t cls;
};

// The strong units. Everything else except the 0 unit is neutral, among it
// U+00D7, U+00F7, the Syriac block U+0700..U+074F and every other script.
inline constexpr std::array<UnitRange, 10> kStrongRanges{{
    {0x0030, 0x0039, DIRECTION_LTR},  // ASCII digits
    {0x0041, 0x005A, DIRECTION_LTR},  // ASCII letters
    {0x0061, 0x007A, DIRECTION_LTR},
    {0x00C0, 0x00D6, DIRECTION_LTR},  // Latin-1 letters
    {0x00D8, 0x00F6, DIRECTION_LTR},
    {0x00F8, 0x00FF, DIRECTION_LTR},
    {0x0590, 0x06FF, DIRECTION_RTL},  // Hebrew, Arabic
    {0x0750, 0x07FF, DIRECTION_RTL},  // Arabic Supplement, Thaana, NKo
    {0xFB1D, 0xFDFF, DIRECTION_RTL},  // Hebrew and Arabic presentation forms
    {0xFE70, 0xFEFF, DIRECTION_RTL},  // Arabic Presentation Forms-B, U+FEFF too
}};

constexpr uint8_t class_by_ranges(uint16_t unit) {
    for (const UnitRange &r : kStrongRanges)
        if (unit >= r.first && unit <= r.last) return r.cls;
    return DIRECTION_NEUTRAL;
}

// The first 256 units by table, the rest by the four right-to-left ranges.
inline constexpr std::array<uint8_t, 256> kLatin1Classes = [] {
    std::array<uint8_t, 256> t{};
    for (unsigned u = 0; u < 256; ++u) t[u] = class_by_ranges(static_cast<uint16_t>(u));
    return t;
}();

constexpr uint8_t unit_class(uint16_t unit) {
    if (unit < 0x100) return kLatin1Classes[unit];
    if (unit < 0x0590) return DIRECTION_NEUTRAL;
    return class_by_ranges(unit);
}

}  // namespace textconv::direction
