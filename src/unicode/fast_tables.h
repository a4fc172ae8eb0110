// Shuffle tables of the x86 fast paths, computed at compile time. Each entry
// is a byte shuffle (0x80 = zero) that packs the wanted bytes of a 16-byte
// register to its front.
#pragma once

#include <array>
#include <cstdint>

namespace textconv::fast {

struct Shuffle {
    alignas(16) uint8_t index[16];
};

// Keeps the 16-bit lanes whose bit is set in an 8-bit mask, in order.
inline constexpr std::array<Shuffle, 256> kKeepLanes = [] {
    std::array<Shuffle, 256> t{};
    for (int m = 0; m < 256; ++m) {
        int o = 0;
        for (int i = 0; i < 8; ++i) {
            if (m & (1 << i)) {
                t[m].index[o++] = static_cast<uint8_t>(2 * i);
                t[m].index[o++] = static_cast<uint8_t>(2 * i + 1);
            }
        }
        while (o < 16) t[m].index[o++] = 0x80;
    }
    return t;
}();

// UTF-8 bytes of four units from [first/second byte pairs at 0..7, third
// bytes at 8..11]. The index holds two 4-bit masks: low nibble, unit needs at
// least 2 bytes; high nibble, unit needs 3 bytes.
struct GroupShuffle {
    alignas(16) uint8_t index[16];
    uint8_t length;
};
inline constexpr std::array<GroupShuffle, 256> kUtf16Group = [] {
    std::array<GroupShuffle, 256> t{};
    for (int m = 0; m < 256; ++m) {
        int o = 0;
        for (int i = 0; i < 4; ++i) {
            const bool two = m & (1 << i), three = m & (16 << i);
            t[m].index[o++] = static_cast<uint8_t>(2 * i);
            if (two || three) t[m].index[o++] = static_cast<uint8_t>(2 * i + 1);
            if (three) t[m].index[o++] = static_cast<uint8_t>(8 + i);
        }
        t[m].length = static_cast<uint8_t>(o);
        while (o < 16) t[m].index[o++] = 0x80;
    }
    return t;
}();

// UTF-8 bytes of eight Latin-1 bytes from their (first, second) byte pairs:
// the second byte is kept only where the mask marks a byte above 0x7F.
inline constexpr std::array<Shuffle, 256> kLatin1Pairs = [] {
    std::array<Shuffle, 256> t{};
    for (int m = 0; m < 256; ++m) {
        int o = 0;
        for (int i = 0; i < 8; ++i) {
            t[m].index[o++] = static_cast<uint8_t>(2 * i);
            if (m & (1 << i)) t[m].index[o++] = static_cast<uint8_t>(2 * i + 1);
        }
        while (o < 16) t[m].index[o++] = 0x80;
    }
    return t;
}();

}  // namespace textconv::fast
