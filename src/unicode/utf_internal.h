// Internal entry points of the UTF transforms: the scalar reference code and
// the dispatched versions that may take vector fast paths. Both give the same
// bytes, counts and results for every input.
#pragma once

#include <cstdint>

namespace textconv {

// The two workhorses over counted buffers; results and *written as the
// exported ConvertUTF8toUTF16 / ConvertUTF16toUTF8.
uint32_t utf8_to_utf16_scalar(const uint8_t *src, uint32_t len, uint16_t *dst, uint32_t cap,
                              uint32_t *written);
uint32_t utf8_to_utf16(const uint8_t *src, uint32_t len, uint16_t *dst, uint32_t cap, uint32_t *written);
uint32_t utf16_to_utf8_scalar(const uint16_t *src, uint32_t len, uint8_t *dst, uint32_t cap,
                              uint32_t *written);
uint32_t utf16_to_utf8(const uint16_t *src, uint32_t len, uint8_t *dst, uint32_t cap, uint32_t *written);

// Latin-1 bytes to UTF-8 (no terminator); returns the bytes written. dst
// needs 2 * len bytes.
uint32_t latin1_to_utf8_scalar(const uint8_t *src, uint32_t len, uint8_t *dst);
uint32_t latin1_to_utf8(const uint8_t *src, uint32_t len, uint8_t *dst);

// Which implementation the dispatched functions use: "scalar", "words",
// "neon", "sse2" or "avx2". Chosen once, at the first call; TEXTCONV_FORCE_SCALAR=1 in the
// environment forces the scalar code.
const char *active_path();

namespace fast {
// Word-at-a-time ASCII runs, any machine.
uint32_t utf8_to_utf16_words(const uint8_t *src, uint32_t len, uint16_t *dst, uint32_t cap,
                             uint32_t *written);
uint32_t utf16_to_utf8_words(const uint16_t *src, uint32_t len, uint8_t *dst, uint32_t cap,
                             uint32_t *written);
uint32_t latin1_to_utf8_words(const uint8_t *src, uint32_t len, uint8_t *dst);
#if defined(__x86_64__)
bool avx2_available();
uint32_t utf8_to_utf16_sse2(const uint8_t *src, uint32_t len, uint16_t *dst, uint32_t cap, uint32_t *written);
uint32_t utf16_to_utf8_sse2(const uint16_t *src, uint32_t len, uint8_t *dst, uint32_t cap, uint32_t *written);
uint32_t latin1_to_utf8_sse2(const uint8_t *src, uint32_t len, uint8_t *dst);
// Call only when avx2_available().
uint32_t utf8_to_utf16_avx2(const uint8_t *src, uint32_t len, uint16_t *dst, uint32_t cap, uint32_t *written);
uint32_t utf16_to_utf8_avx2(const uint16_t *src, uint32_t len, uint8_t *dst, uint32_t cap, uint32_t *written);
uint32_t latin1_to_utf8_avx2(const uint8_t *src, uint32_t len, uint8_t *dst);
#endif
#if defined(__arm__) && defined(__ARM_PCS_VFP)
bool neon_available();
// Call only when neon_available().
uint32_t utf8_to_utf16_neon(const uint8_t *src, uint32_t len, uint16_t *dst, uint32_t cap, uint32_t *written);
uint32_t utf16_to_utf8_neon(const uint16_t *src, uint32_t len, uint8_t *dst, uint32_t cap, uint32_t *written);
uint32_t latin1_to_utf8_neon(const uint8_t *src, uint32_t len, uint8_t *dst);
#endif
}  // namespace fast

}  // namespace textconv
