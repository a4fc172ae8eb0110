// textconv convert: streams text from one charset to another through the
// library, in bounded chunks cut at line ends.
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <chrono>
#include <cstdio>
#include <cstring>

#include "tool.h"

namespace tool {

namespace {

constexpr std::string_view kReplacementUtf8 = "\xEF\xBF\xBD";  // U+FFFD
constexpr std::string_view kNoCharacterUtf8 = "\xEF\xBF\xBF";  // U+FFFF

// Bytes of the character that starts at p (at most avail are there), judged
// by its lead byte. Only used to find a safe place to cut an over-long line.
size_t char_length(CharsetId id, const unsigned char *p, size_t avail) {
    const unsigned b = p[0];
    switch (id) {
        case CHARSET_UTF8:
            return b < 0xC0 ? 1 : b < 0xE0 ? 2 : b < 0xF0 ? 3 : b < 0xF8 ? 4 : b < 0xFC ? 5 : 6;
        case CHARSET_UTF16:
        case CHARSET_UTF16LE:
        case CHARSET_UTF16BE: {
            if (avail < 2) return 2;
            const unsigned high = id == CHARSET_UTF16BE ? p[0] : p[1];
            return high >= 0xD8 && high <= 0xDB ? 4 : 2;
        }
        case CHARSET_SJIS:
            return (b >= 0x81 && b <= 0x9F) || (b >= 0xE0 && b <= 0xFC) ? 2 : 1;
        case CHARSET_EUCJP:
            return b == 0x8F ? 3 : (b == 0x8E || (b >= 0xA1 && b <= 0xFE)) ? 2 : 1;
        case CHARSET_EUCKR:
        case CHARSET_GB2312:
            return b >= 0xA1 && b <= 0xFE ? 2 : 1;
        case CHARSET_GBK:
        case CHARSET_BIG5:
        case CHARSET_BIG5HKSCS:
            return b >= 0x81 && b <= 0xFE ? 2 : 1;
        case CHARSET_GB18030:
            if (b < 0x81 || b > 0xFE) return 1;
            return avail >= 2 && p[1] >= 0x30 && p[1] <= 0x39 ? 4 : 2;
        default:
            return 1;
    }
}

}  // namespace

size_t cut_point(CharsetId id, std::string_view data) {
    if (is_utf16_family(id)) {
        for (size_t at = data.size() & ~size_t{1}; at >= 2; at -= 2) {
            const unsigned char a = data[at - 2], b = data[at - 1];
            if ((a == 0x0A && b == 0) || (a == 0 && b == 0x0A)) return at;
        }
    } else {
        size_t newline = data.rfind('\n');
        if (newline != std::string_view::npos) return newline + 1;
    }
    const auto *p = reinterpret_cast<const unsigned char *>(data.data());
    size_t at = 0, last = 0;
    while (at < data.size()) {
        at += char_length(id, p + at, data.size() - at);
        if (at <= data.size()) last = at;
    }
    return last ? last : data.size();
}

namespace {

std::string count_text(uint64_t n, const char *one, const char *many) {
    return std::to_string(n) + " " + (n == 1 ? one : many);
}

// The conversion of one request, chunk by chunk.
class Pipeline {
  public:
    Pipeline(const CharsetChoice &from, const CharsetChoice &to, const MissingConverterPolicy &policy)
        : from_(from), to_(to) {
        const CharsetId f = from.id, t = to.id;
        if (from.codePage) {
            path_ = Path::ServerCodePage;
        } else if (f == CHARSET_SJIS && t == CHARSET_UTF8) {
            path_ = Path::SjisToUtf8;
        } else if (f == CHARSET_EUCJP && t == CHARSET_UTF8) {
            path_ = Path::EucjpToUtf8;
        } else if (f == CHARSET_SJIS && t == CHARSET_EUCJP) {
            path_ = Path::SjisToEucjp;
        } else if (f == CHARSET_EUCJP && t == CHARSET_SJIS) {
            path_ = Path::EucjpToSjis;
        } else if (f == CHARSET_LATIN1 && t == CHARSET_UTF8) {
            path_ = Path::Latin1ToUtf8;
        } else if (f == CHARSET_KOI8R && t == CHARSET_UTF8) {
            path_ = Path::Koi8rToUtf8;
        } else {
            path_ = Path::ViaUnicode;
        }

        // The converters each path needs: the Japanese transcoders go through
        // the library's EUC-JP converters, the rest through the engine's.
        switch (path_) {
            case Path::SjisToUtf8:
            case Path::EucjpToUtf8:
                require_converter("EUC-JP", "UTF-16", platform_decodes_name("EUC-JP"), policy,
                                  open_eucjp_decoder, CHARSET_EUCJP);
                break;
            case Path::EucjpToSjis:
                require_converter("EUC-JP", "UTF-16", platform_decodes_name("EUC-JP"), policy,
                                  open_eucjp_decoder, CHARSET_EUCJP);
                require_converter("UTF-16", "EUC-JP", platform_encodes_name("EUC-JP"), policy,
                                  open_eucjp_encoder, CHARSET_EUCJP);
                break;
            case Path::ServerCodePage:
            case Path::ViaUnicode:
                if (f != CHARSET_UTF8 || path_ == Path::ServerCodePage)
                    decodes_ = require_converter(charset_name(f), "UTF-16", platform_decodes(f), policy,
                                                 open_decoder, f);
                if (t != CHARSET_UTF8 || path_ == Path::ServerCodePage)
                    encodes_ = require_converter("UTF-16", charset_name(t), platform_encodes(t), policy,
                                                 open_encoder, t);
                if (path_ == Path::ServerCodePage && (!decodes_ || !encodes_)) path_ = Path::ViaUnicode;
                break;
            default:
                break;
        }
        // U+FFFD as each side writes it, to tell the text's own U+FFFD from
        // the substitutes the conversion puts in.
        if (decodes_ && f != CHARSET_UTF8 && platform_encodes(f)) replacementIn_ = encoded_replacement(f);
        // (Not for the UTF-16 targets: their converter writes a byte-order mark
        // in front of its first output only, which belongs to the text.)
        if (encodes_ && t != CHARSET_UTF8 && !is_utf16_family(t)) replacementOut_ = encoded_replacement(t);
        if (f == CHARSET_UTF8) replacementIn_ = kReplacementUtf8;
        if (t == CHARSET_UTF8) replacementOut_ = kReplacementUtf8;
    }

