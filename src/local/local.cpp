// Text in the local encoding to and from UTF-16 and UTF-8.
#include <cstring>

#include "frame/registry.h"
#include "local/known_units.h"
#include "local/unit_table.h"
#include "textconv.h"
#include "unicode/utf_internal.h"
#include "unicode/utf_scalar.h"

using namespace textconv;

namespace {

// Charsets of one byte per character.
constexpr bool is_single_byte(CharsetId charset) {
    switch (charset) {
        case CHARSET_LATIN1:
        case CHARSET_KOI8R:
        case CHARSET_ISO8859_11:
        case CHARSET_ISO8859_6:
        case CHARSET_ISO8859_8:
        case CHARSET_ISO8859_2:
        case CHARSET_ISO8859_15:
        case CHARSET_CP1250:
        case CHARSET_CP1251:
        case CHARSET_CP1256:
            return true;
        default:
            return false;
    }
}

// The local charset never changes in a process; should another single-byte
// charset come here, the table starts again for it.
UnitByteTable unitTable;

bool converter_open(CharsetId charset) {
    const ConverterCell cell = fromUnicodeConverters[charset];
    return cell != unopened_cell() && cell != failed_cell();
}

// FromUnicodeToCharset for a unit of a single-byte charset that the table
// does not know yet. What the converter says is recorded only once it is
// open: until then, and for ever when it cannot be opened, every unit goes to
// the converter as before (with its question and messages).
[[gnu::noinline]] int ask_converter(CharsetId charset, uint16_t unit, char **cursor) {
    char *start = *cursor;
    const int result = FromUnicodeToCharset(charset, unit, cursor);
    if (converter_open(charset)) {
        if (result && *cursor - start == 1) unitTable.record(unit, static_cast<uint8_t>(*start));
        if (!result) unitTable.record(unit, UnitByteTable::kNoByte);
    }
    return result;
}

// One unit of a single-byte charset to the cursor: 1, or 0 with nothing written.
inline int single_byte_unit(CharsetId charset, uint16_t unit, char **cursor) {
    const int known = unitTable.find(unit);
    if (known == UnitByteTable::kUnknown) return ask_converter(charset, unit, cursor);
    if (known == UnitByteTable::kNoByte) return 0;
    *(*cursor)++ = static_cast<char>(known);
    return 1;
}

int unit_to_charset(CharsetId charset, uint32_t unit, char **cursor) {
    if (!is_single_byte(charset)) return FromUnicodeToCharset(charset, unit, cursor);
    unitTable.claim(charset);
    return single_byte_unit(charset, static_cast<uint16_t>(unit), cursor);
}

// Whether UTF-8 of n bytes ends in a sequence cut short. Every byte that is
// not a trailing byte starts a sequence, and no sequence is longer than 6
// bytes, so decoding from the last such byte among the last 6 decides it.
bool ends_cut_short(const uint8_t *s, size_t n) {
    size_t lead = n;
    for (size_t k = n; k > 0 && n - k < 6; --k) {
        if ((s[k - 1] & 0xC0) != 0x80) {
            lead = k - 1;
            break;
        }
    }
    if (lead == n) return false;
    uint16_t units[8];
    uint32_t written = 0;
    return utf8_to_utf16_scalar(s + lead, static_cast<uint32_t>(n - lead), units, sizeof units, &written) ==
           TEXTCONV_UTF_SOURCE_INCOMPLETE;
}

// Units of one sequence through `convert`; "?" for each it refuses.
template <class Convert>
inline int sequence_to_local(const uint8_t *s, uint32_t n, uint32_t &p, char *&out, Convert convert) {
    uint16_t units[2];
    uint32_t written = 0;
    utf8_decode_step(s, n, p, units, sizeof units, written);
    int result = 1;
    for (uint32_t k = 0; k < written / 2; ++k) {
        // A surrogate pair goes over as two separate units.
        if (!convert(units[k], &out)) {
            *out++ = '?';
            result = 0;
        }
    }
    return result;
}

// One unit of a single-byte charset at o, "?" when it has no byte; returns
// the position after it. (The loops keep their output pointer in a local:
// a char store through a pointer held in memory makes the compiler reload it.)
inline char *put_unit(CharsetId charset, uint16_t unit, char *o, int &result) {
    if (single_byte_unit(charset, unit, &o)) return o;
    *o = '?';
    result = 0;
    return o + 1;
}

// Units to a single-byte charset, one byte each: known units by blocks, and
// what the blocks leave, up to 32 units, one by one through the table.
char *units_to_single_byte(CharsetId charset, const uint16_t *units, uint32_t count, char *o, int &result) {
    const uint16_t *u = units, *const end = units + count;
    while (u < end) {
        if (end - u >= 32) {
            const size_t run =
                copy_known_units(u, static_cast<size_t>(end - u), reinterpret_cast<uint8_t *>(o),
                                 unitTable.flat_table(), unitTable.ascii_rows(), unitTable.page_base());
            u += run;
            o += run;
        }
        for (const uint16_t *stop = end - u > 32 ? u + 32 : end; u < stop; ++u) {
            const int byte = unitTable.known_direct_byte(*u);
            if (byte >= 0)
                *o++ = static_cast<char>(byte);
            else
                o = put_unit(charset, *u, o, result);
        }
    }
    return o;
}

// Text is decoded in chunks of at most this many bytes (as many units, 2 KiB
// of stack): long enough that the vector decoder works on whole blocks.
constexpr uint32_t kChunk = 1024;

// Where a chunk from p may end so that it decodes on its own exactly as
// within the whole text: at the end, or just after an ASCII byte (a sequence
// of its own, which breaks any sequence it falls into). 0 when the next
// kChunk bytes hold no ASCII byte.
uint32_t chunk_end(const uint8_t *s, uint32_t n, uint32_t p) {
    if (n - p <= kChunk) return n;
    for (uint32_t i = p + kChunk; i > p; --i)
        if (s[i - 1] < 0x80) return i;
    return 0;
}

// UTF-8 known to be complete into a single-byte charset: decoded by the UTF
// core in chunks into a buffer on the stack, then the units through the
// table; units it does not know yet go to the converter.
int utf8_to_single_byte(CharsetId charset, const uint8_t *s, uint32_t n, char *&out) {
    unitTable.claim(charset);
    int result = 1;
    uint16_t units[kChunk];
    uint32_t p = 0;
    while (p < n) {
        const uint32_t end = chunk_end(s, n, p);
        if (end == 0) {
            for (const uint32_t stop = p + kChunk; p < stop;) {
                result &= sequence_to_local(s, n, p, out, [charset](uint16_t unit, char **cursor) {
                    return single_byte_unit(charset, unit, cursor);
                });
            }
            continue;
        }
        uint32_t written = 0;
        utf8_to_utf16(s + p, end - p, units, sizeof units, &written);  // whole sequences: cannot fail
        out = units_to_single_byte(charset, units, written / 2, out, result);
        p = end;
    }
    return result;
}

// Any other charset: every unit to the converter.
int utf8_to_any(CharsetId charset, const uint8_t *s, uint32_t n, char *&out) {
    int result = 1;
    uint32_t p = 0;
    while (p < n) {
        result &= sequence_to_local(s, n, p, out, [charset](uint16_t unit, char **cursor) {
            return FromUnicodeToCharset(charset, unit, cursor);
        });
    }
    return result;
}

}  // namespace

