// x86-64 fast paths. Each takes a block of input only when it can prove the
// block simple (ASCII, or well-formed 1- to 3-byte sequences / non-surrogate
// units) and the whole block's output fits; anything else goes through the
// shared scalar steps, so results, counts and partial output are the scalar
// code's. Stores past the block's output are undone before moving on, so no
// byte beyond what the scalar code writes is changed. SSE2 is the x86-64
// baseline; the AVX2 functions are only called when the CPU has AVX2.
#if defined(__x86_64__)

#include <immintrin.h>

#include "unicode/fast_tables.h"
#include "unicode/utf_internal.h"
#include "unicode/utf_scalar.h"

#define TEXTCONV_AVX2 __attribute__((target("avx2,bmi,bmi2,popcnt")))

namespace textconv::fast {
namespace {

template <class T>
inline __m128i load16(const T *p) {
    return _mm_loadu_si128(reinterpret_cast<const __m128i *>(p));
}
template <class T>
inline void store16(T *p, __m128i v) {
    _mm_storeu_si128(reinterpret_cast<__m128i *>(p), v);
}
template <class T>
TEXTCONV_AVX2 inline __m256i load32(const T *p) {
    return _mm256_loadu_si256(reinterpret_cast<const __m256i *>(p));
}
template <class T>
TEXTCONV_AVX2 inline void store32(T *p, __m256i v) {
    _mm256_storeu_si256(reinterpret_cast<__m256i *>(p), v);
}
TEXTCONV_AVX2 inline __m256i two_shuffles(const Shuffle &low, const Shuffle &high) {
    return _mm256_inserti128_si256(_mm256_castsi128_si256(load16(low.index)), load16(high.index), 1);
}

// Unsigned lo <= b <= hi, per byte.
inline __m128i bytes_in_range(__m128i b, uint8_t lo, uint8_t hi) {
    const __m128i x = _mm_sub_epi8(b, _mm_set1_epi8(static_cast<char>(lo)));
    return _mm_cmpeq_epi8(_mm_min_epu8(x, _mm_set1_epi8(static_cast<char>(hi - lo))), x);
}

// The unit each of 16 positions would start, from the bytes at the position
// and the two after it (b0, b1, b2) and the 2- and 3-byte lead masks.
TEXTCONV_AVX2 inline __m256i utf8_units(__m128i b0, __m128i b1, __m128i b2, __m128i l2, __m128i l3) {
    const __m256i w0 = _mm256_cvtepu8_epi16(b0);
    const __m256i t1 = _mm256_and_si256(_mm256_cvtepu8_epi16(b1), _mm256_set1_epi16(0x3F));
    const __m256i t2 = _mm256_and_si256(_mm256_cvtepu8_epi16(b2), _mm256_set1_epi16(0x3F));
    const __m256i v2 =
        _mm256_or_si256(_mm256_and_si256(_mm256_slli_epi16(w0, 6), _mm256_set1_epi16(0x7C0)), t1);
    const __m256i v3 =
        _mm256_or_si256(_mm256_or_si256(_mm256_slli_epi16(w0, 12), _mm256_slli_epi16(t1, 6)), t2);
    const __m256i u = _mm256_blendv_epi8(w0, v2, _mm256_cvtepi8_epi16(l2));
    return _mm256_blendv_epi8(u, v3, _mm256_cvtepi8_epi16(l3));
}

// Sixteen positions of UTF-8 at s (18 bytes readable) holding only ASCII and
// well-formed 2- and 3-byte sequences, the last one possibly running up to 2
// bytes past the 16. On success writes the units at d (48 bytes writable) and
// reports bytes consumed and units written.
TEXTCONV_AVX2 inline bool utf8_block(const uint8_t *s, uint16_t *d, uint32_t &consumed, uint32_t &units) {
    const __m128i b0 = load16(s), b1 = load16(s + 1), b2 = load16(s + 2);
    const __m128i tagMask = _mm_set1_epi8(static_cast<char>(0xC0)),
                  tag = _mm_set1_epi8(static_cast<char>(0x80));
    const uint32_t nonAscii = static_cast<uint32_t>(_mm_movemask_epi8(b0));
    const uint32_t cont =
        static_cast<uint32_t>(_mm_movemask_epi8(_mm_cmpeq_epi8(_mm_and_si128(b0, tagMask), tag)));
    const uint32_t cont2 =
        static_cast<uint32_t>(_mm_movemask_epi8(_mm_cmpeq_epi8(_mm_and_si128(b2, tagMask), tag)));
    const __m128i l2 = bytes_in_range(b0, 0xC2, 0xDF), l3 = bytes_in_range(b0, 0xE0, 0xEF);
    const uint32_t lead2 = static_cast<uint32_t>(_mm_movemask_epi8(l2));
    const uint32_t lead3 = static_cast<uint32_t>(_mm_movemask_epi8(l3));
    if ((cont | lead2 | lead3) != nonAscii) return false;  // C0, C1 or F0..FF
    // E0 needs a second byte of A0..BF (not overlong), ED one of 80..9F (not
    // a surrogate); the 10xxxxxx pattern itself is checked below.
    const __m128i second80to9F = _mm_cmpeq_epi8(_mm_and_si128(b1, _mm_set1_epi8(0x20)), _mm_setzero_si128());
    const __m128i bad = _mm_or_si128(
        _mm_and_si128(_mm_cmpeq_epi8(b0, _mm_set1_epi8(static_cast<char>(0xE0))), second80to9F),
        _mm_andnot_si128(second80to9F, _mm_cmpeq_epi8(b0, _mm_set1_epi8(static_cast<char>(0xED)))));
    if (_mm_movemask_epi8(bad) != 0) return false;
    // Continuation bytes must sit exactly where the leads announce them.
    const uint32_t end = 16 + ((lead2 >> 15) | ((lead3 >> 14) & 1) | ((lead3 >> 15) << 1));
    const uint32_t contAll = cont | ((cont2 >> 14) << 16);
    const uint32_t expected = (lead2 << 1) | (lead3 << 1) | (lead3 << 2);
    if ((contAll & ((1u << end) - 1)) != expected) return false;

    const __m256i u = utf8_units(b0, b1, b2, l2, l3);
    // Drop the continuation positions, eight lanes per half.
    const uint32_t keep = ~cont & 0xFFFF;
    const __m256i packed =
        _mm256_shuffle_epi8(u, two_shuffles(kKeepLanes[keep & 0xFF], kKeepLanes[keep >> 8]));
    const uint32_t k0 = static_cast<uint32_t>(_mm_popcnt_u32(keep & 0xFF));
    const uint32_t k1 = static_cast<uint32_t>(_mm_popcnt_u32(keep >> 8));
    const __m128i old = load16(d + k0 + k1);
    store16(d, _mm256_castsi256_si128(packed));
    store16(d + k0, _mm256_extracti128_si256(packed, 1));
    store16(d + k0 + k1, old);
    consumed = end;
    units = k0 + k1;
    return true;
}

TEXTCONV_AVX2 inline __m256i bytes_in_range(__m256i b, uint8_t lo, uint8_t hi) {
    const __m256i x = _mm256_sub_epi8(b, _mm256_set1_epi8(static_cast<char>(lo)));
    return _mm256_cmpeq_epi8(_mm256_min_epu8(x, _mm256_set1_epi8(static_cast<char>(hi - lo))), x);
}

// The same over 32 positions (34 bytes readable, 80 bytes writable at d).
TEXTCONV_AVX2 inline bool utf8_block32(const uint8_t *s, uint16_t *d, uint32_t &consumed, uint32_t &units) {
    const __m256i b0 = load32(s), b1 = load32(s + 1), b2 = load32(s + 2);
    const __m256i tagMask = _mm256_set1_epi8(static_cast<char>(0xC0)),
                  tag = _mm256_set1_epi8(static_cast<char>(0x80));
    const uint32_t nonAscii = static_cast<uint32_t>(_mm256_movemask_epi8(b0));
    const uint32_t cont =
        static_cast<uint32_t>(_mm256_movemask_epi8(_mm256_cmpeq_epi8(_mm256_and_si256(b0, tagMask), tag)));
    const uint32_t cont2 =
        static_cast<uint32_t>(_mm256_movemask_epi8(_mm256_cmpeq_epi8(_mm256_and_si256(b2, tagMask), tag)));
    const __m256i l2 = bytes_in_range(b0, 0xC2, 0xDF), l3 = bytes_in_range(b0, 0xE0, 0xEF);
    const uint32_t lead2 = static_cast<uint32_t>(_mm256_movemask_epi8(l2));
    const uint32_t lead3 = static_cast<uint32_t>(_mm256_movemask_epi8(l3));
    if ((cont | lead2 | lead3) != nonAscii) return false;
    const __m256i second80to9F =
        _mm256_cmpeq_epi8(_mm256_and_si256(b1, _mm256_set1_epi8(0x20)), _mm256_setzero_si256());
    const __m256i bad = _mm256_or_si256(
        _mm256_and_si256(_mm256_cmpeq_epi8(b0, _mm256_set1_epi8(static_cast<char>(0xE0))), second80to9F),
        _mm256_andnot_si256(second80to9F, _mm256_cmpeq_epi8(b0, _mm256_set1_epi8(static_cast<char>(0xED)))));
    if (_mm256_movemask_epi8(bad) != 0) return false;
    const uint32_t end = 32 + ((lead2 >> 31) | ((lead3 >> 30) & 1) | ((lead3 >> 31) << 1));
    const uint64_t contAll = cont | (static_cast<uint64_t>(cont2 >> 30) << 32);
    const uint64_t expected =
        (static_cast<uint64_t>(lead2 | lead3) << 1) | (static_cast<uint64_t>(lead3) << 2);
    if ((contAll & ((uint64_t{1} << end) - 1)) != expected) return false;

    const __m256i u0 =
        utf8_units(_mm256_castsi256_si128(b0), _mm256_castsi256_si128(b1), _mm256_castsi256_si128(b2),
                   _mm256_castsi256_si128(l2), _mm256_castsi256_si128(l3));
    const __m256i u1 = utf8_units(_mm256_extracti128_si256(b0, 1), _mm256_extracti128_si256(b1, 1),
                                  _mm256_extracti128_si256(b2, 1), _mm256_extracti128_si256(l2, 1),
                                  _mm256_extracti128_si256(l3, 1));
    const uint32_t keep = ~cont;
    const __m256i p0 =
        _mm256_shuffle_epi8(u0, two_shuffles(kKeepLanes[keep & 0xFF], kKeepLanes[(keep >> 8) & 0xFF]));
    const __m256i p1 =
        _mm256_shuffle_epi8(u1, two_shuffles(kKeepLanes[(keep >> 16) & 0xFF], kKeepLanes[keep >> 24]));
    const uint32_t k0 = static_cast<uint32_t>(_mm_popcnt_u32(keep & 0xFF));
    const uint32_t k1 = k0 + static_cast<uint32_t>(_mm_popcnt_u32(keep & 0xFF00));
    const uint32_t k2 = k1 + static_cast<uint32_t>(_mm_popcnt_u32(keep & 0xFF0000));
    const uint32_t k3 = k2 + static_cast<uint32_t>(_mm_popcnt_u32(keep & 0xFF000000));
    const __m128i old = load16(d + k3);
    store16(d, _mm256_castsi256_si128(p0));
    store16(d + k0, _mm256_extracti128_si256(p0, 1));
    store16(d + k1, _mm256_castsi256_si128(p1));
    store16(d + k2, _mm256_extracti128_si256(p1, 1));
    store16(d + k3, old);
    consumed = end;
    units = k3;
    return true;
}

// Eight units at s with no surrogate: their UTF-8 at d (40 bytes writable).
// Returns the bytes written, or 0 when the block holds a surrogate.
TEXTCONV_AVX2 inline uint32_t utf16_block(const uint16_t *s, uint8_t *d) {
    const __m128i u = load16(s);
    const __m128i surrogate = _mm_cmpeq_epi16(_mm_and_si128(u, _mm_set1_epi16(static_cast<short>(0xF800))),
                                              _mm_set1_epi16(static_cast<short>(0xD800)));
    if (_mm_movemask_epi8(surrogate) != 0) return 0;
    const __m128i below80 =
        _mm_cmpeq_epi16(_mm_and_si128(u, _mm_set1_epi16(static_cast<short>(0xFF80))), _mm_setzero_si128());
    const __m128i below800 =
        _mm_cmpeq_epi16(_mm_and_si128(u, _mm_set1_epi16(static_cast<short>(0xF800))), _mm_setzero_si128());
    // Low byte: units needing 2 bytes or more; high byte: units needing 3.
    const uint32_t longer =
        ~static_cast<uint32_t>(_mm_movemask_epi8(_mm_packs_epi16(below80, below800))) & 0xFFFF;
    const __m128i low6 = _mm_or_si128(_mm_and_si128(u, _mm_set1_epi16(0x3F)), _mm_set1_epi16(0x80));
    const __m128i mid6 =
        _mm_or_si128(_mm_and_si128(_mm_srli_epi16(u, 6), _mm_set1_epi16(0x3F)), _mm_set1_epi16(0x80));
    const __m128i lead2 = _mm_or_si128(_mm_srli_epi16(u, 6), _mm_set1_epi16(0xC0));
    const __m128i lead3 = _mm_or_si128(_mm_srli_epi16(u, 12), _mm_set1_epi16(0xE0));
    const __m128i first = _mm_blendv_epi8(lead3, _mm_blendv_epi8(lead2, u, below80), below800);
    const __m128i second = _mm_blendv_epi8(mid6, low6, below800);
    const __m128i pairs = _mm_or_si128(first, _mm_slli_epi16(second, 8));
    const __m128i thirds = _mm_packus_epi16(low6, low6);
    const __m128i g0 = _mm_unpacklo_epi64(pairs, thirds);
    const __m128i g1 = _mm_unpacklo_epi64(_mm_srli_si128(pairs, 8), _mm_srli_si128(thirds, 4));
    const GroupShuffle &s0 = kUtf16Group[(longer & 0xF) | ((longer >> 4) & 0xF0)];
    const GroupShuffle &s1 = kUtf16Group[((longer >> 4) & 0xF) | ((longer >> 8) & 0xF0)];
    const __m128i old = load16(d + s0.length + s1.length);
    store16(d, _mm_shuffle_epi8(g0, load16(s0.index)));
    store16(d + s0.length, _mm_shuffle_epi8(g1, load16(s1.index)));
    store16(d + s0.length + s1.length, old);
    return static_cast<uint32_t>(s0.length + s1.length);
}

// Sixteen units below U+0800 (one or two bytes each) to UTF-8 at d (48
// bytes writable); returns the bytes written.
TEXTCONV_AVX2 inline uint32_t utf16_block_two_bytes(__m256i u, uint8_t *d) {
    const __m256i below80 = _mm256_cmpeq_epi16(
        _mm256_and_si256(u, _mm256_set1_epi16(static_cast<short>(0xFF80))), _mm256_setzero_si256());
    const uint32_t m = ~static_cast<uint32_t>(_mm_movemask_epi8(_mm_packs_epi16(
                           _mm256_castsi256_si128(below80), _mm256_extracti128_si256(below80, 1)))) &
                       0xFFFF;
    const __m256i first =
        _mm256_blendv_epi8(_mm256_or_si256(_mm256_srli_epi16(u, 6), _mm256_set1_epi16(0xC0)), u, below80);
    const __m256i second =
        _mm256_or_si256(_mm256_and_si256(u, _mm256_set1_epi16(0x3F)), _mm256_set1_epi16(0x80));
    const __m256i pairs = _mm256_or_si256(first, _mm256_slli_epi16(second, 8));
    const __m256i out =
        _mm256_shuffle_epi8(pairs, two_shuffles(kLatin1Pairs[m & 0xFF], kLatin1Pairs[m >> 8]));
    const uint32_t l0 = 8 + static_cast<uint32_t>(_mm_popcnt_u32(m & 0xFF));
    const uint32_t l1 = 8 + static_cast<uint32_t>(_mm_popcnt_u32(m >> 8));
    const __m128i old = load16(d + l0 + l1);
    store16(d, _mm256_castsi256_si128(out));
    store16(d + l0, _mm256_extracti128_si256(out, 1));
    store16(d + l0 + l1, old);
    return l0 + l1;
}

// Sixteen Latin-1 bytes with at least one above 0x7F (mask m) to UTF-8 at d
// (48 bytes writable); returns the bytes written.
TEXTCONV_AVX2 inline uint32_t latin1_block(__m128i v, uint32_t m, uint8_t *d) {
    const __m256i u = _mm256_cvtepu8_epi16(v);
    const __m256i high = _mm256_cvtepi8_epi16(v);  // negative lanes: bytes above 0x7F
    const __m256i first =
        _mm256_blendv_epi8(u, _mm256_or_si256(_mm256_srli_epi16(u, 6), _mm256_set1_epi16(0xC0)), high);
    const __m256i second =
        _mm256_or_si256(_mm256_and_si256(u, _mm256_set1_epi16(0x3F)), _mm256_set1_epi16(0x80));
    const __m256i pairs = _mm256_or_si256(first, _mm256_slli_epi16(second, 8));
    const __m256i out =
        _mm256_shuffle_epi8(pairs, two_shuffles(kLatin1Pairs[m & 0xFF], kLatin1Pairs[m >> 8]));
    const uint32_t l0 = 8 + static_cast<uint32_t>(_mm_popcnt_u32(m & 0xFF));
    const uint32_t l1 = 8 + static_cast<uint32_t>(_mm_popcnt_u32(m >> 8));
    const __m128i old = load16(d + l0 + l1);
    store16(d, _mm256_castsi256_si128(out));
    store16(d + l0, _mm256_extracti128_si256(out, 1));
    store16(d + l0 + l1, old);
    return l0 + l1;
}

}  // namespace

bool avx2_available() {
    __builtin_cpu_init();
    return __builtin_cpu_supports("avx2") && __builtin_cpu_supports("popcnt") &&
           __builtin_cpu_supports("bmi") && __builtin_cpu_supports("bmi2");
}

// ---------------------------------------------------------------- SSE2

uint32_t utf8_to_utf16_sse2(const uint8_t *s, uint32_t len, uint16_t *d, uint32_t cap, uint32_t *written) {
    uint32_t p = 0, w = 0;
    const __m128i zero = _mm_setzero_si128();
    while (p < len) {
        if (len - p >= 16 && cap - w >= 32) {
            const __m128i v = load16(s + p);
            if (_mm_movemask_epi8(v) == 0) {
                store16(d + w / 2, _mm_unpacklo_epi8(v, zero));
                store16(d + w / 2 + 8, _mm_unpackhi_epi8(v, zero));
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

uint32_t utf16_to_utf8_sse2(const uint16_t *s, uint32_t len, uint8_t *d, uint32_t cap, uint32_t *written) {
    len &= ~1u;
    uint32_t r = 0, w = 0;
    while (r < len) {
        if (len - r >= 16 && cap - w >= 8) {
            const __m128i v = load16(s + r / 2);
            if (_mm_movemask_epi8(_mm_cmpeq_epi16(
                    _mm_and_si128(v, _mm_set1_epi16(static_cast<short>(0xFF80))), _mm_setzero_si128())) ==
                0xFFFF) {
                _mm_storel_epi64(reinterpret_cast<__m128i *>(d + w), _mm_packus_epi16(v, v));
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

uint32_t latin1_to_utf8_sse2(const uint8_t *s, uint32_t len, uint8_t *d) {
    uint32_t p = 0, w = 0;
    while (len - p >= 16) {
        const __m128i v = load16(s + p);
        if (_mm_movemask_epi8(v) == 0) {
            store16(d + w, v);
            p += 16;
            w += 16;
        } else {
            w += latin1_to_utf8_scalar(s + p, 16, d + w);
            p += 16;
        }
    }
    return w + latin1_to_utf8_scalar(s + p, len - p, d + w);
}

// ---------------------------------------------------------------- AVX2

TEXTCONV_AVX2 uint32_t utf8_to_utf16_avx2(const uint8_t *s, uint32_t len, uint16_t *d, uint32_t cap,
                                          uint32_t *written) {
    uint32_t p = 0, w = 0;
    while (p < len) {
        if (len - p >= 32 && cap - w >= 64) {
            const __m256i v = load32(s + p);
            if (_mm256_movemask_epi8(v) == 0) {
                store32(d + w / 2, _mm256_cvtepu8_epi16(_mm256_castsi256_si128(v)));
                store32(d + w / 2 + 16, _mm256_cvtepu8_epi16(_mm256_extracti128_si256(v, 1)));
                p += 32;
                w += 64;
                continue;
            }
        }
        uint32_t consumed, units;
        if (len - p >= 34 && cap - w >= 80 && utf8_block32(s + p, d + w / 2, consumed, units)) {
            p += consumed;
            w += 2 * units;
            continue;
        }
        if (len - p >= 18 && cap - w >= 48) {
            if (utf8_block(s + p, d + w / 2, consumed, units)) {
                p += consumed;
                w += 2 * units;
                continue;
            }
        }
        const uint32_t r = utf8_scalar_stretch(s, len, p, d, cap, w, 16);
        if (r != kStepContinue) return r;
    }
    *written = w;
    return TEXTCONV_UTF_DONE;
}

TEXTCONV_AVX2 uint32_t utf16_to_utf8_avx2(const uint16_t *s, uint32_t len, uint8_t *d, uint32_t cap,
                                          uint32_t *written) {
    len &= ~1u;
    uint32_t r = 0, w = 0;
    while (r < len) {
        if (len - r >= 32) {
            const __m256i v = load32(s + r / 2);
            if (cap - w >= 16 && _mm256_testz_si256(v, _mm256_set1_epi16(static_cast<short>(0xFF80)))) {
                store16(d + w, _mm_packus_epi16(_mm256_castsi256_si128(v), _mm256_extracti128_si256(v, 1)));
                r += 32;
                w += 16;
                continue;
            }
            if (cap - w >= 48 && _mm256_testz_si256(v, _mm256_set1_epi16(static_cast<short>(0xF800)))) {
                w += utf16_block_two_bytes(v, d + w);
                r += 32;
                continue;
            }
        }
        if (len - r >= 16 && cap - w >= 40) {
            if (const uint32_t n = utf16_block(s + r / 2, d + w)) {
                r += 16;
                w += n;
                continue;
            }
        }
        const uint32_t res = utf16_scalar_stretch(s, len, r, d, cap, w, 16);
        if (res != kStepContinue) return res;
    }
    *written = w;
    return TEXTCONV_UTF_DONE;
}

// d has room for 2 * len bytes (and the terminator the caller adds).
TEXTCONV_AVX2 uint32_t latin1_to_utf8_avx2(const uint8_t *s, uint32_t len, uint8_t *d) {
    uint32_t p = 0, w = 0;
    const uint64_t room = 2ull * len;
    while (len - p >= 32) {
        const __m256i v = load32(s + p);
        const uint32_t m = static_cast<uint32_t>(_mm256_movemask_epi8(v));
        if (m == 0) {
            store32(d + w, v);
            p += 32;
            w += 32;
            continue;
        }
        if (w + 96 > room) break;  // two blocks of up to 48 bytes
        const __m128i lo = _mm256_castsi256_si128(v), hi = _mm256_extracti128_si256(v, 1);
        if ((m & 0xFFFF) == 0) {
            store16(d + w, lo);
            w += 16;
        } else {
            w += latin1_block(lo, m & 0xFFFF, d + w);
        }
        if ((m >> 16) == 0) {
            store16(d + w, hi);
            w += 16;
        } else {
            w += latin1_block(hi, m >> 16, d + w);
        }
        p += 32;
    }
    return w + latin1_to_utf8_scalar(s + p, len - p, d + w);
}

}  // namespace textconv::fast

#endif  // __x86_64__
