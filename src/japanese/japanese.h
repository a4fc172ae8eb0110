// Internal pieces of the Japanese family, shared between its files and with
// the white-box tests. The exported functions are thin wrappers over these,
// so calls inside the library do not go through the dynamic symbol table.
#pragma once

#include <cstdint>

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

// Shift-JIS and JIS arithmetic (sjis.cpp).
bool sjis_to_jis(const uint8_t *sjis, uint8_t *kind, JisCode *jis, uint8_t *consumed);
bool jis_to_sjis(uint32_t kind, const JisCode *jis, uint8_t *sjis, uint8_t *length);

// Towards UTF-16 (to_unicode.cpp).
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
