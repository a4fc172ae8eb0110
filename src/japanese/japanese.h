// Internal pieces of the Japanese family, shared between its files and with
// the white-box tests. The exported functions are thin wrappers over these,
// so calls inside the library do not go through the dynamic symbol table.
#pragma once

#include <cstdint>

#include "frame/registry.h"
#include "textconv.h"

namespace textconv::japanese {

inline constexpr uint16_t kNoCharacter = 0xFFFF;  // the unit of a failed conversion
inline constexpr int kCells = 94;                 // rows and cells run 1..94

// Set until the first conversion through the EUC-JP to UTF-16 converter.
extern uint8_t eucjpFirstUse;

constexpr bool is_sjis_single(uint8_t b) { return (b >= 0x20 && b <= 0x7E) || (b >= 0xA1 && b <= 0xDF); }
constexpr bool is_sjis_lead(uint8_t b) { return (b >= 0x81 && b <= 0x9F) || (b >= 0xE0 && b <= 0xEF); }
constexpr bool is_sjis_trail(uint8_t b) { return (b >= 0x40 && b <= 0x7E) || (b >= 0x80 && b <= 0xFC); }
constexpr bool is_katakana(uint8_t b) { return b >= 0xA1 && b <= 0xDF; }
constexpr bool is_euc_byte(uint8_t b) { return b >= 0xA1 && b <= 0xFE; }

// Shift-JIS and JIS arithmetic (sjis.cpp; the decoder here, to be inlined
// into the string loops).
inline bool sjis_to_jis(const uint8_t *sjis, uint8_t *kind, JisCode *jis, uint8_t *consumed) {
    const uint8_t lead = sjis[0];
    if (is_sjis_single(lead)) {
        *kind = MB_KIND_SINGLE;
        jis->byte[0] = lead;
        *consumed = 1;
        return true;
    }
    if (!is_sjis_lead(lead)) return false;
    // A trail byte outside the Shift-JIS ranges (the terminator, ASCII
    // punctuation, 0x7F, 0xFD..0xFF) makes the lead byte invalid on its own,
    // so the byte after it is read again as a character of its own.
    const uint8_t trail = sjis[1];
    if (!is_sjis_trail(trail)) return false;
    // Each lead byte covers two rows: trails up to 0x9E the odd row, from
    // 0x9F the even one.
    const uint8_t base = lead <= 0x9F ? 0x70 : 0xB0;
    const uint8_t evenRow = trail >= 0x9F;
    const uint8_t cellOffset = trail < 0x80 ? 0x1F : (trail <= 0x9E ? 0x20 : 0x7E);
    *kind = MB_KIND_JISX0208;
    jis->byte[0] = static_cast<uint8_t>(2 * (lead - base) - 32 - (evenRow ? 0 : 1));
    jis->byte[1] = static_cast<uint8_t>(trail - 0x20 - cellOffset);
    *consumed = 2;
    return true;
}

bool jis_to_sjis(uint32_t kind, const JisCode *jis, uint8_t *sjis, uint8_t *length);

// Towards UTF-16 (to_unicode.cpp).

// What the EUC-JP converter answered for each JIS X 0208 row/cell and each
// half-width katakana byte: 0 while unknown, kNoCharacter for a rejection.
// The converter is stateless, so an answer holds for the life of the process.
extern uint16_t x0208Units[kCells * kCells];
extern uint16_t katakanaUnits[0xDF - 0xA1 + 1];
// Once the converter is open and its first use is behind it, a conversion has
// no observable step left but its answer, so a known answer may be used as is
// (row 13 aside: its table comes first).
inline bool decoder_warm() {
    return eucjpFirstUse == 0 && eucjpToUnicodeConverter != unopened_cell() &&
           eucjpToUnicodeConverter != failed_cell();
}

bool jis_to_unicode(const uint8_t *given, uint16_t *unit, uint32_t form);
bool multibyte_to_unicode(uint32_t kind, const uint8_t *code, uint16_t *unit);
bool eucjp_to_unicode(const uint8_t **cursor, uint16_t *unit);

// From UTF-16 (from_unicode.cpp).
bool unicode_to_eucjp(uint16_t unit, uint8_t euc[3]);
// The kind and JisCode of EUC-JP bytes as written by unicode_to_eucjp; false
// for a control byte (0x00..0x1F, 0x7F..0x9F other than 0x8E, 0x8F).
bool classify_eucjp(const uint8_t euc[3], uint8_t *kind, JisCode *jis);
bool unicode_to_multibyte(uint16_t unit, uint32_t request, uint8_t *kind, uint8_t *code, uint8_t *length);

}  // namespace textconv::japanese
