// Shift-JIS, JIS row/cell and EUC-JP by arithmetic: single characters, the
// Shift-JIS to EUC-JP string conversion and its local-encoding wrapper.
#include <cstring>

#include "japanese/japanese.h"

namespace textconv::japanese {

bool jis_to_sjis(uint32_t kind, const JisCode *jis, uint8_t *sjis, uint8_t *length) {
    if (kind == MB_KIND_SINGLE) {
        if (!is_sjis_single(jis->byte[0])) return false;
        sjis[0] = jis->byte[0];
        *length = 1;
        return true;
    }
    if (kind != MB_KIND_JISX0208) return false;
    const uint8_t row = jis->byte[0], cell = jis->byte[1];
    if (row < 1 || row > kCells || cell < 1 || cell > kCells) return false;
    const unsigned j1 = row + 0x20u, j2 = cell + 0x20u;
    sjis[0] = static_cast<uint8_t>((j1 <= 0x5E ? 0x70 : 0xB0) + (j1 + 1) / 2);
    if (j1 % 2 == 0)
        sjis[1] = static_cast<uint8_t>(j2 + 0x7E);
    else
        sjis[1] = static_cast<uint8_t>(j2 <= 0x5F ? j2 + 0x1F : j2 + 0x20);
    *length = 2;
    return true;
}

}  // namespace textconv::japanese

using namespace textconv::japanese;

extern "C" {

TEXTCONV_API int FromSJisToJis(const char *sjis, uint8_t *kind, JisCode *jis, uint8_t *consumed) {
    return sjis_to_jis(reinterpret_cast<const uint8_t *>(sjis), kind, jis, consumed);
}

TEXTCONV_API int FromJisToSJis(uint32_t kind, const JisCode *jis, char *sjis, uint8_t *length) {
    return jis_to_sjis(kind, jis, reinterpret_cast<uint8_t *>(sjis), length);
}

TEXTCONV_API int StringFromSJISToEUCJP(const char *sjis, char *euc, uint32_t *length) {
    const auto *in = reinterpret_cast<const uint8_t *>(sjis);
    auto *out = reinterpret_cast<uint8_t *>(euc);
    const uint32_t capacity = *length;
    // Not even the terminator fits: write nothing rather than past the buffer.
    if (capacity == 0) return 1;
    const uint32_t room = capacity - 1;  // the last byte is the terminator's
    uint32_t written = 0;
    int result = 1;
    while (*in != 0 && written < room) {
        uint8_t kind, consumed;
        JisCode jis;
        if (!sjis_to_jis(in, &kind, &jis, &consumed)) {
            out[written++] = ' ';
            ++in;
            result = 0;
            continue;
        }
        if (kind == MB_KIND_SINGLE && !is_katakana(jis.byte[0])) {
            out[written++] = jis.byte[0];
        } else {
            if (room - written < 2) break;  // a two-byte item that does not fit ends the conversion
            if (kind == MB_KIND_SINGLE) {
                out[written] = 0x8E;
                out[written + 1] = jis.byte[0];
            } else {
                out[written] = static_cast<uint8_t>(jis.byte[0] + 0xA0);
                out[written + 1] = static_cast<uint8_t>(jis.byte[1] + 0xA0);
            }
            written += 2;
        }
        in += consumed;
    }
    out[written] = 0;
    *length = written + 1;
    return result;
}

TEXTCONV_API int StringToCurrentEncoding(const char *sjis, char **result) {
    *result = const_cast<char *>(sjis);
    if (LocalEncoding() != CHARSET_EUCJP) return 0;
    const size_t n = strlen(sjis);
    // 2n + 1 bytes hold any conversion: only a katakana byte grows, to two.
    if (n > (UINT32_MAX - 1) / 2) return 0;
    uint32_t capacity = static_cast<uint32_t>(2 * n + 1);
    void *block = nullptr;
    if (Mem_alloc(1, capacity, &block) != 0) return 0;
    if (StringFromSJISToEUCJP(sjis, static_cast<char *>(block), &capacity) != 1) {
        Mem_free(1, block);
        return 0;
    }
    *result = static_cast<char *>(block);
    return 1;
}

}  // extern "C"