extern "C" {

TEXTCONV_API int StringFromUnicodeToLocal(const uint16_t *source, char *target, uint32_t *length) {
    const uint16_t *from = source;
    char *into = target;
    return StringFromUnicodeToCharset(LocalEncoding(), &from, &into, length);
}

TEXTCONV_API int StringFromLocalToUnicode(const char *source, uint16_t *target, uint32_t *length) {
    const char *from = source;
    uint16_t *into = target;
    return StringFromCharsetToUnicode(LocalEncoding(), &from, &into, length);
}

TEXTCONV_API int FromUnicodeToLocal(uint32_t unit, char **cursor) {
    return unit_to_charset(LocalEncoding(), unit, cursor);
}

TEXTCONV_API int FromLocalToUnicode(const char **cursor, uint16_t *target, uint32_t *count) {
    return FromCharsetToUnicode(LocalEncoding(), cursor, target, count);
}

TEXTCONV_API int StringFromUTF8ToLocal(const char *source, char *target, uint32_t *length) {
    const CharsetId local = LocalEncoding();
    const size_t n = std::strlen(source);
    if (local == CHARSET_UTF8) {
        // Copied as it stands, valid or not.
        std::memcpy(target, source, n + 1);
        *length = static_cast<uint32_t>(n + 1);
        return 1;
    }
    // Up to 4 bytes a unit, one unit a byte at most: longer text would
    // overflow the 32-bit length. A text that ends cut short is refused before
    // anything is written or any converter opened.
    const auto *s = reinterpret_cast<const uint8_t *>(source);
    if (n > (UINT32_MAX - 1) / 4 || ends_cut_short(s, n)) return 0;
    char *out = target;
    const int result = is_single_byte(local) ? utf8_to_single_byte(local, s, static_cast<uint32_t>(n), out)
                                             : utf8_to_any(local, s, static_cast<uint32_t>(n), out);
    *out++ = '\0';
    *length = static_cast<uint32_t>(out - target);
    return result;
}

TEXTCONV_API int StringFromLocalToUTF8(const char *source, char *target, uint32_t *length) {
    const CharsetId local = LocalEncoding();
    const auto *in = reinterpret_cast<const unsigned char *>(source);
    char *out = target;
    switch (local) {
        case CHARSET_LATIN1:
            return StringFromLatin1ToUTF8(source, target, length);  // the same bytes, by the vector code
        case CHARSET_EUCJP:
            while (*in) {
                uint8_t count = 0;
                const uint32_t used = FromEUCJPtoUTF8(reinterpret_cast<const char *>(in), out, &count);
                if (used == 0) return 0;  // partial output, no NUL, length untouched
                in += used;
                out += count;
            }
            break;
        case CHARSET_UTF8: {
            const size_t n = std::strlen(source);
            std::memcpy(target, source, n + 1);
            *length = static_cast<uint32_t>(n + 1);
            return 1;
        }
        case CHARSET_KOI8R:
            for (; *in; ++in) {
                uint8_t count = 0;
                FromKOI8RtoUTF8(reinterpret_cast<const char *>(in), out, &count);
                out += count;
            }
            break;
        default: {
            // Through UTF-16. Every failure here leaves the empty string; a
            // target too small is told apart by a length of 0.
            const uint32_t capacity = *length;
            if (capacity == 0) return 1;  // not even the NUL fits: length stays 0
            const uint64_t scratchBytes = 2 * (static_cast<uint64_t>(std::strlen(source)) + 1);
            uint16_t *units =
                scratchBytes <= UINT32_MAX
                    ? static_cast<uint16_t *>(HostMalloc(static_cast<uint32_t>(scratchBytes), 1))
                    : nullptr;
            if (!units) {
                *target = '\0';
                *length = 1;
                return 1;
            }
            uint32_t size = static_cast<uint32_t>(scratchBytes);
            if (!StringFromLocalToUnicode(source, units, &size)) {
                HostFree(units);
                *target = '\0';
                *length = 1;
                return 1;
            }
            uint32_t n = capacity;
            StringFromUnicodeToUTF8(units, target, &n);
            HostFree(units);
            if (n == 0) *target = '\0';
            *length = n;
            return 1;
        }
    }
    *out++ = '\0';
    *length = static_cast<uint32_t>(out - target);
    return 1;
}

}  // extern "C"
