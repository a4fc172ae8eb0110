// Differential check of two iconv names over the short byte sequences.
#pragma once

#include <iconv.h>

#include <cerrno>
#include <optional>
#include <string>
#include <vector>

namespace localetest {

// One iconv descriptor to UTF-16LE, kept for many short conversions.
class Decoder {
  public:
    explicit Decoder(const char *from) : cd_(iconv_open("UTF-16LE", from)) {}
    ~Decoder() {
        if (ok()) iconv_close(cd_);
    }
    Decoder(const Decoder &) = delete;
    Decoder &operator=(const Decoder &) = delete;
    bool ok() const { return cd_ != reinterpret_cast<iconv_t>(-1); }

    // The UTF-16LE bytes of the whole sequence, or nullopt when any of it is
    // rejected or incomplete.
    std::optional<std::string> decode(const std::string &in) {
        iconv(cd_, nullptr, nullptr, nullptr, nullptr);
        char out[64];
        char *src = const_cast<char *>(in.data());
        size_t srcLeft = in.size();
        char *dst = out;
        size_t dstLeft = sizeof out;
        if (iconv(cd_, &src, &srcLeft, &dst, &dstLeft) == static_cast<size_t>(-1)) return std::nullopt;
        if (iconv(cd_, nullptr, nullptr, &dst, &dstLeft) == static_cast<size_t>(-1)) return std::nullopt;
        return std::string(out, dst);
    }

  private:
    iconv_t cd_;
};

// Every byte, every two-byte sequence with a high lead byte, and the
// three-byte EUC sequences behind 0x8F: enough to tell the single- and
// double-byte charsets of the registry apart.
inline std::vector<std::string> short_sequences() {
    std::vector<std::string> all;
    for (int b = 1; b < 0x100; ++b) all.push_back(std::string(1, static_cast<char>(b)));
    for (int lead = 0x80; lead < 0x100; ++lead)
        for (int trail = 0x40; trail < 0x100; ++trail)
            all.push_back({static_cast<char>(lead), static_cast<char>(trail)});
    for (int second = 0xA1; second < 0xFF; ++second)
        for (int third = 0xA1; third < 0xFF; ++third)
            all.push_back({'\x8F', static_cast<char>(second), static_cast<char>(third)});
    return all;
}

struct Agreement {
    size_t compared = 0;                 // sequences that `reference` decodes
    std::vector<std::string> differing;  // of those, the ones `candidate` decodes otherwise
};

// Where `reference` decodes a sequence, `candidate` must decode it alike.
inline std::optional<Agreement> compare_decoders(const char *reference, const char *candidate) {
    Decoder ref(reference), cand(candidate);
    if (!ref.ok() || !cand.ok()) return std::nullopt;
    Agreement result;
    for (const std::string &seq : short_sequences()) {
        std::optional<std::string> expected = ref.decode(seq);
        if (!expected) continue;
        ++result.compared;
        if (cand.decode(seq) != expected) result.differing.push_back(seq);
    }
    return result;
}

}  // namespace localetest
