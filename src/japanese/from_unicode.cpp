// Single UTF-16 units to EUC-JP, JIS row/cell codes and Shift-JIS through the
// platform's EUC-JP converter, with row 13 from the library's table as the
// fallback.
#include <iconv.h>

#include "frame/registry.h"
#include "japanese/japanese.h"

namespace textconv::japanese {

namespace {

iconv_t encoder() {
    const iconv_t cell = unicodeToEucjpConverter;
    if (cell != unopened_cell() && cell != failed_cell()) return cell;
    return acquire_converter(&unicodeToEucjpConverter, "EUC-JP", Pivot::Source);
}

bool request_accepts(uint32_t request, uint8_t kind) {
    switch (request) {
        case MB_KIND_SINGLE:
            return kind == MB_KIND_SINGLE || kind == MB_KIND_ASCII;
        case MB_KIND_JISX0208:
        case MB_KIND_JISX0212:
            return kind == request;
        case MB_KIND_ANY:
            return true;  // every kind that classify_eucjp reports
        default:
            return false;
    }
}

}  // namespace

bool unicode_to_eucjp(uint16_t unit, uint8_t euc[3]) {
    const iconv_t cd = encoder();
    if (!cd) return false;
    uint8_t converted[3];
    char *in = reinterpret_cast<char *>(&unit);
    char *out = reinterpret_cast<char *>(converted);
    size_t inLeft = sizeof unit, outLeft = sizeof converted;
    if (iconv(cd, &in, &inLeft, &out, &outLeft) != static_cast<size_t>(-1) && outLeft < sizeof converted) {
        for (size_t i = 0; i < sizeof converted - outLeft; ++i) euc[i] = converted[i];
        return true;
    }
    if (unit == kNoCharacter) return false;
    for (int i = 0; i < kCells; ++i) {
        if (MS_Sun_extension_table[i] == unit) {
            euc[0] = 0xAD;
            euc[1] = static_cast<uint8_t>(0xA1 + i);
            return true;
        }
    }
    return false;
}

bool classify_eucjp(const uint8_t euc[3], uint8_t *kind, JisCode *jis) {
    const uint8_t e0 = euc[0];
    if (e0 == 0x8E) {
        *kind = MB_KIND_SINGLE;
        jis->byte[0] = euc[1];
    } else if (e0 == 0x8F) {
        *kind = MB_KIND_JISX0212;
        jis->byte[0] = static_cast<uint8_t>(euc[1] + 0x60);
        jis->byte[1] = static_cast<uint8_t>((euc[2] & 0x7F) - 0x20);
    } else if (is_euc_byte(e0)) {
        *kind = MB_KIND_JISX0208;
        jis->byte[0] = static_cast<uint8_t>(e0 + 0x60);
        jis->byte[1] = static_cast<uint8_t>(euc[1] + 0x60);
    } else if (e0 <= 0x1F || (e0 >= 0x7F && e0 <= 0x9F)) {
        return false;
    } else if (e0 != 0x20 && e0 <= 0x7E) {
        *kind = MB_KIND_ASCII;
        jis->byte[0] = e0;
    } else {  // 0x20, 0xA0, 0xFF
        *kind = MB_KIND_SINGLE;
        jis->byte[0] = e0 & 0x7F;
    }
    return true;
}

bool unicode_to_multibyte(uint16_t unit, uint32_t request, uint8_t *kind, uint8_t *code, uint8_t *length) {
    if (request == 0 || request > MB_KIND_SJIS) return false;
    uint8_t euc[3];
    uint8_t found;
    JisCode jis;
    if (!unicode_to_eucjp(unit, euc) || !classify_eucjp(euc, &found, &jis)) return false;
    if (request == MB_KIND_SJIS) {
        // A printable ASCII character becomes its own single byte.
        if (!jis_to_sjis(found == MB_KIND_ASCII ? uint8_t{MB_KIND_SINGLE} : found, &jis, code, length))
            return false;
        if (kind) *kind = MB_KIND_SJIS;
        return true;
    }
    if (!request_accepts(request, found)) return false;
    if (kind) *kind = found;
    code[0] = jis.byte[0];
    if (found == MB_KIND_JISX0208 || found == MB_KIND_JISX0212) {
        code[1] = jis.byte[1];
        *length = 2;
    } else {
        *length = 1;
    }
    return true;
}

}  // namespace textconv::japanese

using namespace textconv::japanese;

extern "C" {

TEXTCONV_API int ConvertFromUnicodeToEUCJP(uint16_t unit, char *euc) {
    return unicode_to_eucjp(unit, reinterpret_cast<uint8_t *>(euc));
}

TEXTCONV_API int FromUnicodeToMultiByte(uint16_t unit, uint32_t request, uint8_t *kind, uint8_t *code,
                                        uint8_t *length) {
    return unicode_to_multibyte(unit, request, kind, code, length);
}

TEXTCONV_API int FromUnicodeToEUCJP(uint16_t unit, char **cursor) {
    auto *out = reinterpret_cast<uint8_t *>(*cursor);
    // The C0 and C1 controls pass as they are, but not the single shifts.
    if (unit <= 0x8D || (unit >= 0x90 && unit <= 0x9F)) {
        out[0] = static_cast<uint8_t>(unit);
        *cursor += 1;
        return 1;
    }
    uint8_t kind = 0, code[2] = {0, 0}, length = 0;
    if (!unicode_to_multibyte(unit, MB_KIND_ANY, &kind, code, &length)) return 0;
    size_t written;
    switch (kind) {
        case MB_KIND_SINGLE:
            // Only katakana takes the single shift; a space stays one byte.
            if (!is_katakana(code[0])) {
                out[0] = code[0];
                written = 1;
                break;
            }
            out[0] = 0x8E;
            out[1] = code[0];
            written = 2;
            break;
        case MB_KIND_JISX0208:
            out[0] = static_cast<uint8_t>(code[0] + 0xA0);
            out[1] = static_cast<uint8_t>(code[1] + 0xA0);
            written = 2;
            break;
        case MB_KIND_JISX0212:
            out[0] = 0x8F;
            out[1] = static_cast<uint8_t>(code[0] + 0xA0);
            out[2] = static_cast<uint8_t>(code[1] + 0xA0);
            written = 3;
            break;
        case MB_KIND_ASCII:
            out[0] = code[0];
            written = 1;
            break;
        default:
            return 0;
    }
    *cursor += written;
    return 1;
}

}  // extern "C"
