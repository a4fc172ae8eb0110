// Japanese test helpers: a kept glibc converter as oracle, strings ending at
// an unreadable page, corpus pieces.
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
    // One character to one UTF-16 unit (oracle opened to "UTF-16LE").
    std::optional<char16_t> unit(const std::string &in) {
        auto out = (*this)(in);
        char16_t u;
        if (!out || out->size() != 2) return std::nullopt;
        std::memcpy(&u, out->data(), 2);
        return u;
    }

  private:
    iconv_t cd_;
};

// A copy of text whose terminator is the last byte before a PROT_NONE page.
class Guarded {
  public:
    explicit Guarded(const std::string &text) {
        const size_t page = sysconf(_SC_PAGESIZE);
        size_ = (text.size() + page) / page * page + page;
        base_ = static_cast<char *>(
            mmap(nullptr, size_, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0));
        mprotect(base_ + size_ - page, page, PROT_NONE);
        str_ = base_ + size_ - page - text.size() - 1;
        std::memcpy(str_, text.c_str(), text.size() + 1);
    }
    ~Guarded() { munmap(base_, size_); }
    const char *c_str() const { return str_; }

  private:
    char *base_, *str_;
    size_t size_;
};

// The pieces of text between control characters (invalid in Shift-JIS here).
inline std::vector<std::string> split_on_controls(const std::string &text) {
    std::vector<std::string> pieces(1);
    for (unsigned char c : text) {
        if (c >= 0x20 && c != 0x7F)
            pieces.back() += static_cast<char>(c);
        else if (!pieces.back().empty())
            pieces.emplace_back();
    }
    if (pieces.back().empty()) pieces.pop_back();
    return pieces;
}

}  // namespace jptest
