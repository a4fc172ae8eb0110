// Charset names as users type them, and the platform's converters.
#include <iconv.h>
#include <stdlib.h>
#include <unistd.h>

#include <array>
#include <cstdio>
#include <cstring>

#include "tool.h"

namespace tool {

namespace {

struct CharsetNames {
    const char *symbol;
    std::vector<const char *> aliases;  // besides the registry name and the table names
};

// Indexed by CharsetId. Aliases are matched after normalising (see below).
const std::array<CharsetNames, CHARSET_COUNT> kNames = {{
    {"CHARSET_NONE", {}},
    {"CHARSET_LATIN1", {"latin1", "iso8859-1", "l1"}},
    {"CHARSET_EUCJP", {"eucjp", "ujis"}},
    {"CHARSET_SJIS", {"sjis", "shift_jis"}},
    {"CHARSET_UTF8", {"utf8"}},
    {"CHARSET_UTF16", {"utf16"}},
    {"CHARSET_UTF16LE", {"utf-16le"}},
    {"CHARSET_UTF16BE", {"utf-16be"}},
    {"CHARSET_KOI8R", {"koi8r"}},
    {"CHARSET_GB18030", {}},
    {"CHARSET_GB2312", {"euc-cn"}},
    {"CHARSET_GBK", {"cp936"}},
    {"CHARSET_BIG5", {}},
    {"CHARSET_BIG5HKSCS", {"big5-hkscs"}},
    {"CHARSET_ISO8859_11", {"iso8859-11", "tis620", "thai"}},
    {"CHARSET_ISO8859_6", {"iso8859-6", "arabic"}},
    {"CHARSET_ISO8859_8", {"iso8859-8", "hebrew"}},
    {"CHARSET_ISO8859_2", {"iso8859-2", "latin2"}},
    {"CHARSET_ISO8859_15", {"iso8859-15", "latin9"}},
    {"CHARSET_EUCKR", {"euckr"}},
    {"CHARSET_CP1250", {"windows-1250"}},
    {"CHARSET_CP1251", {"windows-1251"}},
    {"CHARSET_CP1256", {"windows-1256"}},
}};

// Case, '-', '_' and '.' do not matter: "UTF-16LE", "utf16le" and "UTF16-LE"
// name the same charset.
std::string normalise(std::string_view name) {
    std::string out;
    for (char c : name) {
        if (c == '-' || c == '_' || c == '.') continue;
        out.push_back(static_cast<char>(c >= 'A' && c <= 'Z' ? c - 'A' + 'a' : c));
    }
    return out;
}

struct CodePage {
    int32_t number;
    CharsetId id;
};
// How the library reads each server code page it knows.
const std::array<CodePage, 10> kCodePages = {{{874, CHARSET_ISO8859_11},
                                              {932, CHARSET_SJIS},
                                              {936, CHARSET_GBK},
                                              {949, CHARSET_EUCKR},
                                              {950, CHARSET_BIG5},
                                              {1250, CHARSET_CP1250},
                                              {1251, CHARSET_CP1251},
                                              {1252, CHARSET_LATIN1},
                                              {1255, CHARSET_ISO8859_8},
                                              {1256, CHARSET_CP1256}}};

bool probe(const char *to, const char *from) {
    iconv_t cd = iconv_open(to, from);
    if (cd == reinterpret_cast<iconv_t>(-1)) return false;
    iconv_close(cd);
    return true;
}

// The library's UTF-16 as the source of a converter: host-order units.
constexpr const char *kHostOrderUnicode =
#if __BYTE_ORDER__ == __ORDER_BIG_ENDIAN__
    "UTF-16BE";
#else
    "UTF-16LE";
#endif

// Set while the library may end the process because the user declined to go
// on without a converter; the exit handler then reports exit status 3.
std::string g_declineMessage;
bool g_declineWatch = false;

void on_exit_during_prompt() {
    if (!g_declineWatch) return;
    std::fflush(stdout);
    std::fprintf(stderr, "textconv: error: %s\n",
                 g_declineMessage.empty() ? "stopped: a converter is missing and the user declined to go on"
                                          : g_declineMessage.c_str());
    _exit(kExitMissingConverter);
}

}  // namespace

std::optional<CharsetId> lookup_charset(std::string_view name) {
    const std::string key = normalise(name);
    if (key.empty()) return std::nullopt;
    for (CharsetId id = 1; id < CHARSET_COUNT; ++id) {
        if (normalise(charsetConversion[id].iconvName ? charsetConversion[id].iconvName : "") == key)
            return id;
        for (const char *alias : kNames[id].aliases)
            if (normalise(alias) == key) return id;
    }
    // The platform's codeset names that the library's locale table knows.
    for (const StringIDEntry *row = charsets; row->name; ++row)
        if (normalise(row->name) == key && row->id > 0 && row->id < CHARSET_COUNT) return row->id;
    return std::nullopt;
}

CharsetChoice resolve_charset(std::string_view name, bool allowCodePage) {
    CharsetChoice choice;
    choice.label = std::string(name);
    if (normalise(name) == "local") {
        choice.id = LocalEncoding();
        choice.label = "local (" + std::string(charset_name(choice.id)) + ")";
        if (choice.id <= CHARSET_NONE || choice.id >= CHARSET_COUNT)
            throw Failure(kExitUsage, "the local encoding is not a registered charset");
        return choice;
    }
    if (auto id = lookup_charset(name)) {
        choice.id = *id;
        return choice;
    }
    const std::string key = normalise(name);
    bool digits = !key.empty() && key.find_first_not_of("0123456789") == std::string::npos;
    if (digits && key.size() <= 3) {
        int id = std::atoi(key.c_str());
        if (id > CHARSET_NONE && id < CHARSET_COUNT) {
            choice.id = id;
            return choice;
        }
        throw Failure(kExitUsage, "no charset has the id " + key + " (ids are 1 to 22; see 'textconv list')");
    }
    if (key.size() > 2 && key.compare(0, 2, "cp") == 0 &&
        key.find_first_not_of("0123456789", 2) == std::string::npos && key.size() <= 8) {
        int32_t number = std::atoi(key.c_str() + 2);
        if (!allowCodePage)
            throw Failure(kExitUsage, "'" + std::string(name) +
                                          "' is a server code page: it can only be a source (-f); "
                                          "see 'textconv list'");
        auto id = server_code_page_charset(number);
        if (!id)
            throw Failure(kExitUsage, "the library does not know the server code page " +
                                          std::to_string(number) + " (see 'textconv list')");
        choice.id = *id;
        choice.codePage = number;
        return choice;
    }
    throw Failure(kExitUsage, "unknown charset '" + std::string(name) + "' (see 'textconv list')");
}

const char *charset_symbol(CharsetId id) { return id >= 0 && id < CHARSET_COUNT ? kNames[id].symbol : "?"; }

const char *charset_name(CharsetId id) {
    if (id < 0 || id >= CHARSET_COUNT || !charsetConversion[id].iconvName) return "(none)";
    return charsetConversion[id].iconvName;
}

std::vector<std::string> charset_aliases(CharsetId id) {
    std::vector<std::string> out;
    if (id <= CHARSET_NONE || id >= CHARSET_COUNT) return out;
    std::vector<std::string> seen{normalise(charset_name(id))};
    // The platform codeset names the library's table knows, unless they only
    // differ from a name above in case or punctuation.
    auto add = [&](const char *alias) {
        const std::string key = normalise(alias);
        for (const std::string &s : seen)
            if (s == key) return;
        seen.push_back(key);
        out.emplace_back(alias);
    };
    for (const char *alias : kNames[id].aliases) {
        seen.push_back(normalise(alias));
        out.emplace_back(alias);
    }
    for (const StringIDEntry *row = charsets; row->name; ++row)
        if (row->id == id) add(row->name);
    return out;
}

std::optional<CharsetId> server_code_page_charset(int32_t codePage) {
    for (const CodePage &cp : kCodePages)
        if (cp.number == codePage) return cp.id;
    return std::nullopt;
}

const std::vector<int32_t> &server_code_pages() {
    static const std::vector<int32_t> numbers = [] {
        std::vector<int32_t> v;
        for (const CodePage &cp : kCodePages) v.push_back(cp.number);
        return v;
    }();
    return numbers;
}

bool platform_decodes_name(const char *name) { return name && probe("UTF-16", name); }
bool platform_encodes_name(const char *name) { return name && probe(name, kHostOrderUnicode); }
bool platform_decodes(CharsetId id) { return id > CHARSET_NONE && platform_decodes_name(charset_name(id)); }
bool platform_encodes(CharsetId id) { return id > CHARSET_NONE && platform_encodes_name(charset_name(id)); }

void open_decoder(CharsetId id) {
    static const uint16_t empty[2] = {0, 0};
    const char *source = reinterpret_cast<const char *>(empty);
    uint16_t buffer[8];
    uint16_t *target = buffer;
    uint32_t length = sizeof buffer;
    StringFromCharsetToUnicode(id, &source, &target, &length);
}

void open_encoder(CharsetId id) {
    static const uint16_t empty[1] = {0};
    const uint16_t *source = empty;
    char buffer[16];
    char *target = buffer;
    uint32_t length = sizeof buffer;
    StringFromUnicodeToCharset(id, &source, &target, &length);
}

void open_eucjp_decoder(CharsetId) {
    const uint8_t given[2] = {1, 0};
    uint16_t unit = 0;
    ConvertFromJISToUnicode(given, &unit, JIS_FORM_ASCII);
}

void open_eucjp_encoder(CharsetId) {
    char euc[4] = {};
    ConvertFromUnicodeToEUCJP(0x41, euc);
}

void watch_library_exit(bool on) {
    static bool installed = false;
    if (!installed) std::atexit(on_exit_during_prompt);
    installed = true;
    g_declineWatch = on;
}

bool require_converter(const std::string &from, const std::string &to, bool available,
                       const MissingConverterPolicy &policy, void (*open)(CharsetId), CharsetId id) {
    if (available) return true;
    const std::string what = "this system has no converter from " + from + " to " + to;
    if (policy.interactive) {
        // The reference host asks on the terminal; a "no" ends the process
        // inside the library, which the exit handler reports.
        g_declineMessage = what + "; stopped as asked";
        open(id);
        g_declineMessage.clear();
        std::fprintf(stderr, "textconv: warning: %s; going on with substitutes\n", what.c_str());
        return false;
    }
    if (!policy.keepGoing)
        throw Failure(kExitMissingConverter, what + " (use --continue to go on with substitutes)");
    std::fprintf(stderr, "textconv: warning: %s; going on with substitutes (--continue)\n", what.c_str());
    return false;
}

}  // namespace tool
