// The local-encoding layer under a real locale, built once per locale: the
// build names the suite (LOCAL_SUITE), the CharsetId the locale must give
// (EXPECTED_LOCAL) and the charset's glibc name (EXPECTED_ICONV).
#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <random>
#include <string>
#include <tuple>
#include <utility>
#include <vector>

#include "oracle.h"
#include "test_support.h"
#include "textconv.h"

namespace {

using testsupport::hex;
using namespace std::string_literals;

constexpr CharsetId kLocal = EXPECTED_LOCAL;
constexpr const char *kCharset = EXPECTED_ICONV;
constexpr bool kUtf8 = kLocal == CHARSET_UTF8;

// Corpus lines in UTF-8 and, where the local charset holds all of a line, in it.
struct Line {
    std::string utf8;
    std::optional<std::string> local;
};

const std::vector<Line> &lines() {
    static const std::vector<Line> all = [] {
        std::vector<Line> v;
        for (std::string &s : localtest::utf8_lines(150)) {
            auto local = testsupport::iconv_convert(kCharset, "UTF-8", s);
            v.push_back({std::move(s), std::move(local)});
        }
        return v;
    }();
    return all;
}

#define REQUIRE_CORPORA() \
    if (lines().empty()) GTEST_SKIP() << "corpora not available"

std::string as_string(const void *p, size_t n) { return std::string(static_cast<const char *>(p), n); }

TEST(LOCAL_SUITE, LocaleGivesTheExpectedCharset) { EXPECT_EQ(LocalEncoding(), kLocal); }

// StringFromUTF8ToLocal against a model: every unit on its own through
// iconv, "?" for one the charset cannot hold. Returns whether the model
// converted every unit.
bool expect_like_oracle(localtest::UnitOracle &oracle, const std::string &utf8) {
    std::string expected = utf8;
    bool complete = true, cutShort = false;
    if (!kUtf8) {
        // Decoded by the library's UTF-8 decoder (tested on its own), which
        // also reads ill-formed text.
        std::u16string units(utf8.size(), u'\0');
        uint32_t written = 0;
        cutShort = ConvertUTF8toUTF16(utf8.data(), static_cast<uint32_t>(utf8.size()),
                                      reinterpret_cast<uint16_t *>(units.data()), 2 * units.size(),
                                      &written) != TEXTCONV_UTF_DONE;
        units.resize(cutShort ? 0 : written / 2);
        expected.clear();
        for (char16_t u : units) {
            auto b = oracle.bytes(u);
            expected += b.value_or("?");
            complete &= b.has_value();
        }
    }
    std::vector<char> target(4 * utf8.size() + 8, '\x7f');
    uint32_t length = 12345;
    int r = StringFromUTF8ToLocal(utf8.c_str(), target.data(), &length);
    if (cutShort) {
        EXPECT_EQ(r, 0) << hex(utf8);
        EXPECT_EQ(length, 12345u) << hex(utf8);
        EXPECT_EQ(target[0], '\x7f') << hex(utf8);
        return false;
    }
    EXPECT_EQ(length, expected.size() + 1) << hex(utf8);
    EXPECT_EQ(hex(as_string(target.data(), std::min<size_t>(length, target.size() - 1) + 1)),
              hex(expected + '\0' + '\x7f'))
        << hex(utf8);
    EXPECT_EQ(r, complete ? 1 : 0) << hex(utf8);
    return complete;
}

// Corpus lines and random text; where glibc converts a whole line, so must the
// library.
TEST(LOCAL_SUITE, UTF8ToLocalAgreesWithIconv) {
    REQUIRE_CORPORA();
    localtest::UnitOracle oracle(kCharset);
    ASSERT_TRUE(oracle.ok());
    int whole = 0, substituted = 0;
    auto check = [&](const std::string &utf8, const std::optional<std::string> &local) {
        if (HasFailure()) return;
        const bool complete = expect_like_oracle(oracle, utf8);
        EXPECT_TRUE(complete || !local) << hex(utf8);
        ++(local ? whole : substituted);
    };
    for (const Line &line : lines()) check(line.utf8, line.local);
    for (uint32_t seed = 1; seed <= 200 && !HasFailure(); ++seed) {
        std::string s = testsupport::random_utf8(seed, 1 + seed % 40);
        check(s, testsupport::iconv_convert(kCharset, "UTF-8", s));
    }
    EXPECT_GT(whole, 0);
    EXPECT_TRUE(kUtf8 || substituted > 0);
}

// Long ASCII runs, which go by whole blocks once their units are known,
// broken at every offset by an ASCII unit seen for the first time, and
// followed by non-ASCII text or ill-formed bytes.
TEST(LOCAL_SUITE, UTF8ToLocalRunsOfKnownAscii) {
    localtest::UnitOracle oracle(kCharset);
    ASSERT_TRUE(oracle.ok());
    const std::string words = "the quick brown fox jumps over the lazy dog. ";
    std::string fresh;  // ASCII units the words do not use, each inserted once
    for (char c = 1; c < 0x7F; ++c)
        if (words.find(c) == std::string::npos) fresh += c;
    const char *breaks[] = {"\xC3\xA9", "\xD0\xB6", "\xD7\x90", "\xE2\x82\xAC", "\xF0\x9F\x98\x80",
                            "\xFF",     "\xE3\x41", "",         "\xE3\x81",     "\xC3"};
    std::mt19937 rng(7);
    for (size_t k = 0; k < fresh.size() && !HasFailure(); ++k) {
        std::string s = words + words + words;
        s.insert(k, 1, fresh[k]);
        s.insert(s.size() - rng() % 40 * (k % 3), breaks[k % std::size(breaks)]);
        expect_like_oracle(oracle, s);
    }
}

// Long texts of the letters the charset holds, whose alphabet grows from
// text to text, so that units seen for the first time stand among known
// ones at every place of a block.
TEST(LOCAL_SUITE, UTF8ToLocalLongTextsOfLetters) {
    localtest::UnitOracle oracle(kCharset);
    ASSERT_TRUE(oracle.ok());
    std::u16string letters;
    for (char16_t first : {0x80, 0x400, 0x580, 0x600, 0xE00})
        for (char16_t u = first; u < first + 0x80; ++u)
            if (oracle.bytes(u)) letters += u;
    std::mt19937 rng(11);
    std::shuffle(letters.begin(), letters.end(), rng);
    for (size_t round = 0; round < 60 && !HasFailure(); ++round) {
        std::u16string text;
        const size_t alphabet = std::min(letters.size(), 4 + 2 * round);
        for (int k = 0; k < 300; ++k) {
            const uint32_t r = rng() % 8;
            text += r == 0                    ? u' '
                    : r == 1 || alphabet == 0 ? char16_t(u'a' + rng() % 26)
                                              : letters[rng() % alphabet];
        }
        if (round % 4 == 3) text += u'\x20AC';  // held by some charsets, "?" in others
        expect_like_oracle(oracle,
                           *testsupport::iconv_convert(
                               "UTF-8", "UTF-16LE",
                               std::string(reinterpret_cast<const char *>(text.data()), 2 * text.size())));
    }
}

// UTF-8 cut short: nothing written (copied as is when the local charset is UTF-8).
TEST(LOCAL_SUITE, UTF8ToLocalCutShortChangesNothing) {
    for (const char *cut : {"abc\xE3\x81", "\xC3", "x\xF0\x9F\x98", ""}) {
        char target[16];
        std::memset(target, 0x7f, sizeof target);
        uint32_t length = 99;
        int r = StringFromUTF8ToLocal(cut, target, &length);
        if (kUtf8 || !*cut) {
            EXPECT_EQ(r, 1);
            EXPECT_EQ(length, std::strlen(cut) + 1);
            EXPECT_STREQ(target, cut);
        } else {
            EXPECT_EQ(r, 0);
            EXPECT_EQ(length, 99u);
            EXPECT_EQ(target[0], '\x7f');
        }
    }
}

// Local text line by line to UTF-8 and back: whole corpus files where the
// corpora keep one in the local charset, else the lines the charset holds.
TEST(LOCAL_SUITE, LocalToUTF8AndBackAgreeWithIconv) {
    REQUIRE_CORPORA();
    std::vector<std::string> local;
    const char *suffix = kLocal == CHARSET_KOI8R    ? ".koi8r.txt"
                         : kLocal == CHARSET_LATIN1 ? ".latin1.txt"
                         : kLocal == CHARSET_EUCJP  ? ".eucjp.txt"
                                                    : nullptr;
    for (const std::string &name : suffix ? testsupport::corpus_files(suffix) : std::vector<std::string>{}) {
        std::string text = *testsupport::read_corpus(name);
        for (size_t start = 0, end; start < text.size(); start = end + 1) {
            end = std::min(text.find('\n', start), text.size());
            local.push_back(text.substr(start, end - start));
        }
    }
    if (local.empty())
        for (const Line &line : lines())
            if (line.local && line.local->find('\0') == std::string::npos) local.push_back(*line.local);
    for (const std::string &line : local) {
        auto utf8 = testsupport::iconv_convert("UTF-8", kCharset, line);
        ASSERT_TRUE(utf8) << hex(line);
        const uint32_t room = static_cast<uint32_t>(3 * line.size() + 1);  // the worst case of every path
        std::vector<char> target(room + 8, '\x7f');
        uint32_t length = room;
        ASSERT_EQ(StringFromLocalToUTF8(line.c_str(), target.data(), &length), 1) << hex(line);
        ASSERT_EQ(as_string(target.data(), length + 1), *utf8 + '\0' + '\x7f') << hex(line);
        std::vector<char> back(4 * utf8->size() + 1);
        ASSERT_EQ(StringFromUTF8ToLocal(utf8->c_str(), back.data(), &length), 1) << hex(line);
        ASSERT_EQ(as_string(back.data(), length - 1), line);
    }
    EXPECT_GT(local.size(), 100u);
}

// Every single byte: the fast paths and the path through UTF-16 alike.
TEST(LOCAL_SUITE, LocalToUTF8EverySingleByte) {
    for (int b = 1; b < 256; ++b) {
        const char source[2] = {static_cast<char>(b), 0};
        char target[16];
        std::memset(target, 0x7f, sizeof target);
        uint32_t length = 8;
        int r = StringFromLocalToUTF8(source, target, &length);
        auto oracle = testsupport::iconv_convert("UTF-8", kCharset, source);
        if (kLocal == CHARSET_EUCJP && b >= 0x80) {
            // Alone, every byte from 0x80 is a lead byte cut short or one no
            // character starts with (glibc reads 0x80..0xA0 as C1 controls).
            EXPECT_EQ(r, 0) << b;
            EXPECT_EQ(length, 8u) << b;
        } else {
            // Through UTF-16 an undecodable byte becomes U+FFFD.
            std::string expected = kUtf8 ? source : oracle.value_or("\xEF\xBF\xBD");
            EXPECT_EQ(r, 1) << b;
            EXPECT_EQ(hex(as_string(target, length)), hex(expected + '\0')) << b;
        }
    }
}

// Corpus lines the local charset holds, through every entry point that takes
// local text: to UTF-16 and back (the string engine, one character at a time,
// the Windows Unicode helpers; glibc gives the units), direction escaping and
// equivalence.
TEST(LOCAL_SUITE, LocalLinesEveryWay) {
    REQUIRE_CORPORA();
    int checked = 0;
    for (const Line &line : lines()) {
        if (!line.local) continue;
        SCOPED_TRACE(hex(*line.local));
        const char *source = line.local->c_str();
        const std::u16string units = *testsupport::iconv_to_utf16("UTF-8", line.utf8) + u'\0';
        const uint32_t bytes = static_cast<uint32_t>(2 * units.size());
        std::vector<uint16_t> u16(units.size() + 8, 0x7f7f), wide(u16);
        uint32_t length = static_cast<uint32_t>(2 * u16.size());
        ASSERT_EQ(StringFromLocalToUnicode(source, u16.data(), &length), 1);
        ASSERT_EQ(length, bytes);
        EXPECT_EQ(std::u16string(u16.begin(), u16.begin() + units.size()), units);
        host_stringToWindowsUnicode(source, wide.data(), &length);
        ASSERT_EQ(length, bytes);
        EXPECT_EQ(std::u16string(wide.begin(), wide.begin() + units.size()), units);

        const char *cursor = source;
        for (size_t i = 0; i + 1 < units.size(); ++i) {
            uint16_t unit = 0;
            uint32_t count = 0;
            ASSERT_EQ(FromLocalToUnicode(&cursor, &unit, &count), 1);
            ASSERT_EQ(count, 2u);
            ASSERT_EQ(unit, units[i]);
        }
        EXPECT_EQ(cursor, source + line.local->size());

        std::vector<char> back(line.local->size() + 8, '\x7f');
        length = static_cast<uint32_t>(back.size());
        ASSERT_EQ(StringFromUnicodeToLocal(u16.data(), back.data(), &length), 1);
        ASSERT_EQ(as_string(back.data(), length), *line.local + '\0');
        int32_t fromWide = static_cast<int32_t>(bytes);
        host_stringFromWindowsUnicode(reinterpret_cast<const char *>(wide.data()), back.data(), &fromWide);
        ASSERT_EQ(as_string(back.data(), fromWide), *line.local + '\0');

        // Direction escaping in the local charset is that of its CharsetId.
        const uint32_t room = static_cast<uint32_t>(3 * line.local->size() + 16);
        std::vector<char> a(room, '\x7f'), b(a);
        uint32_t la = room, lb = room;
        StringFromLocalToDirectionEscapedString(a.data(), source, &la);
        StringFromCharsetToDirectionEscapedString(kLocal, b.data(), source, &lb);
        EXPECT_EQ(la, lb);
        EXPECT_EQ(a, b);

        // Equivalent to the UTF-8 line; with the last ASCII letter's case
        // changed, only when case is ignored.
        const char *u = line.utf8.c_str();
        ASSERT_EQ(StringsEquivalent(u, CHARSET_UTF8, source, kLocal, 0), 1);
        ASSERT_EQ(StringsEquivalent(source, CHARSET_LATIN1, u, CHARSET_UTF8, 1), 1);
        ASSERT_EQ(StringsEquivalent(source, CHARSET_NONE, source, CHARSET_UTF16, 0), 1);
        std::string other = *line.local;
        size_t k = other.find_last_of("abcdefghijklmnopqrstuvwxyz");
        if (k != std::string::npos && (k == 0 || static_cast<unsigned char>(other[k - 1]) < 0x80)) {
            other[k] = static_cast<char>(other[k] - 'a' + 'A');
            EXPECT_EQ(StringsEquivalent(u, CHARSET_UTF8, other.c_str(), kLocal, 0), 0);
            EXPECT_EQ(StringsEquivalent(u, CHARSET_UTF8, other.c_str(), kLocal, 1), 1);
        }
        ++checked;
    }
    EXPECT_GT(checked, 10);
}

// Every BMP unit one at a time, against glibc.
TEST(LOCAL_SUITE, FromUnicodeToLocalEveryUnit) {
    localtest::UnitOracle oracle(kCharset);
    ASSERT_TRUE(oracle.ok());
    int held = 0;
    for (uint32_t u = 1; u <= 0xFFFF; ++u) {
        char out[8];
        std::memset(out, 0x7f, sizeof out);
        char *cursor = out;
        int r = FromUnicodeToLocal(u, &cursor);
        auto expected = oracle.bytes(static_cast<char16_t>(u));
        ASSERT_EQ(r, expected ? 1 : 0) << std::hex << u;
        ASSERT_EQ(hex(as_string(out, cursor - out + 1)), hex(expected.value_or("") + '\x7f'))
            << std::hex << u;
        held += r;
    }
    EXPECT_GT(held, 127);
}

TEST(LOCAL_SUITE, WindowsUnicodeStopsAtTheFirstUnitThatDoesNotFit) {
    localtest::UnitOracle oracle(kCharset);
    // A unit the charset lacks: a lone surrogate for UTF-8, else one of these.
    char16_t missing = 0xD800;
    for (char16_t u : {0x4E00, 0x05D0, 0x0430, 0x00E9, 0x3042})
        if (!oracle.bytes(u)) {
            missing = u;
            break;
        }
    const char bytes[] = {'A', 0, static_cast<char>(missing & 0xFF), static_cast<char>(missing >> 8), 'B', 0};
    char target[8];
    std::memset(target, 0x7f, sizeof target);
    // Then a length that ends inside a unit, or no length at all.
    for (auto [given, expected] :
         std::initializer_list<std::pair<int32_t, int32_t>>{{6, 2}, {3, 2}, {0, 1}, {-5, 1}}) {
        int32_t length = given;
        host_stringFromWindowsUnicode(bytes, target, &length);
        EXPECT_EQ(length, expected) << given;
        EXPECT_EQ(as_string(target, expected), std::string("A", expected - 1) + '\0') << given;
    }
    uint16_t wide[2] = {0x7f7f, 0x7f7f};
    uint32_t wideLength = 0;
    host_stringToWindowsUnicode("", wide, &wideLength);
    EXPECT_EQ(wideLength, 2u);
    EXPECT_EQ(wide[0] | wide[1] << 16, 0x7f7f0000);
}

// A list in a block from the host; returns the converted list.
std::string convert_list(const std::u16string &list, uint32_t length) {
    auto *block = static_cast<uint16_t *>(HostMalloc(static_cast<uint32_t>(2 * list.size() + 2), 1));
    std::memcpy(block, list.data(), 2 * list.size());
    StringListFromUnicodeToLocal(&block, &length);
    std::string out = as_string(block, length);
    HostFree(block);
    return out;
}

// Corpus lines and empty strings, converted as the oracle says.
TEST(LOCAL_SUITE, ListOfStrings) {
    REQUIRE_CORPORA();
    localtest::UnitOracle oracle(kCharset);
    std::u16string list;
    std::string expected;
    std::mt19937 rng(7);
    for (size_t i = 0; i < lines().size(); i += 7) {
        if (rng() % 3 == 0) list += u'\0', expected += '\0';
        auto units = testsupport::iconv_to_utf16("UTF-8", lines()[i].utf8);
        list += *units + u'\0';
        for (char16_t u : *units) expected += oracle.bytes(u).value_or("?");
        expected += '\0';
    }
    EXPECT_EQ(convert_list(list, static_cast<uint32_t>(2 * list.size())), expected + '\0');
}

TEST(LOCAL_SUITE, ListWhoseLastStringHasNoTerminator) {
    // "ab", "" and "cd" cut by the length before its 0 unit; the odd byte is ignored.
    EXPECT_EQ(hex(convert_list(u"ab\0\0cdXYZ"s, 2 * 6 + 1)), hex(std::string("ab\0\0cd\0\0", 8)));
    for (uint32_t none : {0u, 1u}) EXPECT_EQ(convert_list(u"", none), std::string(1, '\0'));
}

// Local to UTF-8 failures and small rooms that only one charset shows.
TEST(LOCAL_SUITE, LocalToUTF8Rooms) {
    char target[32];
    auto run = [&](const char *source, uint32_t room) {
        std::memset(target, 0x7f, sizeof target);
        uint32_t length = room;
        int r = StringFromLocalToUTF8(source, target, &length);
        return std::tuple{r, length, std::string(target, strnlen(target, sizeof target))};
    };
    EXPECT_EQ(run("", 77), std::tuple(1, 1u, ""s));
    if constexpr (kLocal == CHARSET_EUCJP) {
        // A byte no character starts with: what came before stays, unterminated.
        EXPECT_EQ(run("A\200B", 77), std::tuple(0, 77u, "A" + std::string(31, '\x7f')));
    } else if constexpr (kLocal != CHARSET_UTF8 && kLocal != CHARSET_LATIN1 && kLocal != CHARSET_KOI8R) {
        // Through UTF-16: a room too small gives the empty string, length 0; a
        // room of 0 is not written at all.
        EXPECT_EQ(run("abcd", 3), std::tuple(1, 0u, ""s));
        EXPECT_EQ(run("abcd", 0), std::tuple(1, 0u, std::string(32, '\x7f')));
        EXPECT_EQ(run("abcd", 5), std::tuple(1, 5u, "abcd"s));
    }
}

}  // namespace
