// Chooses, once per process, between the scalar code and the vector fast
// paths; every path gives the same results.
#include <cstdlib>
#include <cstring>

#include "unicode/utf_internal.h"

namespace textconv {
namespace {

struct Paths {
    const char *name;
    uint32_t (*utf8_to_utf16)(const uint8_t *, uint32_t, uint16_t *, uint32_t, uint32_t *);
    uint32_t (*utf16_to_utf8)(const uint16_t *, uint32_t, uint8_t *, uint32_t, uint32_t *);
    uint32_t (*latin1_to_utf8)(const uint8_t *, uint32_t, uint8_t *);
};

constexpr Paths kScalar = {"scalar", utf8_to_utf16_scalar, utf16_to_utf8_scalar, latin1_to_utf8_scalar};
#if !defined(__x86_64__)
constexpr Paths kWords = {"words", fast::utf8_to_utf16_words, fast::utf16_to_utf8_words,
                          fast::latin1_to_utf8_words};
#endif
#if defined(__x86_64__)
constexpr Paths kSse2 = {"sse2", fast::utf8_to_utf16_sse2, fast::utf16_to_utf8_sse2,
                         fast::latin1_to_utf8_sse2};
constexpr Paths kAvx2 = {"avx2", fast::utf8_to_utf16_avx2, fast::utf16_to_utf8_avx2,
                         fast::latin1_to_utf8_avx2};
#endif
#if defined(__arm__) && defined(__ARM_PCS_VFP)
constexpr Paths kNeon = {"neon", fast::utf8_to_utf16_neon, fast::utf16_to_utf8_neon,
                         fast::latin1_to_utf8_neon};
#endif

const Paths *choose() {
    const char *force = std::getenv("TEXTCONV_FORCE_SCALAR");
    if (force != nullptr && std::strcmp(force, "1") == 0) return &kScalar;
#if defined(__x86_64__)
    return fast::avx2_available() ? &kAvx2 : &kSse2;
#elif defined(__arm__) && defined(__ARM_PCS_VFP)
    return fast::neon_available() ? &kNeon : &kWords;
#else
    return &kWords;
#endif
}

// The library is not called from two threads at once; a repeated first choice
// would in any case store the same value.
const Paths *chosen = nullptr;

inline const Paths &paths() {
    if (chosen == nullptr) chosen = choose();
    return *chosen;
}

}  // namespace

const char *active_path() { return paths().name; }

uint32_t utf8_to_utf16(const uint8_t *src, uint32_t len, uint16_t *dst, uint32_t cap, uint32_t *written) {
    return paths().utf8_to_utf16(src, len, dst, cap, written);
}

uint32_t utf16_to_utf8(const uint16_t *src, uint32_t len, uint8_t *dst, uint32_t cap, uint32_t *written) {
    return paths().utf16_to_utf8(src, len, dst, cap, written);
}

uint32_t latin1_to_utf8(const uint8_t *src, uint32_t len, uint8_t *dst) {
    return paths().latin1_to_utf8(src, len, dst);
}

}  // namespace textconv
