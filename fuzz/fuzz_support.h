// Helpers shared by the fuzz targets: reading the fuzzer's bytes as typed
// values, buffers with guard bytes after the room, glibc iconv as oracle, and
// a check that stops the run on any broken invariant.
#pragma once

#include <iconv.h>

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <optional>
#include <string>
#include <vector>

#include "textconv.h"

// Stops the run with the failed condition on stderr: libFuzzer then keeps
// the input as a crash reproducer.
#define FUZZ_CHECK(cond)                                                                      \
    do {                                                                                      \
        if (!(cond)) {                                                                        \
            std::fprintf(stderr, "%s:%d: invariant broken: %s\n", __FILE__, __LINE__, #cond); \
            __builtin_trap();                                                                 \
        }                                                                                     \
    } while (0)

namespace fuzz {

// With TEXTCONV_FUZZ_TRACE set, prints a labelled hex dump on stderr: run a
// reproducer with it to see the values behind a broken invariant.
inline void trace(const char *label, const void *data, size_t size) {
    static const bool on = std::getenv("TEXTCONV_FUZZ_TRACE") != nullptr;
    if (!on) return;
    std::fprintf(stderr, "%s:", label);
    for (size_t i = 0; i < size; ++i) std::fprintf(stderr, " %02x", static_cast<const uint8_t *>(data)[i]);
    std::fprintf(stderr, "\n");
}
inline void trace(const char *label, const std::string &s) { trace(label, s.data(), s.size()); }

// Reads the fuzzer's bytes front to back; past the end every read gives 0.
class Reader {
  public:
    Reader(const uint8_t *data, size_t size) : data_(data), size_(size) {}
    bool empty() const { return pos_ >= size_; }
    size_t remaining() const { return empty() ? 0 : size_ - pos_; }
    uint8_t byte() { return pos_ < size_ ? data_[pos_++] : 0; }
    uint16_t u16() { return static_cast<uint16_t>(byte() | byte() << 8); }
    uint32_t u32() { return u16() | static_cast<uint32_t>(u16()) << 16; }
    // Up to max bytes, the count taken from the next byte.
    std::string bytes(size_t max) {
        size_t n = byte();
        if (n > max) n = max;
        if (n > remaining()) n = remaining();
        std::string s(reinterpret_cast<const char *>(data_ + pos_), n);
        pos_ += n;
        return s;
    }
    // Everything left.
    std::string rest() {
        std::string s(reinterpret_cast<const char *>(data_ + pos_), remaining());
        pos_ = size_;
        return s;
    }

  private:
    const uint8_t *data_;
    size_t size_;
    size_t pos_ = 0;
};

// Bytes with no NUL inside, so they can stand as a C string.
// The process takes the locale named by TEXTCONV_FUZZ_LOCALE (if any) and
// returns the local encoding it then has.
inline CharsetId adopt_fuzz_locale() {
    if (const char *name = std::getenv("TEXTCONV_FUZZ_LOCALE")) {
        setenv("LANG", name, 1);
        setenv("LC_ALL", name, 1);
    }
    return LocalEncoding();
}

inline std::string without_nul(std::string s) {
    for (char &c : s)
        if (c == 0) c = 1;
    return s;
}

// A heap block of exactly room bytes followed by guard bytes: AddressSanitizer
// catches writes far past the block, the guard check catches writes just past
// the room that land in the slack. Filled with a pattern so that reads of
// unwritten bytes show.
class Guarded {
  public:
    static constexpr size_t kGuard = 16;
    static constexpr uint8_t kFill = 0xA5;
    explicit Guarded(size_t room) : room_(room), block_(room + kGuard, static_cast<char>(kFill)) {}
    char *data() { return block_.data(); }
    uint16_t *units() { return reinterpret_cast<uint16_t *>(block_.data()); }
    size_t room() const { return room_; }
    // The guard bytes are as they were: nothing was written past the room.
    bool intact() const {
        for (size_t i = room_; i < block_.size(); ++i)
            if (static_cast<uint8_t>(block_[i]) != kFill) return false;
        return true;
    }
    // The bytes from first to room are untouched.
    bool untouched_from(size_t first) const {
        for (size_t i = first; i < room_; ++i)
            if (static_cast<uint8_t>(block_[i]) != kFill) return false;
        return true;
    }
    std::string bytes(size_t n) const { return std::string(block_.data(), n); }

  private:
    size_t room_;
    std::vector<char> block_;
};

// glibc iconv in one go; nullopt when the pair is missing or the input is
// rejected anywhere (invalid or incomplete).
// Descriptors are kept per pair (reset before each use): opening one per
// call would cost more than the code under test.
inline iconv_t cached_iconv(const char *to, const char *from) {
    struct Entry {
        std::string to, from;
        iconv_t cd;
    };
    static auto *cache = new std::vector<Entry>;  // never destroyed: reachable at exit
    for (const Entry &e : *cache)
        if (e.to == to && e.from == from) return e.cd;
    cache->push_back({to, from, iconv_open(to, from)});
    return cache->back().cd;
}

inline std::optional<std::string> iconv_convert(const char *to, const char *from, const std::string &in) {
    iconv_t cd = cached_iconv(to, from);
    if (cd == reinterpret_cast<iconv_t>(-1)) return std::nullopt;
    iconv(cd, nullptr, nullptr, nullptr, nullptr);
    std::string out(in.size() * 4 + 16, '\0');
    char *ip = const_cast<char *>(in.data());
    char *op = out.data();
    size_t il = in.size(), ol = out.size();
    size_t r = iconv(cd, &ip, &il, &op, &ol);
    if (r != static_cast<size_t>(-1)) r = iconv(cd, nullptr, nullptr, &op, &ol);
    if (r == static_cast<size_t>(-1)) return std::nullopt;
    out.resize(op - out.data());
    return out;
}

// UTF-16 units (host order, little endian here) from and to bytes.
inline std::u16string units_of(const std::string &bytes) {
    std::u16string u(bytes.size() / 2, u'\0');
    std::memcpy(u.data(), bytes.data(), u.size() * 2);
    return u;
}
inline std::string bytes_of(const std::u16string &units) {
    return std::string(reinterpret_cast<const char *>(units.data()), units.size() * 2);
}

// Valid UTF-8 built from the fuzzer's bytes: each step picks a block and a
// character in it, so that mutations move between scripts. No NUL.
inline std::string valid_utf8(Reader &in, size_t maxCharacters) {
    static const uint32_t kBlocks[][2] = {
        {0x20, 0x7E},       {0x25, 0x25},        {0xA0, 0xFF},     {0x100, 0x24F},   {0x370, 0x3FF},
        {0x400, 0x4FF},     {0x590, 0x5FF},      {0x600, 0x6FF},   {0x700, 0x7FF},   {0x3000, 0x30FF},
        {0x4E00, 0x9FFF},   {0xAC00, 0xD7A3},    {0xE000, 0xF8FF}, {0xFB1D, 0xFDFF}, {0xFE70, 0xFFFD},
        {0x10000, 0x1FFFF}, {0x20000, 0x10FFFF}, {0x2000, 0x206F}, {0x30, 0x39},     {0x41, 0x7A},
    };
    constexpr size_t kCount = sizeof kBlocks / sizeof kBlocks[0];
    std::string s;
    for (size_t i = 0; i < maxCharacters && !in.empty(); ++i) {
        const uint32_t *b = kBlocks[in.byte() % kCount];
        uint32_t cp = b[0] + in.u16() % (b[1] - b[0] + 1);
        if (cp >= 0xD800 && cp <= 0xDFFF) cp = 0xFFFD;
        if (cp < 0x80) {
            s += static_cast<char>(cp);
        } else if (cp < 0x800) {
            s += static_cast<char>(0xC0 | cp >> 6);
            s += static_cast<char>(0x80 | (cp & 0x3F));
        } else if (cp < 0x10000) {
            s += static_cast<char>(0xE0 | cp >> 12);
            s += static_cast<char>(0x80 | (cp >> 6 & 0x3F));
            s += static_cast<char>(0x80 | (cp & 0x3F));
        } else {
            s += static_cast<char>(0xF0 | cp >> 18);
            s += static_cast<char>(0x80 | (cp >> 12 & 0x3F));
            s += static_cast<char>(0x80 | (cp >> 6 & 0x3F));
            s += static_cast<char>(0x80 | (cp & 0x3F));
        }
    }
    return s;
}

// Capacity choices that hit the edges: 0, tiny, odd, exact and roomy.
inline uint32_t pick_room(Reader &in, size_t needed) {
    switch (in.byte() % 6) {
        case 0:
            return 0;
        case 1:
            return in.byte() % 8;
        case 2:
            return static_cast<uint32_t>(needed);
        case 3:
            return static_cast<uint32_t>(needed > 0 ? needed - 1 : 0);
        case 4:
            return static_cast<uint32_t>(needed + in.byte() % 8);
        default:
            return in.u16() % 4096;
    }
}

}  // namespace fuzz
