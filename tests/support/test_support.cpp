#include "test_support.h"

#include <dirent.h>
#include <iconv.h>
#include <sys/stat.h>

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <fstream>
#include <random>
#include <sstream>

namespace testsupport {

std::string corpora_dir() {
    const char *env = std::getenv("TEXTCONV_CORPORA");
    std::string dir = env ? env : TEXTCONV_CORPORA_DIR;
    struct stat st {};
    if (stat(dir.c_str(), &st) != 0 || !S_ISDIR(st.st_mode)) return "";
    return dir;
}

std::optional<std::string> read_corpus(const std::string &name) {
    std::string dir = corpora_dir();
    if (dir.empty()) return std::nullopt;
    std::ifstream in(dir + "/" + name, std::ios::binary);
    if (!in) return std::nullopt;
    std::ostringstream ss;
    ss << in.rdbuf();
    return ss.str();
}

std::vector<std::string> corpus_files(const std::string &suffix) {
    std::vector<std::string> names;
    std::string dir = corpora_dir();
    if (dir.empty()) return names;
    if (DIR *d = opendir(dir.c_str())) {
        while (dirent *e = readdir(d)) {
            std::string n = e->d_name;
            if (n.size() > suffix.size() && n.compare(n.size() - suffix.size(), suffix.size(), suffix) == 0)
                names.push_back(n);
        }
        closedir(d);
    }
    std::sort(names.begin(), names.end());
    return names;
}

std::optional<std::string> iconv_convert(const char *to, const char *from, const std::string &in) {
    iconv_t cd = iconv_open(to, from);
    if (cd == reinterpret_cast<iconv_t>(-1)) return std::nullopt;
    std::string out(in.size() * 4 + 16, '\0');
    char *ip = const_cast<char *>(in.data());
    size_t il = in.size();
    char *op = out.data();
    size_t ol = out.size();
    size_t r = iconv(cd, &ip, &il, &op, &ol);
    if (r != static_cast<size_t>(-1)) r = iconv(cd, nullptr, nullptr, &op, &ol);
    iconv_close(cd);
    if (r == static_cast<size_t>(-1)) return std::nullopt;
    out.resize(out.size() - ol);
    return out;
}

std::optional<std::u16string> iconv_to_utf16(const char *from, const std::string &in) {
    auto bytes = iconv_convert("UTF-16LE", from, in);
    if (!bytes) return std::nullopt;
    std::u16string units(bytes->size() / 2, u'\0');
    std::memcpy(units.data(), bytes->data(), units.size() * 2);
    return units;
}

std::optional<std::string> iconv_from_utf16(const char *to, const std::u16string &in) {
    std::string bytes(in.size() * 2, '\0');
    std::memcpy(bytes.data(), in.data(), bytes.size());
    return iconv_convert(to, "UTF-16LE", bytes);
}

std::string random_utf8(uint32_t seed, size_t characters) {
    std::mt19937 rng(seed);
    std::string out;
    for (size_t i = 0; i < characters; ++i) {
        uint32_t cp;
        switch (rng() % 4) {
            case 0: cp = 1 + rng() % 0x7F; break;
            case 1: cp = 0x80 + rng() % (0x800 - 0x80); break;
            case 2:
                do cp = 0x800 + rng() % (0x10000 - 0x800);
                while (cp >= 0xD800 && cp <= 0xDFFF);
                break;
            default: cp = 0x10000 + rng() % (0x110000 - 0x10000); break;
        }
        if (cp < 0x80) {
            out += static_cast<char>(cp);
        } else if (cp < 0x800) {
            out += static_cast<char>(0xC0 | (cp >> 6));
            out += static_cast<char>(0x80 | (cp & 0x3F));
        } else if (cp < 0x10000) {
            out += static_cast<char>(0xE0 | (cp >> 12));
            out += static_cast<char>(0x80 | ((cp >> 6) & 0x3F));
            out += static_cast<char>(0x80 | (cp & 0x3F));
        } else {
            out += static_cast<char>(0xF0 | (cp >> 18));
            out += static_cast<char>(0x80 | ((cp >> 12) & 0x3F));
            out += static_cast<char>(0x80 | ((cp >> 6) & 0x3F));
            out += static_cast<char>(0x80 | (cp & 0x3F));
        }
    }
    return out;
}

std::string hex(const std::string &bytes) {
    std::string s;
    char buf[4];
    for (unsigned char c : bytes) {
        std::snprintf(buf, sizeof buf, "%02X ", c);
        s += buf;
    }
    return s;
}

std::string hex(const std::u16string &units) {
    std::string s;
    char buf[6];
    for (char16_t u : units) {
        std::snprintf(buf, sizeof buf, "%04X ", static_cast<unsigned>(u));
        s += buf;
    }
    return s;
}

}  // namespace testsupport
