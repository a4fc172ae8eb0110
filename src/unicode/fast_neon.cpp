// 32-bit ARM fast paths with NEON, used when the CPU reports NEON at run time
// (the rest of the library needs no NEON). ASCII blocks of 16 bytes (8 units)
// are converted with vector loads and stores; everything else goes through
// the shared scalar steps, so the results are the scalar code's.
#if defined(__arm__) && defined(__ARM_PCS_VFP)

#include <arm_neon.h>
#include <sys/auxv.h>

#include "unicode/utf_internal.h"
#include "unicode/utf_scalar.h"

#define TEXTCONV_NEON __attribute__((target("fpu=neon")))

namespace textconv::fast {
namespace {

constexpr unsigned long kHwcapNeon = 1ul << 12;  // HWCAP_NEON

TEXTCONV_NEON inline bool high_bits_clear(uint8x16_t v) {
    const uint8x8_t folded = vorr_u8(vget_low_u8(v), vget_high_u8(v));
    return (vget_lane_u64(vreinterpret_u64_u8(folded), 0) & 0x8080808080808080ull) == 0;
}

}  // namespace

bool neon_available() { return (getauxval(AT_HWCAP) & kHwcapNeon) != 0; }

TEXTCONV_NEON uint32_t utf8_to_utf16_neon(const uint8_t *s, uint32_t len, uint16_t *d, uint32_t cap,
                                          uint32_t *written) {
    uint32_t p = 0, w = 0;
    while (p < len) {
        if (len - p >= 16 && cap - w >= 32) {
            const uint8x16_t v = vld1q_u8(s + p);
            if (high_bits_clear(v)) {
                vst1q_u16(d + w / 2, vmovl_u8(vget_low_u8(v)));
                vst1q_u16(d + w / 2 + 8, vmovl_u8(vget_high_u8(v)));
                p += 16;
                w += 32;
                continue;
            }
        }
        const uint32_t r = utf8_scalar_stretch(s, len, p, d, cap, w, 16);
        if (r != kStepContinue) return r;
    }
    *written = w;
    return TEXTCONV_UTF_DONE;
}

TEXTCONV_NEON uint32_t utf16_to_utf8_neon(const uint16_t *s, uint32_t len, uint8_t *d, uint32_t cap,
                                          uint32_t *written) {
    len &= ~1u;
    uint32_t r = 0, w = 0;
    while (r < len) {
        if (len - r >= 16 && cap - w >= 8) {
            const uint16x8_t u = vld1q_u16(s + r / 2);
            const uint16x8_t high = vandq_u16(u, vdupq_n_u16(0xFF80));
            const uint16x4_t folded = vorr_u16(vget_low_u16(high), vget_high_u16(high));
            if (vget_lane_u64(vreinterpret_u64_u16(folded), 0) == 0) {
                vst1_u8(d + w, vmovn_u16(u));
                r += 16;
                w += 8;
                continue;
            }
        }
        const uint32_t res = utf16_scalar_stretch(s, len, r, d, cap, w, 16);
        if (res != kStepContinue) return res;
    }
    *written = w;
    return TEXTCONV_UTF_DONE;
}

TEXTCONV_NEON uint32_t latin1_to_utf8_neon(const uint8_t *s, uint32_t len, uint8_t *d) {
    uint32_t p = 0, w = 0;
    while (len - p >= 16) {
        const uint8x16_t v = vld1q_u8(s + p);
        if (high_bits_clear(v)) {
            vst1q_u8(d + w, v);
            w += 16;
        } else {
            w += latin1_to_utf8_scalar(s + p, 16, d + w);
        }
        p += 16;
    }
    return w + latin1_to_utf8_scalar(s + p, len - p, d + w);
}

}  // namespace textconv::fast

#endif
