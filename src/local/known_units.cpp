// Known units by blocks. ASCII units pass when their bit is set in the rows
// (they give themselves); units of the page take their byte from the flat
// table, read with byte shuffles, and pass when it is not 0. A block goes
// through when every unit passes. (The NEON version reads the ASCII units'
// bytes from the flat table too.)
#include "local/known_units.h"

#include <cstring>

#include "unicode/utf_internal.h"

#if defined(__x86_64__)
#include <immintrin.h>
#define TEXTCONV_AVX2 __attribute__((target("avx2,bmi")))
#elif defined(__arm__) && defined(__ARM_PCS_VFP)
#include <arm_neon.h>
#define TEXTCONV_NEON __attribute__((target("fpu=neon")))
#endif

namespace textconv {
namespace {

using Kernel = size_t (*)(const uint16_t *, size_t, uint8_t *, const uint8_t *, const uint8_t *, uint16_t);

size_t no_kernel(const uint16_t *, size_t, uint8_t *, const uint8_t *, const uint8_t *, uint16_t) {
    return 0;
}

#if defined(__x86_64__)
// The bit of each high nibble of an ASCII byte.
constexpr uint8_t kNibbleBit[16] = {1, 2, 4, 8, 16, 32, 64, 128, 0, 0, 0, 0, 0, 0, 0, 0};

// Two registers of 16 units as 32 bytes in unit order (each saturated to
// 0..255: the pack instructions work per 128-bit lane).
TEXTCONV_AVX2 inline __m256i pack_units(__m256i a, __m256i b) {
    return _mm256_permute4x64_epi64(_mm256_packus_epi16(a, b), 0xD8);
}
TEXTCONV_AVX2 inline __m256i pack_masks(__m256i a, __m256i b) {
    return _mm256_permute4x64_epi64(_mm256_packs_epi16(a, b), 0xD8);
}
TEXTCONV_AVX2 inline __m256i at_most_7f(__m256i u) {
    return _mm256_cmpeq_epi16(_mm256_min_epu16(u, _mm256_set1_epi16(0x7F)), u);
}

// Bytes 0..127 looked up in the 128-entry table, eight rows of 16; a row's
// lanes are those whose index, less the row's start, lies in 0..15 (adding
// 0x70 with saturation sets bit 7, which makes the shuffle give 0, in all
// the others).
TEXTCONV_AVX2 inline __m256i lookup_128(const uint8_t *table, __m256i index) {
    __m256i even = _mm256_setzero_si256(), odd = _mm256_setzero_si256();
    const __m256i bias = _mm256_set1_epi8(0x70), step = _mm256_set1_epi8(16);
    for (int row = 0; row < 8; row += 2) {
        const __m256i t0 =
            _mm256_broadcastsi128_si256(_mm_loadu_si128(reinterpret_cast<const __m128i *>(table + 16 * row)));
        const __m256i t1 = _mm256_broadcastsi128_si256(
            _mm_loadu_si128(reinterpret_cast<const __m128i *>(table + 16 * row + 16)));
        even = _mm256_or_si256(even, _mm256_shuffle_epi8(t0, _mm256_adds_epu8(index, bias)));
        index = _mm256_sub_epi8(index, step);
        odd = _mm256_or_si256(odd, _mm256_shuffle_epi8(t1, _mm256_adds_epu8(index, bias)));
        index = _mm256_sub_epi8(index, step);
    }
    return _mm256_or_si256(even, odd);
}

TEXTCONV_AVX2 size_t known_units_avx2(const uint16_t *units, size_t n, uint8_t *d, const uint8_t *flat,
                                      const uint8_t *asciiRows, uint16_t pageBase) {
    const __m256i page = _mm256_set1_epi16(static_cast<short>(pageBase));
    const __m256i rows =
        _mm256_broadcastsi128_si256(_mm_loadu_si128(reinterpret_cast<const __m128i *>(asciiRows)));
    const __m256i bits =
        _mm256_broadcastsi128_si256(_mm_loadu_si128(reinterpret_cast<const __m128i *>(kNibbleBit)));
    const __m256i nibble = _mm256_set1_epi8(0x0F);
    size_t i = 0;
    while (n - i >= 32) {
        const __m256i u0 = _mm256_loadu_si256(reinterpret_cast<const __m256i *>(units + i));
        const __m256i u1 = _mm256_loadu_si256(reinterpret_cast<const __m256i *>(units + i + 16));
        const __m256i ascii = pack_masks(at_most_7f(u0), at_most_7f(u1));
        const __m256i bytes = pack_units(u0, u1);
        // ASCII units known to give themselves.
        const __m256i want = _mm256_shuffle_epi8(bits, _mm256_and_si256(_mm256_srli_epi16(bytes, 4), nibble));
        const __m256i have =
            _mm256_and_si256(_mm256_shuffle_epi8(rows, _mm256_and_si256(bytes, nibble)), want);
        uint32_t known = static_cast<uint32_t>(
            _mm256_movemask_epi8(_mm256_and_si256(_mm256_cmpeq_epi8(have, want), ascii)));
        __m256i out = bytes;
        if (known != 0xFFFFFFFFu) {
            // Units of the page through its table.
            const __m256i p0 = _mm256_sub_epi16(u0, page), p1 = _mm256_sub_epi16(u1, page);
            const __m256i inPage = pack_masks(at_most_7f(p0), at_most_7f(p1));
            const __m256i found = lookup_128(flat + 0x80, _mm256_and_si256(pack_units(p0, p1), inPage));
            const __m256i pageKnown =
                _mm256_andnot_si256(_mm256_cmpeq_epi8(found, _mm256_setzero_si256()), inPage);
            known |= static_cast<uint32_t>(_mm256_movemask_epi8(pageKnown));
            out = _mm256_blendv_epi8(bytes, found, inPage);
        }
        _mm256_storeu_si256(reinterpret_cast<__m256i *>(d + i), out);
        if (known != 0xFFFFFFFFu) return i + static_cast<size_t>(__builtin_ctz(~known));
        i += 32;
    }
    return i;
}
#endif

#if defined(__arm__) && defined(__ARM_PCS_VFP)
// Eight table bytes for eight indexes: four 32-entry lookups, each leaving
// the lanes whose index lies outside its quarter as they were.
TEXTCONV_NEON inline uint8x8_t lookup_flat(const uint8x8x4_t quarters[8], uint8x8_t index) {
    uint8x8_t bytes = vtbl4_u8(quarters[0], index);
    for (int q = 1; q < 8; ++q) bytes = vtbx4_u8(bytes, quarters[q], vsub_u8(index, vdup_n_u8(32 * q)));
    return bytes;
}

TEXTCONV_NEON size_t known_units_neon(const uint16_t *units, size_t n, uint8_t *d, const uint8_t *flat,
                                      const uint8_t *, uint16_t pageBase) {
    uint8x8x4_t quarters[8];
    for (int q = 0; q < 8; ++q)
        for (int k = 0; k < 4; ++k) quarters[q].val[k] = vld1_u8(flat + 32 * q + 8 * k);
    const uint16x8_t page = vdupq_n_u16(pageBase), limit = vdupq_n_u16(0x7F);
    size_t i = 0;
    while (n - i >= 8) {
        const uint16x8_t u = vld1q_u16(units + i);
        const uint16x8_t inPage = vsubq_u16(u, page);
        const uint16x8_t isAscii = vcleq_u16(u, limit), isPage = vcleq_u16(inPage, limit);
        const uint16x8_t index16 = vbslq_u16(isAscii, u, vaddq_u16(inPage, vdupq_n_u16(0x80)));
        const uint8x8_t valid = vmovn_u16(vorrq_u16(isAscii, isPage));
        const uint8x8_t bytes = lookup_flat(quarters, vmovn_u16(index16));
        const uint8x8_t ok = vand_u8(valid, vtst_u8(bytes, bytes));
        if (vget_lane_u64(vreinterpret_u64_u8(ok), 0) != ~0ull) break;
        vst1_u8(d + i, bytes);
        i += 8;
    }
    return i;
}
#endif

Kernel choose() {
    const char *path = active_path();
#if defined(__x86_64__)
    if (std::strcmp(path, "avx2") == 0) return known_units_avx2;
#elif defined(__arm__) && defined(__ARM_PCS_VFP)
    if (std::strcmp(path, "neon") == 0) return known_units_neon;
#endif
    (void)path;
    return no_kernel;
}

// Chosen at the first call, as the UTF paths are; the library is not called
// from two threads at once.
Kernel chosen = nullptr;

}  // namespace

size_t copy_known_units(const uint16_t *units, size_t n, uint8_t *d, const uint8_t flat[256],
                        const uint8_t asciiRows[16], uint16_t pageBase) {
    if (chosen == nullptr) chosen = choose();
    return chosen(units, n, d, flat, asciiRows, pageBase);
}

}  // namespace textconv
