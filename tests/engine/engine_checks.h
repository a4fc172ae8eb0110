// Helpers for the engine tests: a glibc iconv oracle and the conversion
// functions run over guarded buffers.
#pragma once

#include <gtest/gtest.h>
#include <iconv.h>

#include <algorithm>
#include <cstring>
#include <optional>
#include <string>
#include <tuple>
#include <vector>

#include "textconv.h"

namespace enginetest {

// glibc iconv, reset before every conversion; nullopt when it rejects.
class Oracle {
  public:
    Oracle(const char *to, const char *from) : cd_(iconv_open(to, from)) {}
    ~Oracle() {
        if (ok()) iconv_close(cd_);
    }
    bool ok() const { return cd_ != iconv_t(-1); }
    std::optional<std::string> operator()(const std::string &in) {
        iconv(cd_, nullptr, nullptr, nullptr, nullptr);
        std::string out(in.size() * 4 + 8, '\0');
        char *ip = const_cast<char *>(in.data()), *op = out.data();
        size_t il = in.size(), ol = out.size();
        if (iconv(cd_, &ip, &il, &op, &ol) == size_t(-1) ||
            iconv(cd_, nullptr, nullptr, &op, &ol) == size_t(-1))
            return std::nullopt;
        return out.substr(0, out.size() - ol);
    }

  private:
    iconv_t cd_;
};

inline std::u16string as_units(const std::string &bytes) {
    std::u16string u(bytes.size() / 2, u'\0');
    std::memcpy(u.data(), bytes.data(), u.size() * 2);
    return u;
}
inline std::string as_bytes(const std::u16string &units) {
    return std::string(reinterpret_cast<const char *>(units.data()), units.size() * 2);
}
inline std::u16string z(std::u16string units) { return units + u'\0'; }  // with its terminator

constexpr size_t kGuard = 16;
constexpr char kGuardByte = '\xA5';
inline bool guard_intact(const std::vector<char> &buffer, size_t room) {
    return std::all_of(buffer.begin() + room, buffer.end(), [](char c) { return c == kGuardByte; });
}

// What a string function did: result, the text up to *destination + *length
// (the whole output on success), how far each pointer moved (bytes), and
// whether the bytes past the room are untouched.
struct Outcome {
    int result;
    std::string output;
    uint32_t length;
    size_t sourceMoved, destinationMoved;
    bool guardIntact;
    std::u16string units() const { return as_units(output); }
};

template <class In, class Out>
Outcome run_string(int (*fn)(CharsetId, const In **, Out **, uint32_t *), CharsetId charset,
                   const std::string &source, std::optional<uint32_t> room) {
    const uint32_t r = room.value_or(uint32_t(source.size() * 4 + 8));
    std::vector<char> buffer(r + kGuard, kGuardByte);
    const auto *in = reinterpret_cast<const In *>(source.data());
    auto *out = reinterpret_cast<Out *>(buffer.data());
    Outcome run{};
    run.length = r;
    run.result = fn(charset, &in, &out, &run.length);
    run.sourceMoved = size_t(reinterpret_cast<const char *>(in) - source.data());
    run.destinationMoved = size_t(reinterpret_cast<char *>(out) - buffer.data());
    run.output.assign(buffer.data(),
                      run.result ? run.length : std::min<size_t>(run.destinationMoved + run.length, r));
    run.guardIntact = guard_intact(buffer, r);
    return run;
}

inline bool is_utf16(CharsetId c) {
    return c == CHARSET_UTF16 || c == CHARSET_UTF16LE || c == CHARSET_UTF16BE;
}

// The string functions over text and its terminator (a 0 unit for 16-bit
// text). Default room: plenty.
inline Outcome to_unicode(CharsetId charset, const std::string &text, std::optional<uint32_t> room = {}) {
    return run_string(StringFromCharsetToUnicode, charset,
                      text + std::string(is_utf16(charset) ? 2 : 1, '\0'), room);
}
inline Outcome from_unicode(CharsetId charset, const std::u16string &units,
                            std::optional<uint32_t> room = {}) {
    return run_string(StringFromUnicodeToCharset, charset, as_bytes(z(units)), room);
}

// FromCharsetToUnicode on one character: result, unit, bytes moved.
using Char = std::tuple<int, uint16_t, size_t>;
inline Char decode_char(CharsetId charset, const char *source) {
    const char *p = source;
    uint16_t unit = 0;
    uint32_t length = 0;
    const int result = FromCharsetToUnicode(charset, &p, &unit, &length);
    EXPECT_TRUE(!result || length == 2);
    return {result, unit, size_t(p - source)};
}
// FromUnicodeToCharset on one unit; nullopt on failure.
inline std::optional<std::string> encode_char(CharsetId charset, uint16_t unit) {
    char out[8], *q = out;
    if (!FromUnicodeToCharset(charset, unit, &q)) return std::nullopt;
    return std::string(out, q);
}

}  // namespace enginetest