    // Converts one piece of text made of whole characters (the last piece of
    // an input may end inside one), appending to out. Returns the number of
    // substitutions made in it.
    uint64_t run(std::string_view in, bool last, std::string &out) {
        uint64_t subs = 0;
        switch (path_) {
            case Path::ServerCodePage:
                subs = server_code_page(in, out);
                break;
            case Path::SjisToUtf8:
                subs = sjis_to_utf8(in, out);
                break;
            case Path::EucjpToUtf8:
                subs = eucjp_to_utf8(in, out);
                break;
            case Path::SjisToEucjp:
                subs = sjis_to_eucjp(in, out);
                break;
            case Path::EucjpToSjis:
                subs = eucjp_to_sjis(in, out);
                break;
            case Path::Latin1ToUtf8: {
                std::string source(in);
                std::string buffer(2 * in.size() + 1, '\0');
                uint32_t length = 0;
                StringFromLatin1ToUTF8(source.c_str(), buffer.data(), &length);
                if (length == 0 || length > buffer.size()) fail_library("StringFromLatin1ToUTF8");
                out.append(buffer.data(), length - 1);
                break;
            }
            case Path::Koi8rToUtf8: {
                char bytes[4];
                for (char c : in) {
                    uint8_t count = 0;
                    FromKOI8RtoUTF8(&c, bytes, &count);
                    if (count == 0 || count > 3) fail_library("FromKOI8RtoUTF8");
                    out.append(bytes, count);
                }
                break;
            }
            case Path::ViaUnicode:
                subs = decode(in, last);
                subs += encode(out);
                break;
        }
        return subs;
    }

  private:
    enum class Path {
        ServerCodePage,
        SjisToUtf8,
        EucjpToUtf8,
        SjisToEucjp,
        EucjpToSjis,
        Latin1ToUtf8,
        Koi8rToUtf8,
        ViaUnicode
    };

