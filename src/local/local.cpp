// Text in the local encoding to and from UTF-16 and UTF-8.
#include <cstring>

#include "frame/registry.h"
#include "textconv.h"

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

// What the converter made of the units of a single-byte charset, kept so that
// text seen again needs no iconv call. A unit is recorded only once the
// charset's converter is open: until then, and for ever when it cannot be
// opened, every unit goes to the converter as before (with its question and
// messages). Direct-mapped; a unit that finds its slot taken asks again.
struct UnitByteCache {
    struct Entry {
        uint16_t unit;
        uint8_t byte;
        uint8_t state;  // 0 nothing known, 1 byte holds the unit, 2 no byte does
    };
    static constexpr unsigned kSlots = 1024;
    CharsetId charset;  // whose units the entries hold
    Entry entries[kSlots];
};
UnitByteCache unitCache;

inline unsigned slot_of(uint16_t unit) { return ((unit * 40503u) >> 6) & (UnitByteCache::kSlots - 1); }

bool converter_open(CharsetId charset) {
    const textconv::ConverterCell cell = textconv::fromUnicodeConverters[charset];
    return cell != textconv::unopened_cell() && cell != textconv::failed_cell();
}

// The local charset never changes in a process; should another charset come
// here, the cache starts again for it.
inline void claim_cache(CharsetId charset) {
    if (unitCache.charset == charset) return;
    std::memset(unitCache.entries, 0, sizeof unitCache.entries);
    unitCache.charset = charset;
}

// FromUnicodeToCharset, through the cache for a single-byte charset.
int unit_to_charset(CharsetId charset, uint32_t unit, char **cursor) {
    if (!is_single_byte(charset)) return FromUnicodeToCharset(charset, unit, cursor);
    claim_cache(charset);
    const auto u = static_cast<uint16_t>(unit);
    UnitByteCache::Entry &e = unitCache.entries[slot_of(u)];
    if (e.state != 0 && e.unit == u) {
        if (e.state == 2) return 0;
        *(*cursor)++ = static_cast<char>(e.byte);
        return 1;
    }
    char *start = *cursor;
    const int result = FromUnicodeToCharset(charset, unit, cursor);
    if (converter_open(charset)) {
        if (result && *cursor - start == 1) e = {u, static_cast<uint8_t>(*start), 1};
        if (!result) e = {u, 0, 2};
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
    // One unit per byte at most; a size beyond 32 bits cannot be had from
    // the host.
    const uint64_t scratchBytes = 2 * (static_cast<uint64_t>(n) + 1);
    if (scratchBytes > UINT32_MAX) return 0;
    auto *units = static_cast<uint16_t *>(HostMalloc(static_cast<uint32_t>(scratchBytes), 1));
    if (!units) return 0;
    uint32_t decoded = 0;
    if (ConvertUTF8toUTF16(source, static_cast<uint32_t>(n), units, static_cast<uint32_t>(scratchBytes),
                           &decoded) != TEXTCONV_UTF_DONE) {
        HostFree(units);
        return 0;
    }
    int result = 1;
    char *out = target;
    const uint32_t count = decoded / 2;
    uint32_t i = 0;
    if (is_single_byte(local)) {
        // Units seen before take their byte from the cache.
        claim_cache(local);
        for (; i < count && units[i] != 0; ++i) {
            const UnitByteCache::Entry e = unitCache.entries[slot_of(units[i])];
            if (e.state == 1 && e.unit == units[i]) {
                *out++ = static_cast<char>(e.byte);
            } else if (!unit_to_charset(local, units[i], &out)) {
                *out++ = '?';
                result = 0;
            }
        }
    }
    for (; i < count && units[i] != 0; ++i) {
        // A surrogate pair goes over as two separate units.
        if (!unit_to_charset(local, units[i], &out)) {
            *out++ = '?';
            result = 0;
        }
    }
    *out++ = '\0';
    *length = static_cast<uint32_t>(out - target);
    HostFree(units);
    return result;
}

TEXTCONV_API int StringFromLocalToUTF8(const char *source, char *target, uint32_t *length) {
    const CharsetId local = LocalEncoding();
    const auto *in = reinterpret_cast<const unsigned char *>(source);
    char *out = target;
    switch (local) {
        case CHARSET_LATIN1:
            for (; *in; ++in) {
                if (*in < 0x80) {
                    *out++ = static_cast<char>(*in);
                } else {
                    *out++ = static_cast<char>(0xC0 | (*in >> 6));
                    *out++ = static_cast<char>(0x80 | (*in & 0x3F));
                }
            }
            break;
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
