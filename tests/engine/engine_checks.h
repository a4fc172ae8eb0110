// Helpers for the charset engine tests: a cached glibc iconv oracle and the
// string functions run over guarded buffers.
#pragma once

#include <gtest/gtest.h>
#include <iconv.h>

#include <cstring>
#include <optional>
#include <string>
#include <vector>

#include "textconv.h"

namespace enginetest {

// glibc iconv, one descriptor per oracle, reset before every conversion.
class Oracle {
  public:
    Oracle(const char *to, const char *from) : cd_(iconv_open(to, from)) {}
    ~Oracle() {
        if (ok()) iconv_close(cd_);
    }
    bool ok() const { return cd_ != reinterpret_cast<iconv_t>(-1); }
    std::optional<std::string> operator()(const std::string &in) {
        iconv(cd_, nullptr, nullptr, nullptr, nullptr);
        std::string out(in.size() * 4 + 8, '\0');
        char *ip = const_cast<char *>(in.data()), *op = out.data();
        size_t il = in.size(), ol = out.size();
        if (iconv(cd_, &ip, &il, &op, &ol) == static_cast<size_t>(-1)) return std::nullopt;
        if (iconv(cd_, nullptr, nullptr, &op, &ol) == static_cast<size_t>(-1)) return std::nullopt;
        out.resize(out.size() - ol);
        return out;
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

constexpr size_t kGuard = 16;
constexpr unsigned char kGuardByte = 0xA5;

// What a string function did: result, the text up to *destination + *length
// (the whole output on success), how far each pointer moved (bytes) and
// whether the bytes past the room are untouched.
struct Outcome {
    int result;
    std::string output;
    uint32_t length;
    size_t sourceMoved;
    size_t destinationMoved;
    bool guardIntact;
    std::u16string units() const { return as_units(output); }
};

inline bool guard_intact(const std::vector<char> &buffer, size_t room) {
    for (size_t i = room; i < buffer.size(); ++i)
        if (static_cast<unsigned char>(buffer[i]) != kGuardByte) return false;
    return true;
}

// Runs one of the two string functions over source (terminator included)
// into a guarded buffer of room bytes.
template <class In, class Out>
Outcome run_string(int (*fn)(CharsetId, const In **, Out **, uint32_t *), CharsetId charset,
                   const std::string &source, std::optional<uint32_t> room) {
    const uint32_t r = room.value_or(static_cast<uint32_t>(source.size() * 4 + 8));
    std::vector<char> buffer(r + kGuard, static_cast<char>(kGuardByte));
    const auto *in = reinterpret_cast<const In *>(source.data());
    auto *out = reinterpret_cast<Out *>(buffer.data());
    Outcome run{};
    run.length = r;
    run.result = fn(charset, &in, &out, &run.length);
    run.sourceMoved = static_cast<size_t>(reinterpret_cast<const char *>(in) - source.data());
    run.destinationMoved = static_cast<size_t>(reinterpret_cast<char *>(out) - buffer.data());
    const size_t end = run.result ? run.length : std::min<size_t>(run.destinationMoved + run.length, r);
    run.output.assign(buffer.data(), end);
    run.guardIntact = guard_intact(buffer, r);
    return run;
}

// StringFromCharsetToUnicode over text, its terminator appended (a 0 unit
// for the 16-bit charsets, else a NUL). Default room: plenty.
inline Outcome to_unicode(CharsetId charset, const std::string &text, std::optional<uint32_t> room = {}) {
    const bool unitText =
        charset == CHARSET_UTF16 || charset == CHARSET_UTF16LE || charset == CHARSET_UTF16BE;
    return run_string(StringFromCharsetToUnicode, charset, text + std::string(unitText ? 2 : 1, '\0'), room);
}

// StringFromUnicodeToCharset over units, a 0 unit appended.
inline Outcome from_unicode(CharsetId charset, const std::u16string &units,
                            std::optional<uint32_t> room = {}) {
    return run_string(StringFromUnicodeToCharset, charset, as_bytes(units + u'\0'), room);
}

}  // namespace enginetest
