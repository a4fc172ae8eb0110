// Text in the local encoding to and from UTF-16 and UTF-8.
#include <cstring>

#include "textconv.h"

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
    return FromUnicodeToCharset(LocalEncoding(), unit, cursor);
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
    for (uint32_t i = 0, count = decoded / 2; i < count && units[i] != 0; ++i) {
        // A surrogate pair goes over as two separate units.
        if (!FromUnicodeToCharset(local, units[i], &out)) {
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
