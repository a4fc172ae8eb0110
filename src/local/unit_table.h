// What the open converter of a single-byte charset made of each UTF-16 unit
// seen so far: its byte, or no byte. Units below 0x800 (Latin, Greek,
// Cyrillic, Hebrew, Arabic) have a slot each; the others share a small
// direct-mapped cache, where a unit that finds its slot taken is asked again.
// For the vector kernels, the bytes of the ASCII units and of one page of
// 128 units where the charset's letters lie are also kept as a flat table.
// Static storage, 6.3 KiB; nothing is allocated.
#pragma once

#include <cstdint>
#include <cstring>

#include "textconv.h"

namespace textconv {

class UnitByteTable {
  public:
    static constexpr int kUnknown = -1;
    static constexpr int kNoByte = 256;

    // Forgets everything unless the table already holds `charset`'s units.
    void claim(CharsetId charset) {
        if (owner_ == charset) return;
        std::memset(this, 0, sizeof *this);
        owner_ = charset;
        pageBase_ = letter_page(charset);
    }

    // The byte for `unit`, kNoByte, or kUnknown.
    int find(uint16_t unit) const {
        if (unit < kDirect) return decode(direct_[unit]);
        const auto inPage = static_cast<uint16_t>(unit - pageBase_);
        if (inPage < 0x80 && flat_[0x80 + inPage] != 0) return flat_[0x80 + inPage];  // a page beyond 0x800
        const Slot &s = cached_[slot_of(unit)];
        return s.unit == unit ? decode(s.entry) : kUnknown;
    }

    void record(uint16_t unit, int byteOrNone) {
        const uint8_t flat = byteOrNone == kNoByte ? 0 : static_cast<uint8_t>(byteOrNone);
        const auto inPage = static_cast<uint16_t>(unit - pageBase_);
        if (inPage < 0x80) flat_[0x80 + inPage] = flat;
        if (unit < 0x80) {
            flat_[unit] = flat;
            const auto bit = static_cast<uint8_t>(1u << (unit >> 4));
            asciiRows_[unit & 0x0F] = static_cast<uint8_t>(
                byteOrNone == unit ? asciiRows_[unit & 0x0F] | bit : asciiRows_[unit & 0x0F] & ~bit);
        }
        const uint16_t entry = byteOrNone == kNoByte ? kNone : static_cast<uint16_t>(kByte | byteOrNone);
        if (unit < kDirect)
            direct_[unit] = entry;
        else
            cached_[slot_of(unit)] = {unit, entry};
    }

    // The byte of a unit below 0x800 known to have one, else -1: the short
    // road for running text.
    int known_direct_byte(uint16_t unit) const {
        const uint16_t entry = direct_[unit & (kDirect - 1)];
        return unit < kDirect && (entry & kByte) ? (entry & 0xFF) : -1;
    }

    // Entry u (u < 0x80) holds the byte of ASCII unit u, entry 0x80 + k that
    // of unit page_base() + k (k < 0x80); 0 while unknown or without a byte.
    const uint8_t *flat_table() const { return flat_; }
    // Bit (u >> 4) of row (u & 15) is set when ASCII unit u is known to give
    // its own byte.
    const uint8_t *ascii_rows() const { return asciiRows_; }
    uint16_t page_base() const { return pageBase_; }

  private:
    static constexpr unsigned kDirect = 0x800;
    static constexpr unsigned kSlots = 512;
    static constexpr uint16_t kByte = 0x100;
    static constexpr uint16_t kNone = 0x200;
    struct Slot {
        uint16_t unit;
        uint16_t entry;  // 0 while empty
    };

    static int decode(uint16_t entry) {
        if (entry & kByte) return entry & 0xFF;
        return entry == kNone ? kNoByte : kUnknown;
    }
    static unsigned slot_of(uint16_t unit) { return ((unit * 40503u) >> 7) & (kSlots - 1); }

    // The 128 units that hold most of a charset's letters above ASCII.
    static uint16_t letter_page(CharsetId charset) {
        switch (charset) {
            case CHARSET_KOI8R:
            case CHARSET_CP1251:
                return 0x400;  // Cyrillic
            case CHARSET_ISO8859_8:
                return 0x580;  // Hebrew letters
            case CHARSET_ISO8859_6:
            case CHARSET_CP1256:
                return 0x600;  // Arabic
            case CHARSET_ISO8859_11:
                return 0xE00;  // Thai
            default:
                return 0x80;  // Latin-1 Supplement
        }
    }

    CharsetId owner_;
    uint16_t pageBase_;
    uint8_t asciiRows_[16];
    uint8_t flat_[256];
    uint16_t direct_[kDirect];
    Slot cached_[kSlots];
};

}  // namespace textconv
