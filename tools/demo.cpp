// textconv demo: a short tour of the library over the bundled samples.
#include <sys/stat.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <cstring>

#include "tool.h"

#ifndef TEXTCONV_SAMPLES_DIR
#define TEXTCONV_SAMPLES_DIR ""
#endif
#ifndef TEXTCONV_INSTALLED_SAMPLES
#define TEXTCONV_INSTALLED_SAMPLES "share/textconv/samples"
#endif

namespace tool {

namespace {

bool has_samples(const std::string &dir) {
    struct stat info {};
    return !dir.empty() && stat((dir + "/japanese.sjis.txt").c_str(), &info) == 0;
}

std::string executable_dir() {
    char path[4096];
    ssize_t n = readlink("/proc/self/exe", path, sizeof path - 1);
    if (n <= 0) return {};
    path[n] = 0;
    std::string dir(path);
    return dir.substr(0, dir.rfind('/'));
}

// The samples: the given folder, $TEXTCONV_SAMPLES, the source tree the tool
// was built from, then beside the executable or in the installed share folder.
std::string find_samples(const std::string &given) {
    if (!given.empty()) {
        if (!has_samples(given)) throw Failure(kExitBadInput, "no samples in " + given);
        return given;
    }
    std::vector<std::string> candidates;
    if (const char *env = std::getenv("TEXTCONV_SAMPLES")) candidates.emplace_back(env);
    candidates.emplace_back(TEXTCONV_SAMPLES_DIR);
    const std::string exe = executable_dir();
    if (!exe.empty()) {
        candidates.push_back(exe + "/samples");
        candidates.push_back(exe + "/../" TEXTCONV_INSTALLED_SAMPLES);
    }
    for (const std::string &dir : candidates)
        if (has_samples(dir)) return dir;
    throw Failure(kExitBadInput, "the sample texts are missing (looked in $TEXTCONV_SAMPLES, " +
                                     std::string(TEXTCONV_SAMPLES_DIR) + " and beside the executable)");
}

class Tour {
  public:
    explicit Tour(std::string dir) : dir_(std::move(dir)) {}

    std::string sample(const char *name) { return read_file(dir_ + "/" + name); }

    void section(const char *title, const char *how) { std::printf("\n== %s\n   (%s)\n", title, how); }
    void show(const std::string &label, const std::string &text) {
        size_t end = text.size();
        while (end > 0 && text[end - 1] == '\n') --end;
        // Continuation lines line up under the first one.
        std::string shown;
        for (size_t i = 0; i < end; ++i) {
            shown += text[i];
            if (text[i] == '\n') shown += pad(label);
        }
        std::printf("   %s%s\n", label.c_str(), shown.c_str());
    }
    void failed(const char *what) {
        std::printf("   FAILED: %s\n", what);
        ok_ = false;
    }
    bool ok() const { return ok_; }

