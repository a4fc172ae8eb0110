// Read-only tables of the UTF-8 decoder and encoder.
#pragma once

#include <array>
#include <cstdint>

namespace textconv {

// Trailing bytes announced by a lead byte. 0x80..0xBF count as one-byte
// sequences (their value then fails the range test); 0xF8..0xFF announce the
// old 5- and 6-byte forms.
inline constexpr std::array<int8_t, 256> utf8TrailingByteCount = [] {
    std::array<int8_t, 256> t{};
    for (int b = 0; b < 256; ++b)
        t[b] = b < 0xC0 ? 0 : b < 0xE0 ? 1 : b < 0xF0 ? 2 : b < 0xF8 ? 3 : b < 0xFC ? 4 : 5;
    return t;
}();

// The tag bits of a (t+1)-byte sequence at their places, modulo 2^32:
// subtracting it from the plain sum of the shifted bytes leaves the value.
inline constexpr uint32_t utf8OffsetByLength[6] = {0x00000000, 0x00003080, 0x000E2080,
                                                   0x03C82080, 0xFA082080, 0x82082080};
// Smallest and largest value a (t+1)-byte sequence may carry.
inline constexpr uint32_t utf8MinimumByLength[6] = {0x0, 0x80, 0x800, 0x10000, 0x200000, 0x4000000};
inline constexpr uint32_t utf8MaximumByLength[6] = {0x7F, 0x7FF, 0xFFFF, 0x1FFFFF, 0x3FFFFFF, 0x7FFFFFFF};
// Lead-byte marks by sequence length in bytes (0..6).
inline constexpr uint8_t utf8LeadByteMark[7] = {0x00, 0x00, 0xC0, 0xE0, 0xF0, 0xF8, 0xFC};

inline constexpr uint16_t kReplacementCharacter = 0xFFFD;

}  // namespace textconv
