// The scalar UTF-8 <-> UTF-16 steps. The reference loops and the vector fast
// paths share them, so every input the fast paths do not take whole is
// handled by exactly this code.
#pragma once

#include <cstdint>

#include "textconv.h"
#include "unicode/utf_tables.h"

namespace textconv {

// Outcome of one step: go on, or stop with a result code.
inline constexpr uint32_t kStepContinue = 0xFFFFFFFFu;

// Decodes the sequence at src[p] (p < len) into dst, advancing p and w (bytes
// written; w never exceeds cap, and cap may be odd). Returns kStepContinue or TEXTCONV_UTF_SOURCE_INCOMPLETE
// / TEXTCONV_UTF_TARGET_FULL.
[[gnu::always_inline]] inline uint32_t utf8_decode_step(const uint8_t *src, uint32_t len, uint32_t &p,
                                                        uint16_t *dst, uint32_t cap, uint32_t &w) {
    const uint32_t lead = src[p];
    if (lead < 0x80) {  // the common case, same outcome as the general path
        if (cap - w < 2) return TEXTCONV_UTF_TARGET_FULL;
        dst[w / 2] = static_cast<uint16_t>(lead);
        w += 2;
        p += 1;
        return kStepContinue;
    }
    const uint32_t t = static_cast<uint32_t>(utf8TrailingByteCount[lead]);
    const uint32_t avail = len - p - 1;  // bytes after the lead
    // Well-formed 2- and 3-byte sequences, the bulk of non-ASCII text, take a
    // short road to the same outcome; everything else the general one.
    if (t == 1 && avail >= 1 && lead >= 0xC2 && (src[p + 1] & 0xC0) == 0x80) {
        if (cap - w < 2) return TEXTCONV_UTF_TARGET_FULL;
        dst[w / 2] = static_cast<uint16_t>(((lead & 0x1F) << 6) | (src[p + 1] & 0x3F));
        w += 2;
        p += 2;
        return kStepContinue;
    }
    if (t == 2 && avail >= 2 && (src[p + 1] & 0xC0) == 0x80 && (src[p + 2] & 0xC0) == 0x80) {
        const uint32_t v = ((lead & 0x0F) << 12) | ((src[p + 1] & 0x3F) << 6) | (src[p + 2] & 0x3F);
        if (v >= 0x800 && (v < 0xD800 || v > 0xDFFF)) {
            if (cap - w < 2) return TEXTCONV_UTF_TARGET_FULL;
            dst[w / 2] = static_cast<uint16_t>(v);
            w += 2;
            p += 3;
            return kStepContinue;
        }
    }
    // A trailing byte must look like one (10xxxxxx). Check those that are
    // there first: a sequence broken by another byte is illegal at once, one
    // that only runs past the end is incomplete.
    const uint32_t seen = t < avail ? t : avail;
    for (uint32_t k = 1; k <= seen; ++k) {
        if ((src[p + k] & 0xC0) != 0x80) {
            if (cap - w < 2) return TEXTCONV_UTF_TARGET_FULL;
            dst[w / 2] = kReplacementCharacter;
            w += 2;
            p += 1;  // resume right after the lead byte
            return kStepContinue;
        }
    }
    if (t > avail) return TEXTCONV_UTF_SOURCE_INCOMPLETE;

    uint32_t v = lead;
    for (uint32_t k = 1; k <= t; ++k) v = (v << 6) + src[p + k];
    v -= utf8OffsetByLength[t];

    if (v < utf8MinimumByLength[t] || v > utf8MaximumByLength[t] || (v >= 0xD800 && v <= 0xDFFF)) {
        if (cap - w < 2) return TEXTCONV_UTF_TARGET_FULL;
        dst[w / 2] = kReplacementCharacter;
        w += 2;
        p += 1;  // the trailing bytes are decoded again on their own
        return kStepContinue;
    }
    p += t + 1;
    if (v <= 0xFFFF) {
        if (cap - w < 2) return TEXTCONV_UTF_TARGET_FULL;
        dst[w / 2] = static_cast<uint16_t>(v);
        w += 2;
    } else if (v <= 0x10FFFF) {
        if (cap - w < 4) return TEXTCONV_UTF_TARGET_FULL;
        v -= 0x10000;
        dst[w / 2] = static_cast<uint16_t>(0xD800 + (v >> 10));
        dst[w / 2 + 1] = static_cast<uint16_t>(0xDC00 + (v & 0x3FF));
        w += 4;
    } else {
        if (cap - w < 2) return TEXTCONV_UTF_TARGET_FULL;
        dst[w / 2] = kReplacementCharacter;  // beyond Unicode: the whole sequence is consumed
        w += 2;
    }
    return kStepContinue;
}

// Encodes the unit (or pair) at src[r / 2] (r < len, in bytes) into dst.
[[gnu::always_inline]] inline uint32_t utf16_encode_step(const uint16_t *src, uint32_t len, uint32_t &r,
                                                         uint8_t *dst, uint32_t cap, uint32_t &w) {
    uint32_t u = src[r / 2];
    r += 2;
    if (u < 0x80) {
        if (cap == w) return TEXTCONV_UTF_TARGET_FULL;
        dst[w++] = static_cast<uint8_t>(u);
        return kStepContinue;
    }
    if (u >= 0xD800 && u <= 0xDBFF && r < len) {
        const uint32_t next = src[r / 2];
        if (next >= 0xDC00 && next <= 0xDFFF) {
            r += 2;
            u = ((u - 0xD800) << 10) + (next - 0xDC00) + 0x10000;
        }
    }
    const uint32_t n = u < 0x80 ? 1 : u < 0x800 ? 2 : u < 0x10000 ? 3 : 4;
    if (n > cap - w) return TEXTCONV_UTF_TARGET_FULL;  // w never exceeds cap
    uint8_t *out = dst + w;
    w += n;
    for (uint32_t i = n - 1; i > 0; --i) {
        out[i] = static_cast<uint8_t>(0x80 | (u & 0x3F));
        u >>= 6;
    }
    out[0] = static_cast<uint8_t>(u | utf8LeadByteMark[n]);
    return kStepContinue;
}

// Scalar steps over at least `bytes` of input (or up to its end).
inline uint32_t utf8_scalar_stretch(const uint8_t *s, uint32_t len, uint32_t &p, uint16_t *d, uint32_t cap,
                                    uint32_t &w, uint32_t bytes) {
    const uint32_t stop = len - p > bytes ? p + bytes : len;
    while (p < stop) {
        uint32_t r = utf8_decode_step(s, len, p, d, cap, w);
        if (r != kStepContinue) return r;
    }
    return kStepContinue;
}

inline uint32_t utf16_scalar_stretch(const uint16_t *s, uint32_t len, uint32_t &r, uint8_t *d, uint32_t cap,
                                     uint32_t &w, uint32_t bytes) {
    const uint32_t stop = len - r > bytes ? r + bytes : len;
    while (r < stop) {
        uint32_t res = utf16_encode_step(s, len, r, d, cap, w);
        if (res != kStepContinue) return res;
    }
    return kStepContinue;
}

}  // namespace textconv