    [[noreturn]] void fail_library(const char *function) const {
        throw Failure(kExitBadInput, std::string("the library's ") + function + " failed converting " +
                                         from_.label + " to " + to_.label);
    }

    static std::string encoded_replacement(CharsetId id) {
        std::u16string unit(1, u'\xFFFD');
        unit.push_back(0);
        std::string out(16, '\0');
        const uint16_t *from = reinterpret_cast<const uint16_t *>(unit.c_str());
        char *to = out.data();
        uint32_t length = static_cast<uint32_t>(out.size());
        if (!StringFromUnicodeToCharset(id, &from, &to, &length) || length < 2) return {};
        out.resize(length - (is_utf16_family(id) ? 2 : 1));
        // A byte-order mark in front belongs to the converter, not the character.
        if (out.size() >= 4 && (out.compare(0, 2, "\xFF\xFE") == 0 || out.compare(0, 2, "\xFE\xFF") == 0))
            out.erase(0, 2);
        return out == "?" ? std::string() : out;
    }

    // ---- X to UTF-16 ----

    uint64_t decode(std::string_view in, bool last) {
        if (from_.id == CHARSET_UTF8) return decode_utf8(in);
        if (!decodes_) return decode_without_converter(in);
        const bool utf16 = is_utf16_family(from_.id);
        uint64_t subs = 0;
        std::string_view text = in;
        const bool oddByte = utf16 && text.size() % 2;  // a last odd byte is no unit
        if (oddByte) text.remove_suffix(1);
        // Only the last piece can end inside a character; the engine refuses
        // that, so its tail becomes one substitute.
        const size_t maxTrim = last ? (utf16 ? 2 : 3) : 0;
        for (size_t trim = 0; trim <= maxTrim && trim <= text.size(); trim += utf16 ? 2 : 1) {
            source_.assign(text.data(), text.size() - trim);
            source_.append(2, '\0');
            room(units_, source_.size() + 8);
            const char *from = source_.c_str();
            uint16_t *to = reinterpret_cast<uint16_t *>(units_.data());
            uint32_t length = static_cast<uint32_t>(units_.size() * 2);
            if (StringFromCharsetToUnicode(from_.id, &from, &to, &length) && length >= 2) {
                count_ = length / 2 - 1;
                const size_t made = count_units(u'\xFFFD'), own = count_occurrences(source_, replacementIn_);
                subs += made > own ? made - own : 0;
                if (trim || oddByte) {
                    units_[count_++] = u'\xFFFD';
                    ++subs;
                }
                return subs;
            }
        }
        throw Failure(kExitBadInput, "the text cannot be read as " + from_.label);
    }

    uint64_t decode_utf8(std::string_view in) {
        room(units_, in.size() + 2);
        const uint32_t capacity = static_cast<uint32_t>(units_.size() * 2);
        // A sequence cut short at the end of the text becomes one U+FFFD.
        for (size_t trim = 0; trim <= 6 && trim <= in.size(); ++trim) {
            uint32_t written = 0;
            uint32_t r = ConvertUTF8toUTF16(in.data(), static_cast<uint32_t>(in.size() - trim),
                                            reinterpret_cast<uint16_t *>(units_.data()), capacity, &written);
            if (r == TEXTCONV_UTF_SOURCE_INCOMPLETE) continue;
            if (r != TEXTCONV_UTF_DONE) fail_library("ConvertUTF8toUTF16");
            count_ = written / 2;
            const size_t made = count_units(u'\xFFFD'), own = count_occurrences(in, kReplacementUtf8);
            uint64_t subs = made > own ? made - own : 0;
            if (trim) {
                units_[count_++] = u'\xFFFD';
                ++subs;
            }
            return subs;
        }
        fail_library("ConvertUTF8toUTF16");
    }

