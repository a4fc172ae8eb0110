// Differential check of two iconv names over the short byte sequences.
#pragma once

#include "../engine/engine_checks.h"

namespace localetest {

struct Agreement {
    size_t compared = 0;                 // sequences that `reference` decodes
    std::vector<std::string> differing;  // of those, the ones `candidate` decodes otherwise
};

// Where `reference` decodes a sequence, `candidate` must decode it alike. The
// sequences: every byte, every two-byte sequence with a high lead byte, and
// the three-byte EUC ones behind 0x8F, enough to tell the registry's single-
// and double-byte charsets apart. nullopt when glibc lacks either name.
inline std::optional<Agreement> compare_decoders(const char *reference, const char *candidate) {
    enginetest::Oracle ref("UTF-16LE", reference), cand("UTF-16LE", candidate);
    if (!ref.ok() || !cand.ok()) return std::nullopt;
    Agreement result;
    const auto check = [&](const std::string &seq) {
        auto expected = ref(seq);
        if (!expected) return;
        ++result.compared;
        if (cand(seq) != expected) result.differing.push_back(seq);
    };
    for (int b = 1; b < 0x100; ++b) check(std::string(1, char(b)));
    for (int lead = 0x80; lead < 0x100; ++lead)
        for (int trail = 0x40; trail < 0x100; ++trail) check({char(lead), char(trail)});
    for (int second = 0xA1; second < 0xFF; ++second)
        for (int third = 0xA1; third < 0xFF; ++third) check({'\x8F', char(second), char(third)});
    return result;
}

}  // namespace localetest
