// UTF-8 <-> UTF-16: the scalar reference loops and the exported wrappers.
#include <cstring>

#if defined(__SSE2__)
#include <emmintrin.h>
#endif

#include "textconv.h"
#include "unicode/utf_internal.h"
#include "unicode/utf_scalar.h"

namespace textconv {

uint32_t utf8_to_utf16_scalar(const uint8_t *src, uint32_t len, uint16_t *dst, uint32_t cap,
                              uint32_t *written) {
    uint32_t p = 0, w = 0;
    while (p < len) {
        uint32_t r = utf8_decode_step(src, len, p, dst, cap, w);
        if (r != kStepContinue) return r;
    }
    *written = w;
    return TEXTCONV_UTF_DONE;
}

uint32_t utf16_to_utf8_scalar(const uint16_t *src, uint32_t len, uint8_t *dst, uint32_t cap,
                              uint32_t *written) {
    len &= ~1u;  // a stray odd byte is not part of any unit
    uint32_t r = 0, w = 0;
    while (r < len) {
        uint32_t res = utf16_encode_step(src, len, r, dst, cap, w);
        if (res != kStepContinue) return res;
    }
    *written = w;
    return TEXTCONV_UTF_DONE;
}

}  // namespace textconv

using namespace textconv;

namespace {

const uint8_t *bytes(const char *s) { return reinterpret_cast<const uint8_t *>(s); }

size_t units_before_terminator(const uint16_t *s) {
    size_t n = 0;
    while (s[n] != 0) ++n;
    return n;
}

bool holds_replacement(const uint16_t *units, uint32_t n) {
    uint32_t k = 0;
#if defined(__SSE2__)
    const __m128i replacement = _mm_set1_epi16(static_cast<short>(kReplacementCharacter));
    __m128i seen = _mm_setzero_si128();
    for (; n - k >= 8; k += 8)
        seen = _mm_or_si128(
            seen,
            _mm_cmpeq_epi16(_mm_loadu_si128(reinterpret_cast<const __m128i *>(units + k)), replacement));
    if (_mm_movemask_epi8(seen) != 0) return true;
#endif
    for (; k < n; ++k)
        if (units[k] == kReplacementCharacter) return true;
    return false;
}

// A list decoded in one pass: each NUL becomes the 0 unit after its string.
// This equals decoding string by string unless a string ends inside a
// sequence, whose cut bytes then give U+FFFD instead of failing the list; so
// the pass counts only when its output holds no U+FFFD. (Text with real
// U+FFFD in it takes the string-by-string road, to the same result.)
bool decode_list_whole(const uint8_t *in, uint32_t len, uint16_t *out, uint32_t size, uint32_t &written) {
    uint32_t w = 0;
    if (utf8_to_utf16(in, len, out, size, &w) != TEXTCONV_UTF_DONE) return false;
    if (holds_replacement(out, w / 2)) return false;
    written = w;
    if (len > 0 && in[len - 1] != 0) {  // the last string's 0 unit
        out[w / 2] = 0;
        written += 2;
    }
    return true;
}

}  // namespace

extern "C" {

TEXTCONV_API uint32_t ConvertUTF8toUTF16(const char *source, uint32_t sourceLength, uint16_t *target,
                                         uint32_t targetCapacity, uint32_t *written) {
    return utf8_to_utf16(bytes(source), sourceLength, target, targetCapacity, written);
}

TEXTCONV_API uint32_t ConvertUTF16toUTF8(const uint16_t *source, uint32_t sourceLength, char *target,
                                         uint32_t targetCapacity, uint32_t *written) {
    return utf16_to_utf8(source, sourceLength, reinterpret_cast<uint8_t *>(target), targetCapacity, written);
}

// The text is decoded without its terminator, so a sequence cut short by the
// NUL is incomplete (never completed by the NUL or by bytes beyond it), and
// the 0 unit is written only when it fits.
TEXTCONV_API int StringFromUTF8ToUnicode(const char *source, uint16_t *target, uint32_t *length) {
    const uint32_t capacity = *length;
    const uint32_t n = static_cast<uint32_t>(std::strlen(source));
    uint32_t w = 0;
    if (utf8_to_utf16(bytes(source), n, target, capacity, &w) != TEXTCONV_UTF_DONE || capacity - w < 2) {
        *length = 0;
        return 0;
    }
    target[w / 2] = 0;
    *length = w + 2;
    return 1;
}

TEXTCONV_API int StringFromUnicodeToUTF8(const uint16_t *source, char *target, uint32_t *length) {
    const uint32_t units = static_cast<uint32_t>(units_before_terminator(source)) + 1;
    uint32_t w = 0;
    if (utf16_to_utf8(source, units * 2, reinterpret_cast<uint8_t *>(target), *length, &w) !=
        TEXTCONV_UTF_DONE) {
        *length = 0;
        return 0;
    }
    *length = w;
    return 1;
}

// One character: the lead byte and the trailing bytes it announces. The
// bytes are looked at one by one and never past a NUL: a NUL inside the
// sequence cuts it short (failure, the cursor stops on the NUL); any other
// byte that is not a trailing byte makes the lead byte illegal on its own (one
// U+FFFD, the cursor moves past the lead byte only).
TEXTCONV_API int FromUTF8ToUnicode(const char **cursor, uint16_t *target, uint32_t *written) {
    const uint8_t *s = bytes(*cursor);
    const uint32_t n = static_cast<uint32_t>(utf8TrailingByteCount[s[0]]) + 1;
    for (uint32_t k = 1; k < n; ++k) {
        if ((s[k] & 0xC0) == 0x80) continue;
        if (s[k] == 0) {
            *cursor += k;
            return 0;
        }
        *cursor += 1;
        target[0] = kReplacementCharacter;
        *written = 2;
        return 1;
    }
    *cursor += n;
    return utf8_to_utf16_scalar(s, n, target, 4, written) == TEXTCONV_UTF_DONE;
}

TEXTCONV_API int FromUnicodeToUTF8(uint32_t unit, char **cursor) {
    const uint16_t u = static_cast<uint16_t>(unit);
    uint32_t w = 0;
    utf16_to_utf8_scalar(&u, 2, reinterpret_cast<uint8_t *>(*cursor), 6, &w);
    *cursor += w;
    return 1;
}

TEXTCONV_API int StringListFromUTF8toUTF16(char **list, uint32_t *length) {
    const uint32_t len = *length;
    const uint8_t *in = bytes(*list);
    // Each byte gives at most one unit; a last string without its NUL still
    // gets its 0 unit, which needs 2 bytes more.
    const bool openEnd = len > 0 && in[len - 1] != 0;
    if (len > (UINT32_MAX - 2) / 2) return 0;
    const uint32_t size = 2 * len + (openEnd ? 2 : 0);
    auto *out = static_cast<uint16_t *>(HostMalloc(size, 1));
    if (out == nullptr) return 0;
    uint32_t i = 0, o = 0;
    if (decode_list_whole(in, len, out, size, o)) i = len;
    while (i < len) {
        const void *nul = std::memchr(in + i, 0, len - i);
        const uint32_t end = nul ? static_cast<uint32_t>(static_cast<const uint8_t *>(nul) - in) : len;
        uint32_t w = 0;
        if (utf8_to_utf16(in + i, end - i, out + o / 2, size - o, &w) != TEXTCONV_UTF_DONE) {
            HostFree(out);
            return 0;
        }
        o += w;
        out[o / 2] = 0;
        o += 2;
        i = end + 1;
    }
    *list = reinterpret_cast<char *>(out);
    *length = o;
    return 1;
}

}  // extern "C"