    // No converter (the user chose to go on): ASCII passes, every other
    // character becomes U+FFFD.
    uint64_t decode_without_converter(std::string_view in) {
        uint64_t subs = 0;
        room(units_, in.size() + 2);
        count_ = 0;
        if (is_utf16_family(from_.id)) {
            for (size_t i = 0; i + 1 < in.size(); i += 2) {
                const unsigned a = static_cast<unsigned char>(in[i]),
                               b = static_cast<unsigned char>(in[i + 1]);
                const unsigned unit = from_.id == CHARSET_UTF16BE ? a << 8 | b : b << 8 | a;
                if (unit == 0xFEFF && i == 0) continue;
                units_[count_++] = unit < 0x80 ? static_cast<char16_t>(unit) : u'\xFFFD';
                subs += unit >= 0x80;
            }
            return subs;
        }
        for (unsigned char c : in) {
            units_[count_++] = c < 0x80 ? c : u'\xFFFD';
            subs += c >= 0x80;
        }
        return subs;
    }

    // ---- UTF-16 to Y ----

    uint64_t encode(std::string &out) {
        if (!encodes_ && to_.id != CHARSET_UTF8) return encode_without_converter(out);
        room(units_, count_ + 1);
        units_[count_] = 0;
        const uint16_t *from = reinterpret_cast<const uint16_t *>(units_.data());
        if (to_.id == CHARSET_UTF8) {
            room(bytes_, 3 * count_ + 4);
            uint32_t length = static_cast<uint32_t>(bytes_.size());
            if (!StringFromUnicodeToUTF8(from, bytes_.data(), &length) || length == 0)
                fail_library("StringFromUnicodeToUTF8");
            out.append(bytes_.data(), length - 1);
            return 0;
        }
        room(bytes_, 4 * count_ + 12);
        char *to = bytes_.data();
        uint32_t length = static_cast<uint32_t>(bytes_.size());
        if (!StringFromUnicodeToCharset(to_.id, &from, &to, &length))
            fail_library("StringFromUnicodeToCharset");
        const size_t terminator = is_utf16_family(to_.id) ? 2 : 1;
        if (length < terminator || length > bytes_.size()) fail_library("StringFromUnicodeToCharset");
        std::string_view produced(bytes_.data(), length - terminator);
        out.append(produced);
        if (terminator == 2) return 0;
        // "?" written for a unit the charset cannot hold; a U+FFFD that the
        // decoding put in and that became "?" is counted there already.
        const size_t marks = count_occurrences(produced, "?");
        const size_t expected = count_units(u'?') + (replacementOut_.empty() ? count_units(u'\xFFFD') : 0);
        return marks > expected ? marks - expected : 0;
    }

    uint64_t encode_without_converter(std::string &out) {
        uint64_t subs = 0;
        for (size_t i = 0; i < count_; ++i) {
            const char16_t u = units_[i];
            const char16_t unit = u < 0x80 ? u : u'?';
            subs += u >= 0x80 && u != 0xFFFD;
            if (to_.id == CHARSET_UTF16BE) {
                out.push_back(0);
                out.push_back(static_cast<char>(unit));
            } else if (is_utf16_family(to_.id)) {
                out.push_back(static_cast<char>(unit));
                out.push_back(0);
            } else {
                out.push_back(static_cast<char>(unit));
            }
        }
        return subs;
    }

    // Scratch buffers only grow: no clearing or allocating per piece.
    template <typename Buffer>
    static void room(Buffer &buffer, size_t size) {
        if (buffer.size() < size) buffer.resize(size + size / 2);
    }

    size_t count_units(char16_t unit) const {
        size_t n = 0;
        for (size_t i = 0; i < count_; ++i) n += units_[i] == unit;
        return n;
    }

    // ---- server code pages ----

    uint64_t server_code_page(std::string_view in, std::string &out) {
        std::string source(in);
        std::string buffer(4 * (in.size() + 1) + 16, '\0');
        uint32_t length = static_cast<uint32_t>(buffer.size());
        StringFromServerCPToCharset(to_.id, from_.codePage, source.c_str(), buffer.data(), &length);
        const size_t terminator = is_utf16_family(to_.id) ? 2 : 1;
        if (length == buffer.size() || length < terminator) fail_library("StringFromServerCPToCharset");
        std::string_view produced(buffer.data(), length - terminator);
        out.append(produced);
        if (terminator == 2) return 0;
        size_t subs = 0;
        const size_t marksOut = count_occurrences(produced, "?"), marksIn = count_occurrences(in, "?");
        if (marksOut > marksIn) subs += marksOut - marksIn;
        if (!replacementOut_.empty()) {
            const size_t repOut = count_occurrences(produced, replacementOut_);
            const size_t repIn = count_occurrences(in, replacementIn_);
            if (repOut > repIn) subs += repOut - repIn;
        }
        return subs;
    }

