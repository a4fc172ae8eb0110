// textconv list, locale, escape, equal and jis.
#include <langinfo.h>
#include <locale.h>
#include <strings.h>

#include <cctype>
#include <cstdio>
#include <cstdlib>
#include <cstring>

#include "tool.h"

namespace tool {

namespace {

const char *yes_no(bool b) { return b ? "yes" : "no"; }

std::string env_or_unset(const char *name) {
    const char *value = std::getenv(name);
    return value ? std::string("\"") + value + "\"" : "(unset)";
}

std::string describe(CharsetId id) {
    return std::to_string(id) + " " + charset_name(id) + " (" + charset_symbol(id) + ")";
}

}  // namespace

// ---- list ----

int run_list() {
    std::printf("%-3s %-19s %-12s %-5s %-9s %-11s %s\n", "id", "symbol", "iconv name", "bits", "to UTF-16",
                "from UTF-16", "also accepted as");
    for (CharsetId id = 0; id < CHARSET_COUNT; ++id) {
        std::string aliases;
        for (const std::string &alias : charset_aliases(id)) aliases += (aliases.empty() ? "" : ", ") + alias;
        const bool none = id == CHARSET_NONE;
        std::printf("%-3d %-19s %-12s %-5u %-9s %-11s %s\n", id, charset_symbol(id), charset_name(id),
                    charsetConversion[id].availability, none ? "-" : yes_no(platform_decodes(id)),
                    none ? "-" : yes_no(platform_encodes(id)), aliases.c_str());
    }
    std::printf("\nServer code pages (convert -f cpN), read as:\n ");
    for (int32_t cp : server_code_pages())
        std::printf(" %d=%s", cp, charset_name(*server_code_page_charset(cp)));
    std::printf(
        "\n\n\"to UTF-16\" and \"from UTF-16\" tell whether this system's iconv opens the converters the\n"
        "library uses; a charset without them stops 'convert' with exit status 3 (see --continue).\n"
        "\"local\" names the local encoding, here %s. Case, '-', '_' and '.' do not matter in names.\n",
        describe(LocalEncoding()).c_str());
    return kExitDone;
}

// ---- locale ----

int run_locale(bool rewriteUtf8) {
    // The same steps as the library's detection, told one by one; then the
    // library's own answer.
    const char *all = setlocale(LC_ALL, "");
    const char *ctype = setlocale(LC_CTYPE, nullptr);
    const std::string name = ctype ? ctype : "";
    const char *codesetRaw = nl_langinfo(CODESET);
    const std::string codeset = codesetRaw ? codesetRaw : "";

    std::printf("environment:      LANG=%s LC_ALL=%s LC_CTYPE=%s\n", env_or_unset("LANG").c_str(),
                env_or_unset("LC_ALL").c_str(), env_or_unset("LC_CTYPE").c_str());
    std::printf("setlocale:        %s\n", all ? all : "(failed: the C locale stays)");
    std::printf("locale name:      %s (LC_CTYPE)\n", ctype ? ctype : "(none)");
    std::printf("codeset:          %s (nl_langinfo)\n", codesetRaw ? codesetRaw : "(none)");

    CharsetId predicted = 0;
    std::string how;
    if (codesetRaw) {
        predicted = GetiStringID(codesetRaw, charsets);
        std::printf("  'charsets' table, codeset \"%s\": %s\n", codeset.c_str(),
                    predicted ? describe(predicted).c_str() : "no row");
        if (predicted) how = "the codeset \"" + codeset + "\" in the 'charsets' table";
    }
    if (!predicted) {
        std::string lookup = name;
        const char *lang = std::getenv("LANG");
        if (!ctype && lang) lookup = lang;
        if (!ctype && !lang) {
            predicted = CHARSET_LATIN1;
            how = "no locale name and no LANG: the fallback en_US.ISO8859-1";
        } else {
            const char *part = get_charset_from_locale(lookup.c_str());
            if (part) {
                CharsetId id = GetiStringID(part, charsets);
                std::printf("  'charsets' table, \"%s\" after the last '.' of \"%s\": %s\n", part,
                            lookup.c_str(), id ? describe(id).c_str() : "no row");
                if (id)
                    predicted = id, how = "the charset part \"" + std::string(part) + "\" of the locale name";
            }
            if (!predicted) {
                CharsetId id = GetiStringID(lookup.c_str(), locales);
                std::printf("  'locales' table, \"%s\": %s\n", lookup.c_str(),
                            id ? describe(id).c_str() : "no row");
                if (id) predicted = id, how = "the locale name \"" + lookup + "\" in the 'locales' table";
            }
            if (!predicted) {
                char *language = get_language_from_locale(lookup.c_str());
                const std::string lang_name = language ? language : "";
                std::free(language);
                predicted = GetiStringID(lang_name.c_str(), languages);
                std::printf("  'languages' table, \"%s\": %s\n", lang_name.c_str(),
                            describe(predicted).c_str());
                how = "the language \"" + lang_name + "\" (the 'languages' table; its default is Latin-1)";
            }
        }
    }
    if (!how.empty() && ctype && !(codesetRaw && GetiStringID(codesetRaw, charsets)))
        std::printf("  find_charset_from(\"%s\"): %s\n", name.c_str(),
                    describe(find_charset_from(name.c_str())).c_str());
    std::printf("decided by:       %s\n", how.c_str());

    const CharsetId local = rewriteUtf8 ? SetCurrentLocale(1) : LocalEncoding();
    std::printf("local encoding:   %s\n", describe(local).c_str());
    if (local != predicted)
        std::printf("note:             the library decided %d where the steps above give %d\n", local,
                    predicted);
    const bool utf8Name = name.size() > 5 && strcasecmp(name.c_str() + name.size() - 5, ".UTF8") == 0;
    if (rewriteUtf8)
        std::printf("after rewrite:    LANG=%s LC_ALL=%s\n", env_or_unset("LANG").c_str(),
                    env_or_unset("LC_ALL").c_str());
    else if (local == CHARSET_UTF8 && utf8Name)
        std::printf("note:             --utf8-rewrite would make the locale name end in \".UTF-8\"\n");
    return kExitDone;
}

// ---- escape ----

int run_escape(const EscapeOptions &options) {
    const CharsetChoice charset = resolve_charset(options.charset, false);
    if (is_utf16_family(charset.id))
        throw Failure(kExitUsage, "escape reads text in byte charsets; convert UTF-16 text first");
    if (options.haveText == !options.inputFile.empty())
        throw Failure(kExitUsage, "give either TEXT or -i FILE");
    // Without the converters the library copies the text unchanged.
    const bool usable = require_converter(charset_name(charset.id), "UTF-16", platform_decodes(charset.id),
                                          options.policy, open_decoder, charset.id) &&
                        require_converter("UTF-16", charset_name(charset.id), platform_encodes(charset.id),
                                          options.policy, open_encoder, charset.id);

    const std::string text = options.haveText ? options.text : read_file(options.inputFile);
    const size_t nul = text.find('\0');
    if (nul != std::string::npos)
        throw Failure(kExitBadInput, "NUL byte at byte offset " + std::to_string(nul) + " of the input");

    // Each line on its own; a very long line in pieces cut between characters
    // (the library's work area grows with the text).
    constexpr size_t kPiece = 4096;
    std::string out;
    bool failed = false;
    size_t at = 0;
    while (at < text.size() || (at == 0 && text.empty())) {
        size_t end = text.find('\n', at);
        const bool newline = end != std::string::npos;
        if (!newline) end = text.size();
        size_t pos = at;
        do {
            size_t len = end - pos;
            if (len > kPiece) len = cut_point(charset.id, std::string_view(text).substr(pos, kPiece));
            const std::string piece = text.substr(pos, len);
            const uint32_t room = static_cast<uint32_t>(16 * (piece.size() + 4));
            std::string target(room + 1, '\0');
            uint32_t length = room;
            StringFromCharsetToDirectionEscapedString(charset.id, target.data(), piece.c_str(), &length);
            if (length == room || length == 0) {
                failed = true;  // the library copied the text unchanged
                out += piece;
            } else {
                out.append(target.data(), length - 1);
            }
            pos += len;
        } while (pos < end);
        if (newline) out += '\n';
        at = end + (newline ? 1 : 0);
        if (text.empty()) break;
    }
    if (options.haveText) out += '\n';
    std::fwrite(out.data(), 1, out.size(), stdout);
    if (failed && usable)
        throw Failure(kExitBadInput,
                      "some text could not be read as " + charset.label + " and was copied unchanged");
    return kExitDone;
}

// ---- equal ----

namespace {

// The selector StringsEquivalent takes (UTF-8, or the local encoding) and the
// string to hand it: a charset other than those two is read into UTF-8
// through the library first.
std::pair<int32_t, std::string> comparable(const std::string &charsetName, const std::string &text,
                                           const MissingConverterPolicy &policy) {
    const CharsetChoice choice = resolve_charset(charsetName, false);
    if (is_utf16_family(choice.id)) throw Failure(kExitUsage, "equal compares byte strings, not UTF-16");
    if (choice.id == CHARSET_UTF8) return {CHARSET_UTF8, text};
    const CharsetId local = LocalEncoding();
    if (choice.id == local) {
        require_converter(charset_name(local), "UTF-16", platform_decodes(local), policy, open_decoder,
                          local);
        return {local == CHARSET_UTF8 ? CHARSET_NONE : local, text};
    }
    require_converter(charset_name(choice.id), "UTF-16", platform_decodes(choice.id), policy, open_decoder,
                      choice.id);
    auto utf8 = display_utf8(choice.id, text);
    if (!utf8) throw Failure(kExitBadInput, "the text cannot be read as " + choice.label);
    return {CHARSET_UTF8, *utf8};
}

}  // namespace

int run_equal(const EqualOptions &options) {
    auto [firstEncoding, first] = comparable(options.first, options.a, options.policy);
    auto [secondEncoding, second] = comparable(options.second, options.b, options.policy);
    const int same = StringsEquivalent(first.c_str(), firstEncoding, second.c_str(), secondEncoding,
                                       options.ignoreCase ? 1 : 0);
    std::printf("%s\n", same ? "equivalent" : "not equivalent");
    return same ? kExitDone : kExitFailed;
}

// ---- jis ----

namespace {

bool parse_hex(std::string_view digits, std::string &bytes) {
    if (digits.empty() || digits.size() % 2) return false;
    bytes.clear();
    for (size_t i = 0; i < digits.size(); i += 2) {
        char pair[3] = {digits[i], digits[i + 1], 0};
        char *end = nullptr;
        long v = std::strtol(pair, &end, 16);
        if (*end || !std::isxdigit(static_cast<unsigned char>(pair[0]))) return false;
        bytes.push_back(static_cast<char>(v));
    }
    return true;
}

bool parse_row_cell(std::string_view text, uint8_t &row, uint8_t &cell) {
    size_t dash = text.find('-');
    if (dash == std::string_view::npos) return false;
    std::string r(text.substr(0, dash)), c(text.substr(dash + 1));
    if (r.empty() || c.empty() || r.find_first_not_of("0123456789") != std::string::npos ||
        c.find_first_not_of("0123456789") != std::string::npos || r.size() > 3 || c.size() > 3)
        return false;
    int rv = std::atoi(r.c_str()), cv = std::atoi(c.c_str());
    if (rv < 1 || rv > 94 || cv < 1 || cv > 94) return false;
    row = static_cast<uint8_t>(rv);
    cell = static_cast<uint8_t>(cv);
    return true;
}

const char *kind_name(unsigned kind) {
    switch (kind) {
        case MB_KIND_SINGLE:
            return "single byte (half-width katakana or space)";
        case MB_KIND_JISX0208:
            return "JIS X 0208";
        case MB_KIND_JISX0212:
            return "JIS X 0212";
        case MB_KIND_ASCII:
            return "ASCII";
        default:
            return "?";
    }
}

const char *kJisSyntax =
    "CODE is one of:\n"
    "  U+XXXX              a UTF-16 unit\n"
    "  0xHHHH, sjis:HHHH   Shift-JIS bytes\n"
    "  eucjp:HHHH[HH]      EUC-JP bytes\n"
    "  R-C, jis:R-C        JIS X 0208 row and cell, in decimal (13-1)\n"
    "  x0212:R-C           JIS X 0212 row and cell\n"
    "  jis:HHHH            a 7-bit JIS code (2D21)\n"
    "  utf8:HH...          UTF-8 bytes\n"
    "  anything else       the character itself";

}  // namespace

int run_jis(const std::string &code, const MissingConverterPolicy &policy) {
    require_converter("EUC-JP", "UTF-16", platform_decodes_name("EUC-JP"), policy, open_eucjp_decoder, 0);
    require_converter("UTF-16", "EUC-JP", platform_encodes_name("EUC-JP"), policy, open_eucjp_encoder, 0);

    const std::string lower = to_lower(code);
    auto bad = [&](const std::string &why) { return Failure(kExitBadInput, code + ": " + why); };
    auto usage = [&]() { return Failure(kExitUsage, "cannot read '" + code + "'.\n" + kJisSyntax); };
    auto prefixed = [&](const char *prefix) { return lower.rfind(prefix, 0) == 0; };

    uint16_t unit = 0xFFFF;
    std::string given;  // the input bytes, to tell when they do not map back
    std::string givenForm;
    uint8_t row = 0, cell = 0;
    std::string bytes;
    if (prefixed("u+")) {
        char *end = nullptr;
        unsigned long v = std::strtoul(code.c_str() + 2, &end, 16);
        if (*end || code.size() < 3) throw usage();
        if (v > 0xFFFF)
            throw bad("outside the Basic Multilingual Plane: the Japanese functions take one unit");
        unit = static_cast<uint16_t>(v);
    } else if (prefixed("0x") || prefixed("sjis:")) {
        if (!parse_hex(code.substr(prefixed("0x") ? 2 : 5), bytes) || bytes.size() > 2) throw usage();
        given = bytes, givenForm = "Shift-JIS";
        bytes.push_back('\0');
        if (!FromMultiByteToUnicode(MB_KIND_SJIS, reinterpret_cast<const uint8_t *>(bytes.data()), &unit))
            throw bad("not a Shift-JIS character the library can convert");
    } else if (prefixed("eucjp:") || prefixed("euc:")) {
        if (!parse_hex(code.substr(code.find(':') + 1), bytes) || bytes.size() > 3) throw usage();
        given = bytes, givenForm = "EUC-JP";
        const char *cursor = bytes.c_str();
        if (!FromEUCJPToUnicode(&cursor, &unit)) throw bad("not an EUC-JP character the library can convert");
        if (cursor != bytes.c_str() + bytes.size()) throw bad("more bytes than one EUC-JP character");
    } else if (prefixed("x0212:")) {
        if (!parse_row_cell(code.substr(6), row, cell)) throw usage();
        const uint8_t g[2] = {row, cell};
        if (!ConvertFromJISToUnicode(g, &unit, JIS_FORM_X0212))
            throw bad("no character at this JIS X 0212 code");
    } else if (prefixed("utf8:") || prefixed("jis:") || parse_row_cell(code, row, cell)) {
        if (prefixed("utf8:")) {
            if (!parse_hex(code.substr(5), bytes)) throw usage();
        } else if (prefixed("jis:") && !parse_row_cell(code.substr(4), row, cell)) {
            if (!parse_hex(code.substr(4), bytes) || bytes.size() != 2) throw usage();
            row = static_cast<uint8_t>(bytes[0] - 0x20), cell = static_cast<uint8_t>(bytes[1] - 0x20);
            if (row < 1 || row > 94 || cell < 1 || cell > 94)
                throw bad("not a 7-bit JIS code (21..7E twice)");
            bytes.clear();
        }
        if (row) {
            const uint8_t g[2] = {row, cell};
            if (!ConvertFromJISToUnicode(g, &unit, JIS_FORM_X0208))
                throw bad("no character at this JIS X 0208 code");
        }
    } else {
        bytes = code;  // the character itself, as UTF-8
    }
    if (!bytes.empty() && unit == 0xFFFF && !row) {
        const char *cursor = bytes.c_str();
        uint16_t units[2] = {0xFFFF, 0};
        uint32_t written = 0;
        if (!FromUTF8ToUnicode(&cursor, units, &written) || written != 2 ||
            cursor != bytes.c_str() + bytes.size())
            throw bad("give one character of the Basic Multilingual Plane");
        unit = units[0];
    }
    if (unit == 0xFFFF) throw bad("no character");

    // Every form, from the unit.
    char utf8[4];
    char *cursor = utf8;
    FromUnicodeToUTF8(unit, &cursor);
    const std::string utf8Bytes(utf8, cursor - utf8);
    uint8_t kind = 0, length = 0;
    uint8_t jis[2] = {};
    const bool hasJis = FromUnicodeToMultiByte(unit, MB_KIND_ANY, &kind, jis, &length);
    uint8_t sjisKind = 0, sjisLength = 0;
    uint8_t sjis[2] = {};
    const bool hasSjis = FromUnicodeToMultiByte(unit, MB_KIND_SJIS, &sjisKind, sjis, &sjisLength);
    char euc[4] = {};
    char *eucCursor = euc;
    const bool hasEuc = FromUnicodeToEUCJP(unit, &eucCursor);
    const std::string eucBytes(euc, eucCursor - euc);
    const std::string sjisBytes(reinterpret_cast<char *>(sjis), hasSjis ? sjisLength : 0);

    char line[160];
    std::snprintf(line, sizeof line, "U+%04X", unit);
    const bool printable = unit >= 0x20 && unit != 0x7F && !(unit >= 0x80 && unit < 0xA0);
    std::printf("character   %s\n", printable ? utf8Bytes.c_str() : "(a control character)");
    std::printf("UTF-16      %s\n", line);
    std::printf("UTF-8       %s\n", hex_bytes(utf8Bytes).c_str());
    if (hasJis) {
        std::printf("kind        %u %s\n", kind, kind_name(kind));
        if (kind == MB_KIND_JISX0208 || kind == MB_KIND_JISX0212)
            std::printf("JIS         row %u, cell %u (%s%u-%u), 7-bit JIS %02X%02X%s\n", jis[0], jis[1],
                        kind == MB_KIND_JISX0212 ? "x0212:" : "", jis[0], jis[1], jis[0] + 0x20,
                        jis[1] + 0x20,
                        kind == MB_KIND_JISX0208 && jis[0] == 13 ? ", row 13: NEC special characters" : "");
        else
            std::printf("JIS         single byte %02X\n", jis[0]);
    } else {
        std::printf("kind        none: no Japanese form\n");
    }
    std::printf("Shift-JIS   %s\n", hasSjis ? hex_bytes(sjisBytes).c_str() : "none");
    std::printf("EUC-JP      %s\n", hasEuc ? hex_bytes(eucBytes).c_str() : "none");
    if (givenForm == "Shift-JIS" && hasSjis && sjisBytes != given)
        std::printf("note        the Shift-JIS bytes given (%s) come back as %s\n", hex_bytes(given).c_str(),
                    hex_bytes(sjisBytes).c_str());
    if (givenForm == "EUC-JP" && hasEuc && eucBytes != given)
        std::printf("note        the EUC-JP bytes given (%s) come back as %s\n", hex_bytes(given).c_str(),
                    hex_bytes(eucBytes).c_str());
    return hasJis || hasEuc ? kExitDone : kExitBadInput;
}

const char *jis_syntax() { return kJisSyntax; }

}  // namespace tool
