// Whole strings between a registered charset and UTF-16, through the cached
// iconv converters. Conversion runs in passes: one iconv call over the rest
// of the source, a substitute in place of each rejected character, then a
// new pass after it. Output goes straight into the caller's buffer and never
// past the room the caller gives.
#include <errno.h>
#include <iconv.h>
#include <stdio.h>
#include <string.h>

#if defined(__SSE2__)
#include <emmintrin.h>
#endif

#include "engine/engine.h"
#include "frame/registry.h"

namespace textconv::engine {

uint32_t terminatorOutsideConverter = 0;

namespace {

constexpr size_t kIconvFailed = static_cast<size_t>(-1);
constexpr uint16_t kByteOrderMark = 0xFEFF;
constexpr uint16_t kReplacement = 0xFFFD;

uint16_t unit_at(const char *p, size_t index) {
    uint16_t unit;
    memcpy(&unit, p + 2 * index, 2);
    return unit;
}

void store_unit(char *p, uint16_t unit) { memcpy(p, &unit, 2); }

// Units of a 0-terminated UTF-16 string, terminator included. The scan tests
// a whole aligned block for a 0 unit at a time (64 bytes with SSE2, else two
// machine words), so that it stays a small part of the conversion's cost.
// Like the C library's strlen it may read past the terminator, but only
// within the aligned block that holds it, never into another page: hence no
// address sanitizing here.
#if defined(__SSE2__)
constexpr uintptr_t kBlock = 64;
#else
using Word = uintptr_t;
typedef Word AliasWord __attribute__((may_alias));
constexpr Word kLowBits = ~Word{0} / 0xFFFF;  // 0x0001 in every unit
constexpr Word kHighBits = kLowBits << 15;    // 0x8000 in every unit
constexpr uintptr_t kBlock = 2 * sizeof(Word);
#endif

__attribute__((noinline, no_sanitize("address"))) size_t unit_count(const uint16_t *text) {
    const uint16_t *p = text;
    for (; reinterpret_cast<uintptr_t>(p) % kBlock != 0; ++p)
        if (*p == 0) return static_cast<size_t>(p - text) + 1;
#if defined(__SSE2__)
    const __m128i zero = _mm_setzero_si128();
    for (;; p += kBlock / 2) {
        const auto *v = reinterpret_cast<const __m128i *>(p);
        const __m128i found =
            _mm_or_si128(_mm_or_si128(_mm_cmpeq_epi16(v[0], zero), _mm_cmpeq_epi16(v[1], zero)),
                         _mm_or_si128(_mm_cmpeq_epi16(v[2], zero), _mm_cmpeq_epi16(v[3], zero)));
        if (_mm_movemask_epi8(found) != 0) break;
    }
#else
    for (;; p += kBlock / 2) {
        const auto *w = reinterpret_cast<const AliasWord *>(p);
        const Word a = w[0], b = w[1];
        if ((((a - kLowBits) & ~a) | ((b - kLowBits) & ~b)) & kHighBits) break;
    }
#endif
    while (*p != 0) ++p;
    return static_cast<size_t>(p - text) + 1;
}

// Bytes of a 0-terminated string of 16-bit units, terminator included. The
// units may sit at any address.
size_t unit_string_bytes(const char *text) {
    if (reinterpret_cast<uintptr_t>(text) % 2 == 0)
        return 2 * unit_count(reinterpret_cast<const uint16_t *>(text));
    size_t bytes = 0;
    while (unit_at(text, bytes / 2) != 0) bytes += 2;
    return bytes + 2;
}

// Whether the first unit of a pass's output is the converter's byte-order
// mark, to be removed. A UTF-8 source that begins with EF BB BF brings its
// own U+FEFF, which is text: the output then starts with the converter's
// mark only when it holds more leading U+FEFF units than the source has
// leading marks (a text that opens with two marks keeps both).
bool starts_with_converter_mark(CharsetId charset, const char *passSource, const char *output,
                                size_t written) {
    if (written < 2 || unit_at(output, 0) != kByteOrderMark) return false;
    if (charset != CHARSET_UTF8) return true;
    size_t sourceMarks = 0;  // byte by byte: nothing past the terminator is read
    for (const auto *s = reinterpret_cast<const unsigned char *>(passSource);
         s[0] == 0xEF && s[1] == 0xBB && s[2] == 0xBF; s += 3)
        ++sourceMarks;
    size_t outputMarks = 0;
    while (outputMarks < written / 2 && unit_at(output, outputMarks) == kByteOrderMark) ++outputMarks;
    return outputMarks > sourceMarks;
}

// Converts a "?" unit at out; returns the bytes written (the converter's
// mark included), 0 when they do not fit in room.
size_t leading_unit_substitute(iconv_t cd, char *out, size_t room) {
    uint16_t question = '?';
    char *in = reinterpret_cast<char *>(&question);
    size_t inLeft = sizeof question, outLeft = room;
    char *at = out;
    if (iconv(cd, &in, &inLeft, &at, &outLeft) == kIconvFailed) return 0;
    return room - outLeft;
}

}  // namespace

int string_from_unicode_to_charset(CharsetId charset, const uint16_t **source, char **destination,
                                   uint32_t *length) {
    const uint16_t *text = *source;
    const size_t units = unit_count(text);

    iconv_t cd = acquire_converter(&fromUnicodeConverters[charset], charsetConversion[charset].iconvName,
                                   Pivot::Source);
    if (!cd) {
        fprintf(stderr, "Cannot use iconv to convert from UTF-16 to %s (%u)\n",
                printable_charset_name(charset), static_cast<unsigned>(text[0]));
        return 0;
    }

    // The substitute: "?" in the target's own form. A 16-bit target takes a
    // whole unit, so that the text after it stays aligned on its units.
    char substitute[2] = {'?', 0};
    size_t substituteSize = 1;
    if (is_unit_charset(charset)) {
        const uint16_t hostUnit = '?';
        if (charset == CHARSET_UTF16) memcpy(substitute, &hostUnit, 2);
        if (charset == CHARSET_UTF16BE) substitute[0] = 0, substitute[1] = '?';
        substituteSize = 2;
    }

    const uint16_t *end = text + units;
    uint32_t total = 0;
    for (;;) {
        const uint16_t *passSource = *source;
        const uint32_t room = *length;
        char *in = reinterpret_cast<char *>(const_cast<uint16_t *>(passSource));
        size_t inLeft = static_cast<size_t>(end - passSource) * 2;
        char *out = *destination;
        size_t outLeft = room;
        const bool failed = iconv(cd, &in, &inLeft, &out, &outLeft) == kIconvFailed;
        const int error = failed ? errno : 0;
        const uint32_t written = room - static_cast<uint32_t>(outLeft);

        if (!failed) {
            *source = end;
            *destination = out;
            *length = total + written;
            return 1;
        }
        // A full destination, or no room left for the "?": fail without
        // another call, the pointers on this pass's start.
        if (error != EILSEQ || outLeft < substituteSize || inLeft < 2) {
            // A converter that composes characters (Big5-HKSCS) may still hold
            // one; it must not surface at the start of the next call's text.
            iconv(cd, nullptr, nullptr, nullptr, nullptr);
            *length = written;
            return 0;
        }
        size_t placed = substituteSize;
        if (charset == CHARSET_UTF16 && total + written == 0) {
            // A leading "?" goes through the converter, so that the mark it
            // writes in front of its first output stays in front.
            placed = leading_unit_substitute(cd, out, outLeft);
            if (placed == 0) {
                iconv(cd, nullptr, nullptr, nullptr, nullptr);
                *length = 0;
                return 0;
            }
        } else {
            memcpy(out, substitute, substituteSize);
        }
        *source = reinterpret_cast<const uint16_t *>(in) + 1;
        *destination = out + placed;
        total += written + static_cast<uint32_t>(placed);
        *length = static_cast<uint32_t>(outLeft - placed);
    }
}

int string_from_charset_to_unicode(CharsetId charset, const char **source, uint16_t **destination,
                                   uint32_t *length) {
    const char *text = *source;
    const bool unitText = is_unit_charset(charset);
    const size_t sourceBytes = unitText ? unit_string_bytes(text) : strlen(text) + 1;

    iconv_t cd =
        acquire_converter(&toUnicodeConverters[charset], charsetConversion[charset].iconvName, Pivot::Target);
    if (!cd) {
        fprintf(stderr, "Cannot use iconv to convert from %s (%u) to UTF-16\n",
                printable_charset_name(charset), static_cast<unsigned>(static_cast<unsigned char>(text[0])));
        return 0;
    }

    const char *end = text + sourceBytes;
    // A rejected sequence is skipped by one byte, or one unit in 16-bit text
    // so that the rest stays aligned on its units.
    const size_t step = unitText ? 2 : 1;
    // With the terminator withheld, 16-bit text ends on the lone first byte of
    // its terminating unit; byte text ends on a character boundary.
    const size_t withheldTail = unitText ? 1 : 0;
    uint32_t total = 0;
    int retries = 0;
    for (;;) {
        const char *passSource = *source;
        char *passOutput = reinterpret_cast<char *>(*destination);
        const uint32_t room = *length;
        const bool withheld = terminatorOutsideConverter != 0;
        const size_t rest = static_cast<size_t>(end - passSource);
        const size_t inBytes = withheld && rest > 0 ? rest - 1 : rest;
        char *in = const_cast<char *>(passSource);
        size_t inLeft = inBytes;
        char *out = passOutput;
        size_t outLeft = room;
        const bool failed = iconv(cd, &in, &inLeft, &out, &outLeft) == kIconvFailed;
        const int error = failed ? errno : 0;
        const uint32_t written = room - static_cast<uint32_t>(outLeft);

        // A converter that puts a mark in front of its output may leave no
        // room for the terminator in a buffer sized for the text alone. Run
        // the pass once more (a converter that marks only its first output
        // then fits); if the mark comes again, keep the terminator out of
        // the converter from now on and store it here. A UTF-8 source's own
        // mark is text and proves nothing about the converter.
        if (error == E2BIG && !withheld &&
            starts_with_converter_mark(charset, passSource, passOutput, written)) {
            if (retries == 0) {
                retries = 1;
            } else {
                terminatorOutsideConverter = 1;
                retries = 0;
            }
            continue;
        }

        const bool done = !failed || (error == EINVAL && withheld && inLeft <= withheldTail);
        // With the terminator withheld, text that ends inside a character
        // gives the substitutes it would give with the terminator in place.
        const bool rejected = error == EILSEQ || (error == EINVAL && withheld && !done);
        if (!done && !rejected) {
            *length = written;
            return 0;
        }

        const bool dropMark = starts_with_converter_mark(charset, passSource, passOutput, written);
        const uint32_t kept = dropMark ? written - 2 : written;
        // Room for what follows the kept text: the substitute, or the
        // terminator stored here. Only a pass whose mark stayed can lack it.
        const uint32_t need = rejected ? 2 : (withheld ? 2 : 0);
        if (room - kept < need || (rejected && inLeft == 0)) {
            *length = written;
            return 0;
        }
        if (dropMark) memmove_soc(passOutput, passOutput + 2, kept);
        const size_t consumed = inBytes - inLeft;

        if (rejected) {
            store_unit(passOutput + kept, kReplacement);
            *destination = reinterpret_cast<uint16_t *>(passOutput + kept + 2);
            *source = passSource + consumed + (inLeft < step ? inLeft : step);
            *length = room - kept - 2;
            total += kept + 2;
            continue;
        }

        *destination = reinterpret_cast<uint16_t *>(passOutput + kept);
        *source = passSource + consumed;
        *length = total + kept;
        if (withheld) {
            // The destination stays on the terminator, as the source does.
            store_unit(passOutput + kept, 0);
            *length += 2;
        }
        return 1;
    }
}

}  // namespace textconv::engine

extern "C" {

TEXTCONV_API int StringFromUnicodeToCharset(CharsetId charset, const uint16_t **source, char **destination,
                                            uint32_t *length) {
    return textconv::engine::string_from_unicode_to_charset(charset, source, destination, length);
}

TEXTCONV_API int StringFromCharsetToUnicode(CharsetId charset, const char **source, uint16_t **destination,
                                            uint32_t *length) {
    return textconv::engine::string_from_charset_to_unicode(charset, source, destination, length);
}

}  // extern "C"