    // ---- Japanese transcoders ----
    // They take no control characters (Shift-JIS) and stop at a byte that
    // cannot start a character, so the text is handed over in runs of
    // characters they accept; line ends and other controls are copied, and
    // every byte that starts no character becomes U+FFFD.

    uint64_t sjis_to_utf8(std::string_view in, std::string &out) {
        const std::string text(in);  // NUL-terminated: the decoder may look one byte ahead
        uint64_t subs = 0;
        size_t runStart = 0, i = 0;
        auto flush = [&](size_t end) {
            if (end <= runStart) return;
            std::string run = text.substr(runStart, end - runStart);
            std::string buffer(3 * run.size() + 1, '\0');
            uint32_t length = 0;
            if (!StringFromSJISToUTF8(run.c_str(), buffer.data(), &length) || length == 0 ||
                length > buffer.size())
                fail_library("StringFromSJISToUTF8");
            std::string_view produced(buffer.data(), length - 1);
            subs += count_occurrences(produced, kNoCharacterUtf8);
            out.append(produced);
        };
        while (i < text.size()) {
            uint8_t kind = 0, used = 0;
            JisCode jis{};
            if (FromSJisToJis(text.c_str() + i, &kind, &jis, &used) && used >= 1 && used <= 2) {
                i += used;
                continue;
            }
            flush(i);
            const unsigned char b = text[i];
            if (b < 0x20 || b == 0x7F) {
                out.push_back(static_cast<char>(b));
            } else {
                out.append(kReplacementUtf8);
                ++subs;
            }
            runStart = ++i;
        }
        flush(text.size());
        return subs;
    }

    uint64_t eucjp_to_utf8(std::string_view in, std::string &out) {
        const std::string text(in);
        uint64_t subs = 0;
        size_t runStart = 0, i = 0;
        auto flush = [&](size_t end) {
            if (end <= runStart) return;
            std::string run = text.substr(runStart, end - runStart);
            std::string buffer(3 * run.size() / 2 + 4, '\0');
            uint32_t length = 0;
            if (!StringFromEUCJPToUTF8(run.c_str(), buffer.data(), &length) || length == 0 ||
                length > buffer.size())
                fail_library("StringFromEUCJPToUTF8");
            std::string_view produced(buffer.data(), length - 1);
            subs += count_occurrences(produced, kNoCharacterUtf8);
            out.append(produced);
        };
        while (i < text.size()) {
            const unsigned char b = text[i];
            size_t n = b < 0x80 ? 1 : b == 0x8F ? 3 : (b == 0x8E || (b >= 0xA1 && b <= 0xFE)) ? 2 : 0;
            // Trail bytes of EUC-JP are all 0x80 and above: a lead byte
            // followed by anything else starts no character.
            for (size_t k = 1; n && k < n; ++k)
                if (i + k >= text.size() || static_cast<unsigned char>(text[i + k]) < 0x80) n = 0;
            if (n) {
                i += n;
                continue;
            }
            flush(i);
            out.append(kReplacementUtf8);
            ++subs;
            runStart = ++i;
        }
        flush(text.size());
        return subs;
    }

    uint64_t sjis_to_eucjp(std::string_view in, std::string &out) {
        uint64_t subs = 0;
        size_t runStart = 0;
        auto flush = [&](size_t end) {
            if (end <= runStart) return;
            std::string run(in.substr(runStart, end - runStart));
            std::string buffer(2 * run.size() + 1, '\0');
            uint32_t length = static_cast<uint32_t>(buffer.size());
            StringFromSJISToEUCJP(run.c_str(), buffer.data(), &length);
            if (length == 0 || length > buffer.size()) fail_library("StringFromSJISToEUCJP");
            std::string_view produced(buffer.data(), length - 1);
            const size_t spacesOut = count_occurrences(produced, " "), spacesIn = count_occurrences(run, " ");
            if (spacesOut > spacesIn) subs += spacesOut - spacesIn;
            out.append(produced);
        };
        for (size_t i = 0; i < in.size(); ++i) {
            const unsigned char b = in[i];
            if (b >= 0x20 && b != 0x7F) continue;
            flush(i);
            out.push_back(static_cast<char>(b));
            runStart = i + 1;
        }
        flush(in.size());
        return subs;
    }

