// Portable fast paths for machines without the x86 vector code: runs of
// ASCII are copied eight bytes (four units) at a time, everything else goes
// through the shared scalar steps, so the results are the scalar code's.
#include <cstring>

#include "unicode/utf_internal.h"
#include "unicode/utf_scalar.h"

namespace textconv::fast {
namespace {

constexpr uint64_t kHighBits = 0x8080808080808080ull;

inline uint64_t load8(const uint8_t *p) {
    uint64_t x;
    std::memcpy(&x, p, sizeof x);
    return x;
}

}  // namespace

uint32_t utf8_to_utf16_words(const uint8_t *s, uint32_t len, uint16_t *d, uint32_t cap, uint32_t *written) {
    uint32_t p = 0, w = 0;
    while (p < len) {
        if (len - p >= 8 && cap - w >= 16 && (load8(s + p) & kHighBits) == 0) {
            uint16_t *out = d + w / 2;
            for (int i = 0; i < 8; ++i) out[i] = s[p + i];
            p += 8;
            w += 16;
            continue;
        }
        const uint32_t r = utf8_scalar_stretch(s, len, p, d, cap, w, 8);
        if (r != kStepContinue) return r;
    }
    *written = w;
    return TEXTCONV_UTF_DONE;
}

uint32_t utf16_to_utf8_words(const uint16_t *s, uint32_t len, uint8_t *d, uint32_t cap, uint32_t *written) {
    len &= ~1u;
    uint32_t r = 0, w = 0;
    while (r < len) {
        if (len - r >= 8 && cap - w >= 4) {
            uint64_t x;
            std::memcpy(&x, s + r / 2, sizeof x);
            if ((x & 0xFF80FF80FF80FF80ull) == 0) {
                for (int i = 0; i < 4; ++i) d[w + i] = static_cast<uint8_t>(s[r / 2 + i]);
                r += 8;
                w += 4;
                continue;
            }
        }
        const uint32_t res = utf16_scalar_stretch(s, len, r, d, cap, w, 8);
        if (res != kStepContinue) return res;
    }
    *written = w;
    return TEXTCONV_UTF_DONE;
}

uint32_t latin1_to_utf8_words(const uint8_t *s, uint32_t len, uint8_t *d) {
    uint32_t p = 0, w = 0;
    while (len - p >= 8) {
        if ((load8(s + p) & kHighBits) == 0) {
            std::memcpy(d + w, s + p, 8);
            w += 8;
        } else {
            w += latin1_to_utf8_scalar(s + p, 8, d + w);
        }
        p += 8;
    }
    return w + latin1_to_utf8_scalar(s + p, len - p, d + w);
}

}  // namespace textconv::fast