  private:
    static std::string pad(const std::string &label) { return "   " + std::string(label.size(), ' '); }
    std::string dir_;
    bool ok_ = true;
};

// Shift-JIS lines to UTF-8 with the transcoder, which takes no line ends.
std::optional<std::string> sjis_lines_to_utf8(const std::string &sjis) {
    std::string out;
    size_t at = 0;
    while (at < sjis.size()) {
        size_t end = sjis.find('\n', at);
        if (end == std::string::npos) end = sjis.size();
        const std::string line = sjis.substr(at, end - at);
        std::string buffer(3 * line.size() + 1, '\0');
        uint32_t length = 0;
        if (!StringFromSJISToUTF8(line.c_str(), buffer.data(), &length) || length == 0) return std::nullopt;
        out.append(buffer.data(), length - 1);
        out += '\n';
        at = end + 1;
    }
    return out;
}

}  // namespace

int run_demo(const std::string &samplesDir, const MissingConverterPolicy &policy) {
    Tour tour(find_samples(samplesDir));
    std::printf("textconv: a tour of the library over its sample texts (output in UTF-8)\n");

    tour.section("Shift-JIS to UTF-8",
                 "StringFromSJISToUTF8, line by line: Japanese transcoders take no controls");
    const std::string sjis = tour.sample("japanese.sjis.txt");
    tour.show("bytes: ", hex_bytes(sjis.substr(0, 12)) + " ...");
    if (auto utf8 = sjis_lines_to_utf8(sjis))
        tour.show("text:  ", *utf8);
    else
        tour.failed("StringFromSJISToUTF8 returned 0");

    tour.section("EUC-JP to Shift-JIS", "StringFromEUCJPToSJIS");
    const std::string euc = tour.sample("japanese.eucjp.txt");
    {
        std::string buffer(euc.size() + 1, '\0');
        int32_t length = static_cast<int32_t>(euc.size());
        const int clean = StringFromEUCJPToSJIS(euc.c_str(), buffer.data(), &length);
        const bool same = length > 0 && std::string(buffer.data(), length - 1) == sjis;
        tour.show("", std::to_string(euc.size()) + " EUC-JP bytes became " + std::to_string(length - 1) +
                          " Shift-JIS bytes, " + (same ? "identical to" : "DIFFERENT from") +
                          " the Shift-JIS sample" + (clean ? "" : " (with substitutes)"));
        if (!same) tour.failed("the result differs from the Shift-JIS sample");
    }

    tour.section("KOI8-R to UTF-8", "FromKOI8RtoUTF8, byte by byte, from the library's own table");
    {
        const std::string koi8r = tour.sample("russian.koi8r.txt");
        std::string out;
        char bytes[4];
        for (char c : koi8r) {
            uint8_t count = 0;
            FromKOI8RtoUTF8(&c, bytes, &count);
            out.append(bytes, count <= 3 ? count : 0);
        }
        tour.show("text:  ", out);
        if (out.size() <= koi8r.size()) tour.failed("FromKOI8RtoUTF8 wrote nothing");
    }

    tour.section("Direction escapes", "StringFromCharsetToDirectionEscapedString on ISO-8859-8 Hebrew");
    {
        const std::string hebrew = tour.sample("hebrew.iso8859-8.txt");
        const std::string line = hebrew.substr(0, hebrew.find('\n'));
        const uint32_t room = static_cast<uint32_t>(16 * (line.size() + 4));
        std::string target(room + 1, '\0');
        uint32_t length = room;
        StringFromCharsetToDirectionEscapedString(CHARSET_ISO8859_8, target.data(), line.c_str(), &length);
        auto shownIn = display_utf8(CHARSET_ISO8859_8, line);
        auto shownOut = length != room && length
                            ? display_utf8(CHARSET_ISO8859_8, target.substr(0, length - 1))
                            : std::nullopt;
        if (shownIn) tour.show("text:    ", *shownIn);
        if (shownOut)
            tour.show("escaped: ", *shownOut);
        else
            tour.failed("the text came back unescaped");
    }

    tour.section("A server string in code page 1256", "StringFromServerCPToCharset to UTF-8");
    {
        const std::string server = tour.sample("server.cp1256.txt");
        std::string target(4 * server.size() + 16, '\0');
        uint32_t length = static_cast<uint32_t>(target.size());
        StringFromServerCPToCharset(CHARSET_UTF8, 1256, server.c_str(), target.data(), &length);
        tour.show("bytes: ", hex_bytes(server.substr(0, 10)) + " ...");
        if (length > server.size() + 1 && length < target.size())
            tour.show("text:  ", target.substr(0, length - 1));
        else
            tour.failed("the server string was not converted");
    }

    tour.section("Row 13, the NEC special characters", "StringFromSJISToUTF8 and ConvertFromJISToUnicode");
    {
        const std::string row13 = tour.sample("row13.sjis.txt");
        tour.show("bytes: ", hex_bytes(row13.substr(0, row13.find('\n'))));
        if (auto utf8 = sjis_lines_to_utf8(row13))
            tour.show("text:  ", *utf8);
        else
            tour.failed("StringFromSJISToUTF8 returned 0");
        const uint8_t given[2] = {13, 1};
        uint16_t unit = 0;
        uint8_t sjisCode[2] = {}, kind = 0, length = 0;
        char euc[4] = {};
        char *cursor = euc;
        if (ConvertFromJISToUnicode(given, &unit, JIS_FORM_X0208) &&
            FromUnicodeToMultiByte(unit, MB_KIND_SJIS, &kind, sjisCode, &length) &&
            FromUnicodeToEUCJP(unit, &cursor)) {
            char line[128];
            std::snprintf(line, sizeof line, "row 13 cell 1 = U+%04X = Shift-JIS %02X %02X = EUC-JP %s", unit,
                          sjisCode[0], sjisCode[1], hex_bytes(std::string(euc, cursor - euc)).c_str());
            tour.show("", line);
        } else {
            tour.failed("row 13 cell 1 did not convert");
        }
    }

    tour.section("The local encoding", "LocalEncoding, from the process locale and the library's tables");
    const CharsetId local = LocalEncoding();
    tour.show("", std::to_string(local) + " " + charset_name(local) + " (run 'textconv locale' for how)");

    tour.section("Comparing across encodings", "StringsEquivalent");
    {
        const std::string cafeUtf8 = "Caf\xC3\xA9";
        const auto cafeLocal = local > CHARSET_NONE && local < CHARSET_COUNT && !is_utf16_family(local)
                                   ? from_utf8(local, cafeUtf8)
                                   : std::nullopt;
        const int plain = StringsEquivalent("abc", CHARSET_UTF8, "ABC", CHARSET_UTF8, 0);
        const int folded = StringsEquivalent("abc", CHARSET_UTF8, "ABC", CHARSET_UTF8, 1);
        tour.show("", std::string("\"abc\" and \"ABC\" in UTF-8: ") + (plain ? "equal" : "different") +
                          "; ignoring case: " + (folded ? "equal" : "different"));
        if (plain || !folded) tour.failed("unexpected comparison result");
        if (cafeLocal && *cafeLocal != "Caf?") {
            require_converter(charset_name(local), "UTF-16", platform_decodes(local), policy, open_decoder,
                              local);
            const int cross = StringsEquivalent(cafeUtf8.c_str(), CHARSET_UTF8, cafeLocal->c_str(),
                                                local == CHARSET_UTF8 ? CHARSET_NONE : local, 0);
            tour.show("", "\"Caf\xC3\xA9\" in UTF-8 (" + hex_bytes(cafeUtf8) +
                              ") and in the local encoding (" + hex_bytes(*cafeLocal) +
                              "): " + (cross ? "equal" : "different"));
            if (!cross) tour.failed("the same word in two encodings compared different");
        }
    }

    tour.section("UTF-8 and UTF-16", "StringFromUTF8ToUnicode and StringFromUnicodeToUTF8");
    {
        const std::string text = "Tokyo \xE6\x9D\xB1\xE4\xBA\xAC \xF0\x9F\x97\xBC";
        const std::u16string units = utf8_to_utf16(text);
        const std::string back = utf16_to_utf8(units);
        tour.show("", "\"" + text + "\": " + std::to_string(text.size()) + " UTF-8 bytes, " +
                          std::to_string(units.size()) + " UTF-16 units (a surrogate pair for the last), " +
                          (back == text ? "back unchanged" : "NOT back unchanged"));
        if (back != text) tour.failed("the round trip changed the text");
    }

    std::printf(
        "\nMore: textconv --help, textconv list, textconv jis 13-1,\n"
        "      textconv convert -f sjis -t utf8 FILE\n");
    return tour.ok() ? kExitDone : kExitFailed;
}

}  // namespace tool