    uint64_t eucjp_to_sjis(std::string_view in, std::string &out) {
        std::string source(in);
        std::string buffer(in.size() + 17, '\0');
        int32_t length = static_cast<int32_t>(in.size() + 16);
        StringFromEUCJPToSJIS(source.c_str(), buffer.data(), &length);
        if (length <= 0 || static_cast<size_t>(length) > buffer.size()) fail_library("StringFromEUCJPToSJIS");
        std::string_view produced(buffer.data(), static_cast<size_t>(length) - 1);
        out.append(produced);
        const size_t spacesOut = count_occurrences(produced, " "), spacesIn = count_occurrences(in, " ");
        return spacesOut > spacesIn ? spacesOut - spacesIn : 0;
    }

    CharsetChoice from_, to_;
    Path path_ = Path::ViaUnicode;
    bool decodes_ = true, encodes_ = true;
    std::string replacementIn_, replacementOut_;
    std::u16string units_;  // the text as UTF-16: count_ units
    size_t count_ = 0;
    std::string source_, bytes_;
};

// A progress line on stderr for long inputs.
class Progress {
  public:
    Progress(int setting, const std::string &name, uint64_t total) : name_(name), total_(total) {
        const bool terminal = isatty(STDERR_FILENO);
        enabled_ = setting == 1 || (setting == -1 && terminal && total >= (8u << 20));
    }
    void update(uint64_t done) {
        if (!enabled_) return;
        auto now = std::chrono::steady_clock::now();
        if (shown_ && now - last_ < std::chrono::milliseconds(100)) return;
        last_ = now;
        shown_ = true;
        if (total_) {
            const int percent = static_cast<int>(done * 100 / total_);
            const int filled = percent * 30 / 100;
            std::fprintf(stderr, "\r%s [%-30s] %3d%% %.1f/%.1f MiB", name_.c_str(),
                         std::string(filled, '#').c_str(), percent, done / 1048576.0, total_ / 1048576.0);
        } else {
            std::fprintf(stderr, "\r%s %.1f MiB", name_.c_str(), done / 1048576.0);
        }
        std::fflush(stderr);
    }
    void finish() {
        if (enabled_ && shown_) std::fprintf(stderr, "\r\033[K");
        shown_ = false;
    }
    ~Progress() { finish(); }

