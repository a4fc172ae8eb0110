// Shared pieces of the textconv command-line tool.
#pragma once

#include <cstdint>
#include <cstdio>
#include <optional>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

#include "textconv.h"

namespace tool {

// Exit statuses, documented in --help and the man page.
enum Exit : int {
    kExitDone = 0,              // done (equal: the strings are equivalent)
    kExitFailed = 1,            // substitutions under --strict, or not equivalent
    kExitUsage = 2,             // bad command line, unknown charset name
    kExitMissingConverter = 3,  // this system has no converter that the request needs
    kExitBadInput = 4,          // unreadable file, NUL byte, invalid code or text
};

// Thrown by the commands; main prints the message and exits with the code.
struct Failure : std::runtime_error {
    Failure(int exitCode, const std::string &message) : std::runtime_error(message), code(exitCode) {}
    int code;
};

// ---- charset names (charsets.cpp) ----

// What -f/-t name: a registered charset, or (source only) a server code page.
struct CharsetChoice {
    CharsetId id = CHARSET_NONE;
    int32_t codePage = 0;  // nonzero: text in this Windows code page, read through id
    std::string label;     // for messages
};

// Resolves a user's charset name: an iconv name, an alias, an id, "local",
// and with allowCodePage also "cp<N>" for a server code page. Throws
// Failure(kExitUsage) naming the unknown name.
CharsetChoice resolve_charset(std::string_view name, bool allowCodePage);
// The registered charset for a name, without "local" or code pages.
std::optional<CharsetId> lookup_charset(std::string_view name);
// CHARSET_... name of an id; registry name; the tool's aliases.
const char *charset_symbol(CharsetId id);
const char *charset_name(CharsetId id);
std::vector<std::string> charset_aliases(CharsetId id);
// The CharsetId that the library reads a server code page as, or nullopt.
std::optional<CharsetId> server_code_page_charset(int32_t codePage);
// The code pages the library knows, in order.
const std::vector<int32_t> &server_code_pages();
// True for the ids whose text is 16-bit units.
inline bool is_utf16_family(CharsetId id) {
    return id == CHARSET_UTF16 || id == CHARSET_UTF16LE || id == CHARSET_UTF16BE;
}

// ---- converters of the platform (charsets.cpp) ----

// Whether this platform's iconv opens the converters the library uses for a
// charset: towards the library's UTF-16 and out of it.
bool platform_decodes(CharsetId id);
bool platform_encodes(CharsetId id);
bool platform_decodes_name(const char *name);
bool platform_encodes_name(const char *name);

// How a missing converter is met (see main.cpp).
struct MissingConverterPolicy {
    bool interactive = false;  // the reference host will ask on the terminal
    bool keepGoing = false;    // --continue: go on with substitutes
};

// Makes sure the converter from `from` to `to` can be used. Returns true when
// the platform has it. When it does not: asks through the library (the host's
// prompt) when interactive, and returns false when the user goes on; without
// a terminal returns false under --continue and otherwise throws
// Failure(kExitMissingConverter). `open` makes the library open the converter.
bool require_converter(const std::string &from, const std::string &to, bool available,
                       const MissingConverterPolicy &policy, void (*open)(CharsetId), CharsetId id);

// Library calls that open a converter cell (and so may ask the user).
void open_decoder(CharsetId id);
void open_encoder(CharsetId id);
void open_eucjp_decoder(CharsetId);
void open_eucjp_encoder(CharsetId);

// While on, an exit() from inside the library (it ends the process when the
// user declines to go on without a converter) becomes exit status 3 with a
// message. main turns it on for the whole command and off before returning.
void watch_library_exit(bool on);

// Where to end a piece of text in charset id that must be cut: after its last
// line end, or else after its last whole character (convert.cpp).
size_t cut_point(CharsetId id, std::string_view data);

// ---- small helpers (util.cpp) ----

std::string read_file(const std::string &path);  // throws Failure(kExitBadInput)
std::string hex_bytes(std::string_view bytes);   // "87 40"
std::string to_lower(std::string_view s);
// Occurrences of needle in hay (0 for an empty needle).
size_t count_occurrences(std::string_view hay, std::string_view needle);
// The library's UTF-16 text (host order) from and to UTF-8, for display.
std::string utf16_to_utf8(const std::u16string &units);
std::u16string utf8_to_utf16(std::string_view text);
// Text in charset `id` to UTF-8 for display through the library; nullopt when
// the library cannot convert it.
std::optional<std::string> display_utf8(CharsetId id, std::string_view text);
// UTF-8 text to charset `id` through the library; nullopt on failure.
std::optional<std::string> from_utf8(CharsetId id, std::string_view utf8);

// ---- commands ----

struct ConvertOptions {
    std::string from = "utf8";
    std::string to = "utf8";
    std::string output;               // empty: stdout
    std::vector<std::string> inputs;  // empty: stdin
    bool strict = false;
    bool quiet = false;
    int progress = -1;  // -1 automatic, 0 off, 1 on
    size_t chunkSize = 64 * 1024;
    MissingConverterPolicy policy;
};
int run_convert(const ConvertOptions &options);

int run_list();
int run_locale(bool rewriteUtf8);

struct EscapeOptions {
    std::string charset = "utf8";
    std::string text;
    std::string inputFile;
    bool haveText = false;
    MissingConverterPolicy policy;
};
int run_escape(const EscapeOptions &options);

struct EqualOptions {
    bool ignoreCase = false;
    std::string first = "utf8";
    std::string second = "utf8";
    std::string a, b;
    MissingConverterPolicy policy;
};
int run_equal(const EqualOptions &options);

int run_jis(const std::string &code, const MissingConverterPolicy &policy);
const char *jis_syntax();
int run_demo(const std::string &samplesDir, const MissingConverterPolicy &policy);

}  // namespace tool
