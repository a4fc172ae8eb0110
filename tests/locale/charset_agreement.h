// Differential check of two iconv names over the short byte sequences.
#pragma once

#include <iconv.h>

#include <optional>
#include <string>
#include <vector>

namespace localetest {

struct Agreement {
    size_t compared = 0;                 // sequences that `reference` decodes
    std::vector<std::string> differing;  // of those, the ones `candidate` decodes otherwise
};

// The UTF-16LE bytes of seq, or nullopt when any of it is rejected or incomplete.
inline std::optional<std::string> decode(iconv_t cd, const std::string &seq) {
    iconv(cd, nullptr, nullptr, nullptr, nullptr);
    char out[64], *dst = out, *src = const_cast<char *>(seq.data());
    size_t srcLeft = seq.size(), dstLeft = sizeof out;
    if (iconv(cd, &src, &srcLeft, &dst, &dstLeft) == size_t(-1) ||
        iconv(cd, nullptr, nullptr, &dst, &dstLeft) == size_t(-1))
        return std::nullopt;
    return std::string(out, dst);
}

// Where `reference` decodes a sequence, `candidate` must decode it alike. The
// sequences: every byte, every two-byte sequence with a high lead byte, and
// the three-byte EUC ones behind 0x8F, enough to tell the registry's
// single- and double-byte charsets apart.
inline std::optional<Agreement> compare_decoders(const char *reference, const char *candidate) {
    iconv_t ref = iconv_open("UTF-16LE", reference), cand = iconv_open("UTF-16LE", candidate);
    std::optional<Agreement> result;
    if (ref != iconv_t(-1) && cand != iconv_t(-1)) {
        result.emplace();
        const auto check = [&](const std::string &seq) {
            auto expected = decode(ref, seq);
            if (!expected) return;
            ++result->compared;
            if (decode(cand, seq) != expected) result->differing.push_back(seq);
        };
        for (int b = 1; b < 0x100; ++b) check(std::string(1, char(b)));
        for (int lead = 0x80; lead < 0x100; ++lead)
            for (int trail = 0x40; trail < 0x100; ++trail) check({char(lead), char(trail)});
        for (int second = 0xA1; second < 0xFF; ++second)
            for (int third = 0xA1; third < 0xFF; ++third) check({'\x8F', char(second), char(third)});
    }
    for (iconv_t cd : {ref, cand})
        if (cd != iconv_t(-1)) iconv_close(cd);
    return result;
}

}  // namespace localetest
