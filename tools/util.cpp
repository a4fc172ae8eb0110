// Small helpers of the tool: files, hex, display conversions.
#include <cerrno>
#include <cstdio>
#include <cstring>

#include "tool.h"

namespace tool {

std::string read_file(const std::string &path) {
    std::FILE *file = path == "-" ? stdin : std::fopen(path.c_str(), "rb");
    if (!file) throw Failure(kExitBadInput, "cannot open " + path + ": " + std::strerror(errno));
    std::string data;
    char buffer[65536];
    size_t got;
    while ((got = std::fread(buffer, 1, sizeof buffer, file)) > 0) data.append(buffer, got);
    bool failed = std::ferror(file);
    int error = errno;
    if (file != stdin) std::fclose(file);
    if (failed) throw Failure(kExitBadInput, "cannot read " + path + ": " + std::strerror(error));
    return data;
}

std::string hex_bytes(std::string_view bytes) {
    std::string out;
    char cell[4];
    for (unsigned char b : bytes) {
        std::snprintf(cell, sizeof cell, "%02X", b);
        if (!out.empty()) out += ' ';
        out += cell;
    }
    return out;
}

std::string to_lower(std::string_view s) {
    std::string out(s);
    for (char &c : out)
        if (c >= 'A' && c <= 'Z') c = static_cast<char>(c - 'A' + 'a');
    return out;
}

size_t count_occurrences(std::string_view hay, std::string_view needle) {
    if (needle.empty()) return 0;
    size_t count = 0;
    for (size_t at = hay.find(needle); at != std::string_view::npos;
         at = hay.find(needle, at + needle.size()))
        ++count;
    return count;
}

std::string utf16_to_utf8(const std::u16string &units) {
    std::u16string source = units;
    source.push_back(0);
    std::string out(3 * units.size() + 4, '\0');
    uint32_t length = static_cast<uint32_t>(out.size());
    if (!StringFromUnicodeToUTF8(reinterpret_cast<const uint16_t *>(source.c_str()), out.data(), &length) ||
        length == 0)
        return {};
    out.resize(length - 1);
    return out;
}

std::u16string utf8_to_utf16(std::string_view text) {
    std::string source(text);
    std::u16string out(text.size() + 2, u'\0');
    uint32_t length = static_cast<uint32_t>(out.size() * 2);
    if (!StringFromUTF8ToUnicode(source.c_str(), reinterpret_cast<uint16_t *>(out.data()), &length) ||
        length < 2)
        return {};
    out.resize(length / 2 - 1);
    return out;
}

std::optional<std::string> display_utf8(CharsetId id, std::string_view text) {
    if (id == CHARSET_UTF8) return std::string(text);
    std::string source(text);
    source.append(2, '\0');
    std::u16string units(text.size() + 8, u'\0');
    const char *from = source.c_str();
    uint16_t *to = reinterpret_cast<uint16_t *>(units.data());
    uint32_t length = static_cast<uint32_t>(units.size() * 2);
    if (!StringFromCharsetToUnicode(id, &from, &to, &length) || length < 2) return std::nullopt;
    units.resize(length / 2 - 1);
    return utf16_to_utf8(units);
}

std::optional<std::string> from_utf8(CharsetId id, std::string_view utf8) {
    if (id == CHARSET_UTF8) return std::string(utf8);
    std::u16string units = utf8_to_utf16(utf8);
    if (units.empty() && !utf8.empty()) return std::nullopt;
    units.push_back(0);
    std::string out(4 * units.size() + 8, '\0');
    const uint16_t *from = reinterpret_cast<const uint16_t *>(units.c_str());
    char *to = out.data();
    uint32_t length = static_cast<uint32_t>(out.size());
    if (!StringFromUnicodeToCharset(id, &from, &to, &length) || length == 0) return std::nullopt;
    out.resize(length - (is_utf16_family(id) ? 2 : 1));
    return out;
}

}  // namespace tool
