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

// The length of the well-formed UTF-8 sequence at p (1 to 4), or 0. Such a
// sequence always decodes to its code point, so two equal ones are
// equivalent without decoding.
inline unsigned wellformed_length(const unsigned char *p) {
    const unsigned char lead = p[0];
    auto trail = [p](int i, unsigned char lo = 0x80, unsigned char hi = 0xBF) {
        return p[i] >= lo && p[i] <= hi;
    };
    if (lead < 0x80) return 1;
    if (lead < 0xC2) return 0;
    if (lead < 0xE0) return trail(1) ? 2 : 0;
    if (lead < 0xF0) {
        const bool second = lead == 0xE0 ? trail(1, 0xA0) : lead == 0xED ? trail(1, 0x80, 0x9F) : trail(1);
        return second && trail(2) ? 3 : 0;
    }
    if (lead < 0xF5) {
        const bool second = lead == 0xF0 ? trail(1, 0x90) : lead == 0xF4 ? trail(1, 0x80, 0x8F) : trail(1);
        return second && trail(2) && trail(3) ? 4 : 0;
    }
    return 0;
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
    for (;;) {
        if (bothUtf8) {
            // Equal well-formed sequences are equal characters: skip them.
            const auto *pa = reinterpret_cast<const unsigned char *>(a);
            const auto *pb = reinterpret_cast<const unsigned char *>(b);
            while (*pa == *pb && *pa) {
                const unsigned n = wellformed_length(pa);
                // Byte by byte: the second string may end inside the sequence.
                unsigned same = 1;
                while (same < n && pa[same] == pb[same]) ++same;
                if (n == 0 || same != n) break;
                pa += n;
                pb += n;
            }
            if (*pa == 0 && *pb == 0) return 1;
            a = reinterpret_cast<const char *>(pa);
            b = reinterpret_cast<const char *>(pb);
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
