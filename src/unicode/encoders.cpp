// Direct encoders to UTF-8: a code point, a KOI8-R byte, a Latin-1 string.
#include <cstring>

#include "textconv.h"
#include "unicode/koi8r_table.h"
#include "unicode/utf_internal.h"

namespace textconv {
namespace {

// Lead-byte marks by sequence length (0..6).
constexpr uint8_t kLeadMark[7] = {0x00, 0x00, 0xC0, 0xE0, 0xF0, 0xF8, 0xFC};

}  // namespace

uint32_t latin1_to_utf8_scalar(const uint8_t *src, uint32_t len, uint8_t *dst) {
    uint8_t *d = dst;
    for (uint32_t i = 0; i < len; ++i) {
        uint8_t b = src[i];
        if (b < 0x80) {
            *d++ = b;
        } else {
            *d++ = static_cast<uint8_t>(0xC0 | (b >> 6));
            *d++ = static_cast<uint8_t>(0x80 | (b & 0x3F));
        }
    }
    return static_cast<uint32_t>(d - dst);
}

}  // namespace textconv

using namespace textconv;

extern "C" {

TEXTCONV_API int FromUCS4toUTF8(uint32_t value, char *target, uint8_t *count) {
    uint8_t n;
    if (value <= 0x7F) {
        n = 1;
    } else if (value <= 0x7FF) {
        n = 2;
    } else if (value <= 0xFFFF) {
        n = 3;
    } else if (value <= 0x1FFFFF) {
        n = 4;
    } else if (value <= 0x3FFFFFF) {
        n = 5;
    } else if (value <= 0x7FFFFFFF) {
        n = 6;
    } else {
        return 0;
    }
    auto *out = reinterpret_cast<uint8_t *>(target);
    for (uint8_t i = n - 1; i > 0; --i) {
        out[i] = static_cast<uint8_t>(0x80 | (value & 0x3F));
        value >>= 6;
    }
    out[0] = static_cast<uint8_t>(value | kLeadMark[n]);
    *count = n;
    return 1;
}

TEXTCONV_API int FromKOI8RtoUTF8(const char *source, char *target, uint8_t *count) {
    uint8_t b = static_cast<uint8_t>(*source);
    if (b < 0x80) {
        *target = static_cast<char>(b);
        *count = 1;
        return 1;
    }
    return FromUCS4toUTF8(koi8rToUnicodeTable[b - 0x80], target, count);
}

TEXTCONV_API int StringFromLatin1ToUTF8(const char *source, char *target, uint32_t *length) {
    const uint32_t len = static_cast<uint32_t>(std::strlen(source));
    uint32_t n =
        latin1_to_utf8(reinterpret_cast<const uint8_t *>(source), len, reinterpret_cast<uint8_t *>(target));
    target[n] = '\0';
    *length = n + 1;
    return 1;
}

}  // extern "C"
