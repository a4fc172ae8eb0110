// Chooses between the scalar code and the vector fast paths.
#include "unicode/utf_internal.h"

namespace textconv {

uint32_t utf8_to_utf16(const uint8_t *src, uint32_t len, uint16_t *dst, uint32_t cap, uint32_t *written) {
    return utf8_to_utf16_scalar(src, len, dst, cap, written);
}

uint32_t utf16_to_utf8(const uint16_t *src, uint32_t len, uint8_t *dst, uint32_t cap, uint32_t *written) {
    return utf16_to_utf8_scalar(src, len, dst, cap, written);
}

uint32_t latin1_to_utf8(const uint8_t *src, uint32_t len, uint8_t *dst) {
    return latin1_to_utf8_scalar(src, len, dst);
}

}  // namespace textconv
