// Single Japanese characters to UTF-16 through the platform's EUC-JP
// converter, with row 13 from the library's own table.
#include <iconv.h>

#include "frame/registry.h"
#include "japanese/japanese.h"

namespace textconv::japanese {

uint8_t eucjpFirstUse = 1;
uint16_t x0208Units[kCells * kCells];
uint16_t katakanaUnits[0xDF - 0xA1 + 1];

namespace {

// JIS X 0212 answers, kept like those of JIS X 0208 (japanese.h). Only ever
// filled through the open converter, after its first-use step, so every
// observable step of a conversion has happened before a lookup can hit.
uint16_t x0212Units[kCells * kCells];

iconv_t decoder() {
    const iconv_t cell = eucjpToUnicodeConverter;
    if (cell != unopened_cell() && cell != failed_cell()) return cell;
    return acquire_converter(&eucjpToUnicodeConverter, "EUC-JP", Pivot::Target);
}

// One character through the converter into one unit of room.
bool convert(iconv_t cd, const uint8_t *bytes, size_t count, uint16_t *unit) {
    char *in = const_cast<char *>(reinterpret_cast<const char *>(bytes));
    char *out = reinterpret_cast<char *>(unit);
    size_t inLeft = count, outLeft = sizeof *unit;
    return iconv(cd, &in, &inLeft, &out, &outLeft) != static_cast<size_t>(-1) && outLeft == 0;
}

uint16_t *cache_slot(const uint8_t *euc, size_t count) {
    if (count == 2 && is_euc_byte(euc[0]) && is_euc_byte(euc[1]))
        return &x0208Units[(euc[0] - 0xA1) * kCells + (euc[1] - 0xA1)];
    if (count == 2 && euc[0] == 0x8E && is_katakana(euc[1])) return &katakanaUnits[euc[1] - 0xA1];
    if (count == 3 && euc[0] == 0x8F && is_euc_byte(euc[1]) && is_euc_byte(euc[2]))
        return &x0212Units[(euc[1] - 0xA1) * kCells + (euc[2] - 0xA1)];
    return nullptr;
}

}  // namespace

bool jis_to_unicode(const uint8_t *given, uint16_t *unit, uint32_t form) {
    *unit = kNoCharacter;
    const iconv_t cd = decoder();
    if (!cd) return false;
    if (eucjpFirstUse) {
        // A "UTF-16" converter may put a byte-order mark before its first
        // output; spend that on a throwaway "!" rather than on a real
        // character, which has room for one unit only.
        eucjpFirstUse = 0;
        const uint8_t bang = 0x21;
        uint16_t scratch;
        convert(cd, &bang, 1, &scratch);
    }
    uint8_t euc[3];
    size_t count;
    switch (form) {
        case JIS_FORM_ASCII:
            euc[0] = static_cast<uint8_t>(given[0] + 0x20);
            count = 1;
            break;
        case JIS_FORM_X0208:
            euc[0] = static_cast<uint8_t>(given[0] + 0xA0);
            euc[1] = static_cast<uint8_t>(given[1] + 0xA0);
            count = 2;
            break;
        case JIS_FORM_KATAKANA:
            euc[0] = 0x8E;
            euc[1] = static_cast<uint8_t>(given[0] + 0xA0);
            count = 2;
            break;
        case JIS_FORM_X0212:
            euc[0] = 0x8F;
            euc[1] = static_cast<uint8_t>(given[0] + 0xA0);
            euc[2] = static_cast<uint8_t>(given[1] + 0xA0);
            count = 3;
            break;
        default:
            return false;
    }
    if (form == JIS_FORM_X0208 && euc[0] == 0xAD && is_euc_byte(euc[1])) {
        const uint16_t extension = MS_Sun_extension_table[euc[1] - 0xA1];
        if (extension != kNoCharacter) {
            *unit = extension;
            return true;
        }
    }
    uint16_t *slot = cache_slot(euc, count);
    if (slot && *slot != 0) {
        if (*slot == kNoCharacter) return false;
        *unit = *slot;
        return true;
    }
    uint16_t converted;
    const bool ok = convert(cd, euc, count, &converted);
    // A failed call may have written part of what it read (a garbage row
    // that yields an ASCII byte, say): the unit keeps the failure mark.
    if (ok) *unit = converted;
    if (slot && (!ok || (converted != 0 && converted != kNoCharacter))) *slot = ok ? converted : kNoCharacter;
    return ok;
}

bool multibyte_to_unicode(uint32_t kind, const uint8_t *code, uint16_t *unit) {
    switch (kind) {
        case MB_KIND_SINGLE:
            if (is_katakana(code[0])) {
                const uint8_t position = static_cast<uint8_t>(code[0] - 0xA0);
                return jis_to_unicode(&position, unit, JIS_FORM_KATAKANA);
            }
            *unit = code[0];  // any other byte is its own code point
            return true;
        case MB_KIND_JISX0208:
            return jis_to_unicode(code, unit, JIS_FORM_X0208);
        case MB_KIND_JISX0212:
            return jis_to_unicode(code, unit, JIS_FORM_X0212);
        case MB_KIND_SJIS: {
            uint8_t sjisKind, consumed;
            JisCode jis;
            if (!sjis_to_jis(code, &sjisKind, &jis, &consumed)) return false;
            return multibyte_to_unicode(sjisKind, jis.byte, unit);
        }
        default:
            return false;
    }
}

bool eucjp_to_unicode(const uint8_t **cursor, uint16_t *unit) {
    const uint8_t *p = *cursor;
    const uint8_t b0 = p[0];
    if (b0 < 0x80 || (b0 <= 0x9F && b0 != 0x8E && b0 != 0x8F)) {
        *unit = b0;  // ASCII and the C1 controls stand for themselves
        *cursor = p + 1;
        return true;
    }
    // A sequence cut short by the terminator fails; nothing after it is read.
    if (p[1] == 0) return false;
    if (b0 == 0x8E) {
        if (!multibyte_to_unicode(MB_KIND_SINGLE, p + 1, unit)) return false;
        *cursor = p + 2;
        return true;
    }
    if (b0 == 0x8F) {
        if (p[2] == 0) return false;
        const uint8_t code[2] = {static_cast<uint8_t>(p[1] + 0x60), static_cast<uint8_t>(p[2] + 0x60)};
        if (!jis_to_unicode(code, unit, JIS_FORM_X0212)) return false;
        *cursor = p + 3;
        return true;
    }
    const uint8_t code[2] = {static_cast<uint8_t>(b0 + 0x60), static_cast<uint8_t>(p[1] + 0x60)};
    if (!jis_to_unicode(code, unit, JIS_FORM_X0208)) return false;
    *cursor = p + 2;
    return true;
}

}  // namespace textconv::japanese

using namespace textconv::japanese;

extern "C" {

TEXTCONV_API int ConvertFromJISToUnicode(const uint8_t *given, uint16_t *unit, uint32_t form) {
    return jis_to_unicode(given, unit, form);
}

TEXTCONV_API int FromMultiByteToUnicode(uint32_t kind, const uint8_t *code, uint16_t *unit) {
    return multibyte_to_unicode(kind, code, unit);
}

TEXTCONV_API int FromEUCJPToUnicode(const char **cursor, uint16_t *unit) {
    return eucjp_to_unicode(reinterpret_cast<const uint8_t **>(cursor), unit);
}

}  // extern "C"
