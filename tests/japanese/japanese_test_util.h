// Helpers for the Japanese tests: a kept glibc converter as oracle for one
// character at a time, strings that end at an unreadable page, corpus pieces.
#pragma once

#include <iconv.h>
#include <sys/mman.h>
#include <unistd.h>

#include <cstring>
#include <optional>
#include <string>
#include <vector>

namespace jptest {

// glibc iconv, opened once; nullopt when it rejects the input.
class Oracle {
  public:
    Oracle(const char *to, const char *from) : cd_(iconv_open(to, from)) {}
    ~Oracle() { iconv_close(cd_); }
    std::optional<std::string> operator()(const std::string &in) {
        iconv(cd_, nullptr, nullptr, nullptr, nullptr);
        std::string out(in.size() * 4 + 8, '\0');
        char *ip = const_cast<char *>(in.data()), *op = out.data();
        size_t il = in.size(), ol = out.size();
        if (iconv(cd_, &ip, &il, &op, &ol) == static_cast<size_t>(-1)) return std::nullopt;
        out.resize(out.size() - ol);
        return out;
    }
    // One character to one host-order UTF-16 unit (oracle opened to "UTF-16LE").
    std::optional<char16_t> unit(const std::string &in) {
        auto out = (*this)(in);
        if (!out || out->size() != 2) return std::nullopt;
        char16_t u;
        std::memcpy(&u, out->data(), 2);
        return u;
    }

  private:
    iconv_t cd_;
};

// A copy of text and its terminator placed so that the terminator is the last
// readable byte before a PROT_NONE page: reading past it faults.
class Guarded {
  public:
    explicit Guarded(const std::string &text) {
        const size_t page = sysconf(_SC_PAGESIZE);
        size_ = (text.size() + 1 + page - 1) / page * page + page;
        base_ = static_cast<char *>(
            mmap(nullptr, size_, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0));
        mprotect(base_ + size_ - page, page, PROT_NONE);
        str_ = base_ + size_ - page - text.size() - 1;
        std::memcpy(str_, text.c_str(), text.size() + 1);
    }
    ~Guarded() { munmap(base_, size_); }
    const char *c_str() const { return str_; }

  private:
    char *base_;
    char *str_;
    size_t size_;
};

// The pieces of text between control characters (0x00..0x1F, 0x7F), which
// Shift-JIS conversions here treat as invalid.
inline std::vector<std::string> split_on_controls(const std::string &text) {
    std::vector<std::string> pieces(1);
    for (unsigned char c : text) {
        if (c < 0x20 || c == 0x7F) {
            if (!pieces.back().empty()) pieces.emplace_back();
        } else {
            pieces.back() += static_cast<char>(c);
        }
    }
    if (pieces.back().empty()) pieces.pop_back();
    return pieces;
}

inline std::string utf8_of(char16_t u) {
    std::string s;
    if (u < 0x80) {
        s += static_cast<char>(u);
    } else if (u < 0x800) {
        s += static_cast<char>(0xC0 | (u >> 6));
        s += static_cast<char>(0x80 | (u & 0x3F));
    } else {
        s += static_cast<char>(0xE0 | (u >> 12));
        s += static_cast<char>(0x80 | ((u >> 6) & 0x3F));
        s += static_cast<char>(0x80 | (u & 0x3F));
    }
    return s;
}

}  // namespace jptest
