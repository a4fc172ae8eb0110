// glibc iconv as the oracle for the local charset, with text from the corpora.
#pragma once

#include <iconv.h>

#include <algorithm>
#include <map>
#include <optional>
#include <string>
#include <vector>

#include "test_support.h"

namespace localtest {

// One unit at a time to a charset through one glibc descriptor, answers kept.
class UnitOracle {
  public:
    explicit UnitOracle(const char *charset) : cd_(iconv_open(charset, "UTF-16LE")) {}
    ~UnitOracle() {
        if (cd_ != reinterpret_cast<iconv_t>(-1)) iconv_close(cd_);
    }
    bool ok() const { return cd_ != reinterpret_cast<iconv_t>(-1); }
    // The bytes of one unit, or nullopt when the charset has no such character.
    std::optional<std::string> bytes(char16_t unit) {
        auto it = cache_.find(unit);
        if (it != cache_.end()) return it->second;
        char in[2] = {static_cast<char>(unit & 0xFF), static_cast<char>(unit >> 8)};
        char out[16];
        char *ip = in, *op = out;
        size_t il = 2, ol = sizeof out;
        iconv(cd_, nullptr, nullptr, nullptr, nullptr);
        std::optional<std::string> r;
        if (iconv(cd_, &ip, &il, &op, &ol) != static_cast<size_t>(-1) && il == 0)
            r = std::string(out, sizeof out - ol);
        cache_.emplace(unit, r);
        return r;
    }

  private:
    iconv_t cd_;
    std::map<char16_t, std::optional<std::string>> cache_;
};

// Lines of every UTF-8 corpus (at most perFile of each, no empty ones).
inline std::vector<std::string> utf8_lines(size_t perFile) {
    std::vector<std::string> lines;
    for (const std::string &name : testsupport::corpus_files(".utf8.txt")) {
        const std::string text = testsupport::read_corpus(name).value_or("");
        for (size_t start = 0, end, taken = 0; start < text.size() && taken < perFile; start = end + 1) {
            end = std::min(text.find('\n', start), text.size());
            if (end > start) lines.push_back(text.substr(start, end - start)), ++taken;
        }
    }
    return lines;
}

}  // namespace localtest
