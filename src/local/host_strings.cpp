// The host's string and list helpers over the local encoding.
#include <cstring>

#include "textconv.h"

extern "C" {

TEXTCONV_API void StringListFromUnicodeToLocal(uint16_t **list, uint32_t *length) {
    const CharsetId local = LocalEncoding();
    const uint32_t units = *length / 2;  // an odd byte is ignored
    // Up to 4 bytes per unit, plus the closing NUL, plus the NUL that ends a
    // last string which has no 0 unit of its own within the length.
    const uint64_t size = 4 * static_cast<uint64_t>(units) + 2;
    char *fresh =
        size <= UINT32_MAX ? static_cast<char *>(HostMalloc(static_cast<uint32_t>(size), 1)) : nullptr;
    if (!fresh) return;  // the caller keeps the old list and its length

    const uint16_t *source = *list;
    const uint16_t *const sourceEnd = source + units;
    char *out = fresh;
    char *const outEnd = fresh + size;

    // Unit by unit, "?" for what the local charset cannot hold. Used when the
    // engine cannot convert a string, and for a last string without its 0.
    // A unit takes at most 4 bytes; the sizing above leaves room for it and
    // the two NULs that may follow, and the test keeps it so whatever the
    // engine wrote before.
    auto convert_unit = [&](uint16_t unit) {
        if (outEnd - out < 6) return false;
        if (!FromUnicodeToLocal(unit, &out)) *out++ = '?';
        return true;
    };

    while (source < sourceEnd) {
        // Every write below leaves the closing NUL its byte, whatever the
        // engine made of the strings before.
        if (*source == 0) {  // an empty string
            if (outEnd - out < 2) break;
            *out++ = '\0';
            ++source;
            continue;
        }
        const uint16_t *stringEnd = source;
        while (stringEnd < sourceEnd && *stringEnd != 0) ++stringEnd;
        if (stringEnd == sourceEnd) {
            // No 0 unit before the list's end: convert what is there and end
            // the string here rather than read past the list.
            while (source < sourceEnd && convert_unit(*source)) ++source;
            *out++ = '\0';
            break;
        }
        const uint16_t *from = source;
        char *into = out;
        uint32_t room = static_cast<uint32_t>(outEnd - out - 1);  // keep the closing NUL's byte
        if (StringFromUnicodeToCharset(local, &from, &into, &room) && from > source) {
            source = from;
            out = into;
        } else {
            // The next unit is tried as the start of a string again.
            if (!convert_unit(*source)) break;
            ++source;
        }
    }
    *out++ = '\0';

    HostFree(*list);
    *list = reinterpret_cast<uint16_t *>(fresh);
    *length = static_cast<uint32_t>(out - fresh);
}

TEXTCONV_API void host_stringFromWindowsUnicode(const char *source, char *target, int32_t *length) {
    const auto *bytes = reinterpret_cast<const unsigned char *>(source);
    const int32_t available = *length;
    char *out = target;
    for (int32_t k = 0; available - k >= 2; k += 2) {
        const uint32_t unit = bytes[k] | (static_cast<uint32_t>(bytes[k + 1]) << 8);
        if (unit == 0) break;
        // The first unit the local charset cannot hold ends the string.
        if (!FromUnicodeToLocal(unit, &out)) break;
    }
    *out++ = '\0';
    *length = static_cast<int32_t>(out - target);
}

TEXTCONV_API void host_stringToWindowsUnicode(const char *source, uint16_t *target, uint32_t *length) {
    const char *cursor = source;
    uint16_t *out = target;
    while (*cursor != '\0') {
        const char *start = cursor;
        uint32_t count = 0;
        if (!FromLocalToUnicode(&cursor, out, &count)) break;
        ++out;  // one unit, whatever the count says
        // Never read on past a terminator that a decoder took into a character.
        if (std::memchr(start, 0, static_cast<size_t>(cursor - start))) break;
    }
    *out++ = 0;
    *length = static_cast<uint32_t>(reinterpret_cast<char *>(out) - reinterpret_cast<char *>(target));
}

}  // extern "C"
