// Comparing two strings, each in UTF-8 or the local encoding, one character
// of each at a time.
#include <ctype.h>

#include <cstring>

#include "textconv.h"

namespace {

using Decoder = int (*)(const char **, uint16_t *, uint32_t *);

// One character of a string into unit[0..1]. False when the decoder fails,
// makes no progress, or takes the string's terminator into a character: the
// walk never goes past the end of either string.
bool decode(Decoder decoder, const char *&cursor, uint16_t unit[2], uint32_t &count) {
    const char *start = cursor;
    if (!decoder(&cursor, unit, &count)) return false;
    if (count == 2 && unit[0] == 0) return true;
    return cursor > start && !std::memchr(start, 0, static_cast<size_t>(cursor - start));
}

// The number of leading bytes that a and b share among their first n, both
// readable that far. Eight bytes at a time while they agree.
size_t common_prefix(const char *a, const char *b, size_t n) {
    size_t p = 0;
    for (; p + 8 <= n; p += 8) {
        uint64_t x;
        uint64_t y;
        std::memcpy(&x, a + p, 8);
        std::memcpy(&y, b + p, 8);
        if (x != y) break;
    }
    while (p < n && a[p] == b[p]) ++p;
    return p;
}

// The length of the longest run of whole well-formed UTF-8 sequences at the
// start of the n bytes at s. ASCII eight bytes at a time, the other forms by
// their lead byte, without reading past the n bytes.
size_t wellformed_prefix(const unsigned char *s, size_t n) {
    size_t q = 0;
    while (q < n) {
        const unsigned char c = s[q];
        if (c < 0x80) {
            ++q;
            if (q < n && s[q] < 0x80) {
                while (q + 8 <= n) {
                    uint64_t x;
                    std::memcpy(&x, s + q, 8);
                    if (x & 0x8080808080808080u) break;
                    q += 8;
                }
            }
            continue;
        }
        if (c < 0xC2) break;
        if (c < 0xE0) {
            // Runs of two-byte letters (Cyrillic, Greek, Hebrew, Arabic).
            do {
                if (q + 2 > n || (s[q + 1] & 0xC0) != 0x80) return q;
                q += 2;
            } while (q < n && s[q] >= 0xC2 && s[q] < 0xE0);
            continue;
        }
        if (c < 0xF0) {
            // Runs of three-byte characters (CJK, most other scripts).
            do {
                if (q + 3 > n) return q;
                const unsigned char lead = s[q];
                const unsigned char t = s[q + 1];
                if (((t | (s[q + 2] << 8)) & 0xC0C0) != 0x8080) return q;
                // No overlong form (E0 80..9F) and no surrogate (ED A0..BF).
                if ((lead == 0xE0 && t < 0xA0) || (lead == 0xED && t > 0x9F)) return q;
                q += 3;
            } while (q < n && (s[q] & 0xF0) == 0xE0);
            continue;
        }
        if (c < 0xF5) {
            if (q + 4 > n) break;
            const unsigned char t = s[q + 1];
            const unsigned char lo = c == 0xF0 ? 0x90 : 0x80;
            const unsigned char hi = c == 0xF4 ? 0x8F : 0xBF;
            if (t < lo || t > hi || (s[q + 2] & 0xC0) != 0x80 || (s[q + 3] & 0xC0) != 0x80) break;
            q += 4;
            continue;
        }
        break;
    }
    return q;
}

}  // namespace

extern "C" {

TEXTCONV_API int StringsEquivalent(const char *first, int32_t firstEncoding, const char *second,
                                   int32_t secondEncoding, uint8_t ignoreCase) {
    // CHARSET_UTF8 selects UTF-8; any other value the local encoding.
    const Decoder firstDecoder = firstEncoding == CHARSET_UTF8 ? FromUTF8ToUnicode : FromLocalToUnicode;
    const Decoder secondDecoder = secondEncoding == CHARSET_UTF8 ? FromUTF8ToUnicode : FromLocalToUnicode;
    const bool bothUtf8 = firstEncoding == CHARSET_UTF8 && secondEncoding == CHARSET_UTF8;
    const char *a = first;
    const char *b = second;
    // Both in UTF-8: the string ends are known, so equal runs can be found
    // and checked a word at a time without reading past either terminator.
    const char *const firstEnd = bothUtf8 ? first + std::strlen(first) : nullptr;
    const char *const secondEnd = bothUtf8 ? second + std::strlen(second) : nullptr;
    for (;;) {
        if (bothUtf8) {
            const size_t ra = static_cast<size_t>(firstEnd - a);
            const size_t rb = static_cast<size_t>(secondEnd - b);
            const size_t shorter = ra < rb ? ra : rb;
            const size_t same = common_prefix(a, b, shorter + 1);  // the shorter string's NUL included
            const size_t skip = wellformed_prefix(reinterpret_cast<const unsigned char *>(a),
                                                  same < shorter ? same : shorter);
            if (skip == shorter && same == shorter + 1) return 1;  // equal and well-formed to both ends
            a += skip;
            b += skip;
        }

        uint16_t ua[2];
        uint16_t ub[2];
        uint32_t ca = 0;
        uint32_t cb = 0;
        if (!decode(firstDecoder, a, ua, ca)) return 0;
        if (!decode(secondDecoder, b, ub, cb)) return 0;
        if (ca != cb) return 0;
        if (ca != 2) {
            // Two units each: compared as they are, no folding.
            if (ua[0] != ub[0] || ua[1] != ub[1]) return 0;
            continue;
        }
        if (ua[0] == 0) return ub[0] == 0;
        if (ub[0] == 0) return 0;
        if (ua[0] == ub[0]) continue;
        if (!ignoreCase || ua[0] > 0xFF || ub[0] > 0xFF) return 0;
        const int32_t *upper = *__ctype_toupper_loc();
        if (upper[ua[0]] != upper[ub[0]]) return 0;
    }
}

}  // extern "C"
