// One character at a time between a registered charset (or KOI8-R) and one
// UTF-16 unit. Each function converts into a small static buffer of its own,
// which bounds the character, then copies the result out; none allocates.
#include <errno.h>
#include <iconv.h>
#include <stdio.h>
#include <string.h>

#include "engine/engine.h"
#include "frame/registry.h"

namespace textconv::engine {
namespace {

constexpr size_t kIconvFailed = static_cast<size_t>(-1);
constexpr uint16_t kByteOrderMark = 0xFEFF;
constexpr uint16_t kReplacement = 0xFFFD;
constexpr size_t kLongestCharacter = 4;

char fromUnicodeCharBuffer[4];
char toUnicodeCharBuffer[4];
char koi8rCharBuffer[1];
char koi8rUnicodeBuffer[4];

constexpr char kKoi8rName[] = "KOI8-R";

uint16_t unit_at(const char *p, size_t index) {
    uint16_t unit;
    memcpy(&unit, p + 2 * index, 2);
    return unit;
}

// The unit a converter delivered in `units` units of output, skipping a
// leading byte-order mark when a unit follows it. Only units written by this
// call are looked at: the buffer keeps earlier calls' output behind them.
uint16_t delivered_unit(const char *buffer, size_t units) {
    const uint16_t first = unit_at(buffer, 0);
    return first == kByteOrderMark && units >= 2 ? unit_at(buffer, 1) : first;
}

}  // namespace
}  // namespace textconv::engine

using namespace textconv;
using namespace textconv::engine;

extern "C" {

TEXTCONV_API int FromUnicodeToCharset(CharsetId charset, uint32_t unit, char **destination) {
    const uint16_t u = static_cast<uint16_t>(unit);
    iconv_t cd = acquire_converter(&fromUnicodeConverters[charset], charsetConversion[charset].iconvName,
                                   Pivot::Source);
    if (!cd) {
        fprintf(stderr, "Cannot use iconv to convert from UTF-16 to %s (%u)\n",
                printable_charset_name(charset), static_cast<unsigned>(u));
        return 0;
    }
    char *in = const_cast<char *>(reinterpret_cast<const char *>(&u));
    size_t inLeft = 2;
    char *out = fromUnicodeCharBuffer;
    size_t outLeft = sizeof fromUnicodeCharBuffer;
    if (iconv(cd, &in, &inLeft, &out, &outLeft) == kIconvFailed) return 0;
    // A converter that composes characters (Big5-HKSCS) holds a unit that a
    // combining mark might follow: the character is this call's, so flush it.
    if (out == fromUnicodeCharBuffer && iconv(cd, nullptr, nullptr, &out, &outLeft) == kIconvFailed) return 0;
    // Bytes as written, a target's byte-order mark included.
    for (const char *p = fromUnicodeCharBuffer; p != out; ++p) *(*destination)++ = *p;
    return 1;
}

TEXTCONV_API int FromCharsetToUnicode(CharsetId charset, const char **source, uint16_t *destination,
                                      uint32_t *length) {
    const char *start = *source;
    iconv_t cd =
        acquire_converter(&toUnicodeConverters[charset], charsetConversion[charset].iconvName, Pivot::Target);
    if (!cd) {
        fprintf(stderr, "Cannot use iconv to convert from %s (%u) to UTF-16\n",
                printable_charset_name(charset), static_cast<unsigned>(static_cast<unsigned char>(start[0])));
        return 0;
    }

    // Trials of 1 to 4 bytes: an incomplete character asks for one more.
    // Output and input positions carry over between trials, so a mark the
    // converter wrote in an earlier trial stays in front of the character.
    char *in = const_cast<char *>(start);
    char *out = toUnicodeCharBuffer;
    size_t outLeft = sizeof toUnicodeCharBuffer;
    for (size_t trial = 1;; ++trial) {
        size_t inLeft = trial - static_cast<size_t>(in - start);
        if (iconv(cd, &in, &inLeft, &out, &outLeft) == kIconvFailed) {
            const int error = errno;
            if (error == EILSEQ) {
                // One byte past the rejected sequence; one unit in 16-bit text.
                *source = in + (is_unit_charset(charset) ? 2 : 1);
                *destination = kReplacement;
                *length = 2;
                return 1;
            }
            if (error != EINVAL || trial == kLongestCharacter) return 0;
            continue;
        }
        const size_t units = static_cast<size_t>(out - toUnicodeCharBuffer) / 2;
        // Success with no unit written: the converter took the bytes so far
        // as a byte-order mark of its input. The character follows them.
        if (units == 0) {
            if (trial == kLongestCharacter) return 0;
            continue;
        }
        // A mark alone is the character itself (a UTF-8 source's own EF BB
        // BF, for one); a mark with a unit behind it is the converter's.
        *destination = delivered_unit(toUnicodeCharBuffer, units);
        *length = 2;
        *source = in;
        return 1;
    }
}

TEXTCONV_API int FromUnicodeToKOI8R(uint32_t unit, char **destination) {
    const uint16_t u = static_cast<uint16_t>(unit);
    iconv_t cd = acquire_converter(&unicodeToKoi8rConverter, kKoi8rName, Pivot::Source);
    if (!cd) return 0;
    char *in = const_cast<char *>(reinterpret_cast<const char *>(&u));
    size_t inLeft = 2;
    char *out = koi8rCharBuffer;
    size_t outLeft = sizeof koi8rCharBuffer;
    if (iconv(cd, &in, &inLeft, &out, &outLeft) == kIconvFailed || outLeft != 0) return 0;
    *(*destination)++ = koi8rCharBuffer[0];
    return 1;
}

TEXTCONV_API int FromKOI8RToUnicode(const char **source, uint16_t *destination) {
    const char *start = *source;
    iconv_t cd = acquire_converter(&koi8rToUnicodeConverter, kKoi8rName, Pivot::Target);
    if (!cd) {
        fprintf(stderr, "Cannot use iconv to convert from koi8r (%u) to UTF-16\n",
                static_cast<unsigned>(static_cast<unsigned char>(start[0])));
        return 0;
    }
    char *in = const_cast<char *>(start);
    size_t inLeft = 1;
    char *out = koi8rUnicodeBuffer;
    size_t outLeft = sizeof koi8rUnicodeBuffer;
    if (iconv(cd, &in, &inLeft, &out, &outLeft) == kIconvFailed) return 0;
    const size_t units = static_cast<size_t>(out - koi8rUnicodeBuffer) / 2;
    if (units == 0) return 0;
    *destination = delivered_unit(koi8rUnicodeBuffer, units);
    *source = start + 1;
    return 1;
}

}  // extern "C"
