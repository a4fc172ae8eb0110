// Japanese strings to UTF-8, and EUC-JP to Shift-JIS by way of UTF-16.
#include "japanese/japanese.h"

namespace textconv::japanese {

namespace {

// What a well-formed EUC-JP character that decodes to UTF-16 becomes in
// Shift-JIS, kept per row/cell once known (both converters are stateless):
// 0 not yet known, kSjisSpace no Shift-JIS form, 0x01xx the single byte xx,
// anything else lead << 8 | trail. Filled only after a real round trip, so
// the converters have been opened and the first-use step taken by then.
constexpr uint16_t kSjisSpace = 1;
uint16_t x0208Sjis[kCells * kCells];
uint16_t x0212Sjis[kCells * kCells];
uint16_t katakanaSjis[0xDF - 0xA1 + 1];

uint16_t *sjis_slot(const uint8_t *p) {
    if (is_euc_byte(p[0]))
        return is_euc_byte(p[1]) ? &x0208Sjis[(p[0] - 0xA1) * kCells + (p[1] - 0xA1)] : nullptr;
    if (p[0] == 0x8E) return is_katakana(p[1]) ? &katakanaSjis[p[1] - 0xA1] : nullptr;
    if (p[0] == 0x8F && is_euc_byte(p[1]) && is_euc_byte(p[2]))
        return &x0212Sjis[(p[1] - 0xA1) * kCells + (p[2] - 0xA1)];
    return nullptr;
}

// A known unit in UTF-8: the bytes FromUCS4toUTF8 writes for it, without a
// call through the symbol table for every character of a long text.
inline uint8_t put_utf8(uint16_t unit, char *out) {
    if (unit < 0x80) {
        out[0] = static_cast<char>(unit);
        return 1;
    }
    if (unit < 0x800) {
        out[0] = static_cast<char>(0xC0 | unit >> 6);
        out[1] = static_cast<char>(0x80 | (unit & 0x3F));
        return 2;
    }
    out[0] = static_cast<char>(0xE0 | unit >> 12);
    out[1] = static_cast<char>(0x80 | (unit >> 6 & 0x3F));
    out[2] = static_cast<char>(0x80 | (unit & 0x3F));
    return 3;
}

uint16_t sjis_of_unit(uint16_t unit) {
    if (unit <= 0x7F) return 0x100 | unit;
    uint8_t euc[3], kind, sjis[2], length;
    JisCode jis;
    if (!unicode_to_eucjp(unit, euc) || !classify_eucjp(euc, &kind, &jis)) return kSjisSpace;
    if (!jis_to_sjis(kind == MB_KIND_ASCII ? uint8_t{MB_KIND_SINGLE} : kind, &jis, sjis, &length))
        return kSjisSpace;
    return length == 1 ? 0x100 | sjis[0] : static_cast<uint16_t>(sjis[0] << 8 | sjis[1]);
}

uint32_t eucjp_to_utf8(const uint8_t *euc, char *utf8, uint8_t *count) {
    const uint8_t b0 = euc[0];
    if (b0 < 0x80) {
        utf8[0] = static_cast<char>(b0);
        *count = 1;
        return 1;
    }
    uint16_t unit;
    uint32_t taken;
    if (is_euc_byte(b0) && b0 != 0xAD && is_euc_byte(euc[1]) && decoder_warm() &&
        (unit = x0208Units[(b0 - 0xA1) * kCells + (euc[1] - 0xA1)]) != 0) {
        *count = put_utf8(unit, utf8);
        return 2;
    }
    // A character cut short, by the terminator or by an ASCII byte, cannot
    // start here: nothing after the terminator is read, no ASCII byte is
    // taken into a bad sequence, and no more than three UTF-8 bytes are
    // written for every two EUC-JP bytes, as callers size their buffers.
    if (is_euc_byte(b0)) {
        if (euc[1] < 0x80) return 0;
        const uint8_t code[2] = {static_cast<uint8_t>(b0 + 0x60), static_cast<uint8_t>(euc[1] + 0x60)};
        jis_to_unicode(code, &unit, JIS_FORM_X0208);
        taken = 2;
    } else if (b0 == 0x8E) {
        if (euc[1] < 0x80) return 0;
        const uint8_t position = static_cast<uint8_t>(euc[1] + 0x60);
        jis_to_unicode(&position, &unit, JIS_FORM_KATAKANA);
        taken = 2;
    } else if (b0 == 0x8F) {
        if (euc[1] < 0x80 || euc[2] < 0x80) return 0;
        const uint8_t code[2] = {static_cast<uint8_t>(euc[1] + 0x60), static_cast<uint8_t>(euc[2] + 0x60)};
        jis_to_unicode(code, &unit, JIS_FORM_X0212);
        taken = 3;
    } else {
        return 0;
    }
    // A failed conversion leaves kNoCharacter in the unit: U+FFFF.
    FromUCS4toUTF8(unit, utf8, count);
    return taken;
}

}  // namespace

}  // namespace textconv::japanese

using namespace textconv::japanese;