  private:
    std::string name_;
    uint64_t total_;
    bool enabled_ = false, shown_ = false;
    std::chrono::steady_clock::time_point last_{};
};

struct Output {
    std::FILE *file = stdout;
    std::string name = "standard output";
    void write(const std::string &bytes) {
        if (!bytes.empty() && std::fwrite(bytes.data(), 1, bytes.size(), file) != bytes.size())
            throw Failure(kExitBadInput, "cannot write " + name + ": " + std::strerror(errno));
    }
};

// Converts one input into out; returns the substitutions made.
uint64_t convert_stream(Pipeline &pipeline, const std::string &path, const CharsetChoice &from,
                        const ConvertOptions &options, Output &out) {
    const bool useStdin = path.empty() || path == "-";
    const std::string name = useStdin ? "standard input" : path;
    std::FILE *file = useStdin ? stdin : std::fopen(path.c_str(), "rb");
    if (!file) throw Failure(kExitBadInput, "cannot open " + path + ": " + std::strerror(errno));
    struct Closer {
        std::FILE *f;
        bool own;
        ~Closer() {
            if (own) std::fclose(f);
        }
    } closer{file, !useStdin};

    struct stat info {};
    uint64_t total = fstat(fileno(file), &info) == 0 && S_ISREG(info.st_mode) ? info.st_size : 0;
    Progress progress(options.progress, name, total);

    const bool units = is_utf16_family(from.id);
    const size_t chunk = options.chunkSize;
    std::string pending, converted;
    std::string readBuffer(chunk, '\0');
    pending.reserve(chunk);
    uint64_t offset = 0;    // bytes read so far
    uint64_t consumed = 0;  // bytes converted so far
    uint64_t line = 1;      // line number of the start of the pending text
    uint64_t subs = 0;
    bool eof = false;
    while (true) {
        if (!eof && pending.size() < chunk) {
            const size_t before = pending.size();
            const size_t got = std::fread(readBuffer.data(), 1, chunk - before, file);
            pending.append(readBuffer.data(), got);
            if (got < chunk - before) {
                if (std::ferror(file))
                    throw Failure(kExitBadInput, "cannot read " + name + ": " + std::strerror(errno));
                eof = true;
            }
            // A NUL would end the text for the library: refuse it, where it is.
            if (!units) {
                if (const void *nul = std::memchr(pending.data() + before, 0, got))
                    throw Failure(kExitBadInput, name + ": NUL byte at byte offset " +
                                                     std::to_string(offset + (static_cast<const char *>(nul) -
                                                                              pending.data() - before)) +
                                                     " (the text must not contain NUL)");
            } else {
                for (size_t i = before; i < pending.size(); ++i) {
                    const uint64_t at = offset + (i - before);
                    if (at % 2 == 1 && pending[i] == 0 && pending[i - 1] == 0)
                        throw Failure(kExitBadInput, name + ": a 0 unit at byte offset " +
                                                         std::to_string(at - 1) +
                                                         " (the text must not contain NUL)");
                }
            }
            offset += got;
        }
        if (pending.empty()) break;
        const size_t cut = eof ? pending.size() : cut_point(from.id, pending);
        const std::string_view piece(pending.data(), cut);
        converted.clear();
        const uint64_t pieceSubs = pipeline.run(piece, eof && cut == pending.size(), converted);
        out.write(converted);
        subs += pieceSubs;
        if (pieceSubs && options.strict) {
            progress.finish();
            std::fflush(out.file);
            throw Failure(kExitFailed, name + ": " + count_text(pieceSubs, "substitution", "substitutions") +
                                           " in the text from line " + std::to_string(line) +
                                           " (--strict makes any substitution an error)");
        }
        if (options.strict) line += std::count(piece.begin(), piece.end(), '\n');
        consumed += cut;
        pending.erase(0, cut);
        progress.update(consumed);
        if (eof && pending.empty()) break;
    }
    progress.finish();
    return subs;
}

}  // namespace

int run_convert(const ConvertOptions &options) {
    const CharsetChoice from = resolve_charset(options.from, true);
    const CharsetChoice to = resolve_charset(options.to, false);
    if (options.chunkSize < 16) throw Failure(kExitUsage, "--chunk-size must be at least 16 bytes");

    Output out;
    if (!options.output.empty() && options.output != "-") {
        // Opening the output truncates it: never when it is one of the inputs.
        struct stat target {};
        if (stat(options.output.c_str(), &target) == 0)
            for (const std::string &path : options.inputs) {
                struct stat source {};
                if (stat(path.c_str(), &source) == 0 && source.st_dev == target.st_dev &&
                    source.st_ino == target.st_ino)
                    throw Failure(kExitUsage, "the output " + options.output + " is also an input");
            }
        out.name = options.output;
        out.file = std::fopen(options.output.c_str(), "wb");
        if (!out.file)
            throw Failure(kExitBadInput, "cannot write " + options.output + ": " + std::strerror(errno));
    }
    struct Closer {
        Output &o;
        ~Closer() {
            if (o.file != stdout) std::fclose(o.file);
        }
    } closer{out};

    Pipeline pipeline(from, to, options.policy);
    uint64_t subs = 0;
    if (options.inputs.empty()) {
        subs += convert_stream(pipeline, "", from, options, out);
    } else {
        for (const std::string &path : options.inputs)
            subs += convert_stream(pipeline, path, from, options, out);
    }
    if (std::fflush(out.file) != 0)
        throw Failure(kExitBadInput, "cannot write " + out.name + ": " + std::strerror(errno));
    if (subs && !options.quiet)
        std::fprintf(stderr, "textconv: %s (%s to %s)\n",
                     count_text(subs, "substitution", "substitutions").c_str(), from.label.c_str(),
                     to.label.c_str());
    return kExitDone;
}

}  // namespace tool