extern "C" {

TEXTCONV_API uint32_t FromEUCJPtoUTF8(const char *euc, char *utf8, uint8_t *count) {
    return eucjp_to_utf8(reinterpret_cast<const uint8_t *>(euc), utf8, count);
}

TEXTCONV_API int StringFromEUCJPToUTF8(const char *euc, char *utf8, uint32_t *length) {
    const auto *in = reinterpret_cast<const uint8_t *>(euc);
    char *out = utf8;
    bool warm = decoder_warm();
    while (*in != 0) {
        const uint8_t b0 = *in;
        if (b0 < 0x80) {
            *out++ = static_cast<char>(b0);
            ++in;
            continue;
        }
        if (warm && is_euc_byte(b0) && b0 != 0xAD && is_euc_byte(in[1])) {
            if (const uint16_t unit = x0208Units[(b0 - 0xA1) * kCells + (in[1] - 0xA1)]) {
                out += put_utf8(unit, out);
                in += 2;
                continue;
            }
        }
        uint8_t count = 0;
        const uint32_t taken = eucjp_to_utf8(in, out, &count);
        if (taken == 0) return 0;
        in += taken;
        out += count;
        warm = decoder_warm();
    }
    *out = 0;
    *length = static_cast<uint32_t>(out - utf8) + 1;
    return 1;
}

TEXTCONV_API int StringFromSJISToUTF8(const char *sjis, char *utf8, uint32_t *length) {
    const auto *in = reinterpret_cast<const uint8_t *>(sjis);
    char *out = utf8;
    *length = 1;
    bool warm = decoder_warm();
    while (*in != 0) {
        if (*in >= 0x20 && *in <= 0x7E) {
            *out++ = static_cast<char>(*in++);
            continue;
        }
        uint8_t kind, consumed, count = 0;
        JisCode jis;
        uint8_t euc[3] = {0, 0, 0};
        if (!sjis_to_jis(in, &kind, &jis, &consumed)) {
            *length = static_cast<uint32_t>(out - utf8) + 1;
            return 0;
        }
        if (warm && kind == MB_KIND_JISX0208 && jis.byte[0] != 13) {
            const uint16_t unit = x0208Units[(jis.byte[0] - 1) * kCells + (jis.byte[1] - 1)];
            if (unit != 0) {
                out += put_utf8(unit, out);
                in += consumed;
                continue;
            }
        }
        if (kind == MB_KIND_SINGLE && is_katakana(jis.byte[0])) {
            euc[0] = 0x8E;
            euc[1] = jis.byte[0];
        } else if (kind == MB_KIND_SINGLE) {
            euc[0] = jis.byte[0];
        } else {
            euc[0] = static_cast<uint8_t>(jis.byte[0] + 0xA0);
            euc[1] = static_cast<uint8_t>(jis.byte[1] + 0xA0);
        }
        eucjp_to_utf8(euc, out, &count);  // cannot fail: the bytes are well formed
        out += count;
        in += consumed;
        warm = decoder_warm();
    }
    *out = 0;
    *length = static_cast<uint32_t>(out - utf8) + 1;
    return 1;
}

TEXTCONV_API int StringFromEUCJPToSJIS(const char *euc, char *sjis, int32_t *length) {
    const auto *in = reinterpret_cast<const uint8_t *>(euc);
    auto *out = reinterpret_cast<uint8_t *>(sjis);
    const int32_t limit = *length;
    // A negative room leaves no byte for the terminator: write nothing.
    if (limit < 0) {
        *length = 0;
        return 1;
    }
    int32_t count = 0;
    int result = 1;
    while (*in != 0 && count < limit) {
        const uint8_t b0 = *in;
        if (b0 < 0x80) {
            out[count++] = b0;
            ++in;
            continue;
        }
        uint16_t *slot = sjis_slot(in);
        uint16_t packed;
        if (slot && *slot != 0) {
            packed = *slot;
            in += b0 == 0x8F ? 3 : 2;
        } else {
            const uint8_t *next = in;
            uint16_t unit;
            if (!eucjp_to_unicode(&next, &unit)) {
                out[count++] = ' ';
                result = 0;
                // Step over the bad sequence by its first byte, but never
                // over the terminator or an ASCII byte, which is read again.
                int step = b0 == 0x8F ? 3 : (b0 == 0x8E || is_euc_byte(b0)) ? 2 : 1;
                ++in;
                while (--step > 0 && *in >= 0x80) ++in;
                continue;
            }
            packed = sjis_of_unit(unit);
            if (slot) *slot = packed;
            in = next;
        }
        if (packed == kSjisSpace) {
            out[count++] = ' ';
            result = 0;
        } else if (packed < 0x200) {
            out[count++] = static_cast<uint8_t>(packed);
        } else {
            if (limit - count < 2) break;  // a two-byte item that does not fit ends the conversion
            out[count] = static_cast<uint8_t>(packed >> 8);
            out[count + 1] = static_cast<uint8_t>(packed);
            count += 2;
        }
    }
    out[count] = 0;
    *length = count + 1;
    return result;
}

}  // extern "C"
