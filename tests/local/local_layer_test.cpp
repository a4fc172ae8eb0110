// The local-encoding layer under a real locale. Built once per locale: the
// build names the test suite (LOCAL_SUITE), the CharsetId the locale must give
// (EXPECTED_LOCAL) and the charset's glibc name (EXPECTED_ICONV).
#include <gtest/gtest.h>

#include <cstdlib>
#include <cstring>
#include <random>
#include <string>
#include <vector>

#include "oracle.h"
#include "test_support.h"
#include "textconv.h"

namespace {

using testsupport::hex;

constexpr CharsetId kLocal = EXPECTED_LOCAL;
constexpr const char *kCharset = EXPECTED_ICONV;
constexpr bool kUtf8 = kLocal == CHARSET_UTF8;

// Corpus lines, as UTF-8 and, where the local charset holds all of a line, in
// the local charset.
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

// The output of StringFromUTF8ToLocal as the oracle sees it: every unit on its
// own, "?" for one the charset cannot hold.
std::string expected_local(localtest::UnitOracle &oracle, const std::string &utf8, bool &complete) {
    complete = true;
    if (kUtf8) return utf8;
    auto units = testsupport::iconv_to_utf16("UTF-8", utf8);
    EXPECT_TRUE(units);
    std::string out;
    for (char16_t u : *units) {
        auto b = oracle.bytes(u);
        if (b) {
            out += *b;
        } else {
            out += '?';
            complete = false;
        }
    }
    return out;
}

TEST(LOCAL_SUITE, LocaleGivesTheExpectedCharset) { EXPECT_EQ(LocalEncoding(), kLocal); }

TEST(LOCAL_SUITE, UTF8ToLocalAgreesWithIconv) {
    REQUIRE_CORPORA();
    localtest::UnitOracle oracle(kCharset);
    ASSERT_TRUE(oracle.ok());
    int whole = 0, substituted = 0;
    auto check = [&](const std::string &utf8, const std::optional<std::string> &local) {
        bool complete = false;
        std::string expected = expected_local(oracle, utf8, complete);
        std::vector<char> target(4 * utf8.size() + 8, '\x7f');
        uint32_t length = 12345;
        int r = StringFromUTF8ToLocal(utf8.c_str(), target.data(), &length);
        ASSERT_EQ(length, expected.size() + 1) << hex(utf8);
        ASSERT_EQ(hex(std::string(target.data(), length - 1)), hex(expected)) << hex(utf8);
        EXPECT_EQ(target[length - 1], '\0');
        EXPECT_EQ(target[length], '\x7f');
        EXPECT_EQ(r, complete ? 1 : 0);
        // Where glibc converts the line as a whole, so must the library.
        if (local) {
            EXPECT_EQ(expected, *local);
            ++whole;
        } else {
            ++substituted;
        }
    };
    for (const Line &line : lines()) {
        check(line.utf8, line.local);
        if (HasFailure()) return;
    }
    for (uint32_t seed = 1; seed <= 200; ++seed) {
        std::string s = testsupport::random_utf8(seed, 1 + seed % 40);
        check(s, testsupport::iconv_convert(kCharset, "UTF-8", s));
        if (HasFailure()) return;
    }
    EXPECT_GT(whole, 0);
    if (!kUtf8) {
        EXPECT_GT(substituted, 0);
    }
}

TEST(LOCAL_SUITE, UTF8ToLocalCutShortChangesNothing) {
    for (const char *cut : {"abc\xE3\x81", "\xC3", "x\xF0\x9F\x98"}) {
        char target[16];
        std::memset(target, 0x7f, sizeof target);
        uint32_t length = 99;
        int r = StringFromUTF8ToLocal(cut, target, &length);
        if (kUtf8) {
            // Copied byte for byte, valid or not.
            EXPECT_EQ(r, 1);
            EXPECT_EQ(length, std::strlen(cut) + 1);
            EXPECT_STREQ(target, cut);
        } else {
            EXPECT_EQ(r, 0);
            EXPECT_EQ(length, 99u);
            EXPECT_EQ(target[0], '\x7f');
        }
    }
    char target[4];
    uint32_t length = 0;
    EXPECT_EQ(StringFromUTF8ToLocal("", target, &length), 1);
    EXPECT_EQ(length, 1u);
    EXPECT_EQ(target[0], '\0');
}

// Local text line by line to UTF-8 and back, against glibc: whole corpus
// files where the corpora keep one in the local charset (KOI8-R, Latin-1,
// EUC-JP), else the corpus lines that the charset holds.
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
        // Room for the worst case of every path: 3 bytes per source byte.
        const uint32_t room = static_cast<uint32_t>(3 * line.size() + 1);
        std::vector<char> target(room + 8, '\x7f');
        uint32_t length = room;
        ASSERT_EQ(StringFromLocalToUTF8(line.c_str(), target.data(), &length), 1) << hex(line);
        ASSERT_EQ(std::string(target.data(), length - 1), *utf8) << hex(line);
        ASSERT_EQ(target[length], '\x7f');
        std::vector<char> back(4 * utf8->size() + 1);
        ASSERT_EQ(StringFromUTF8ToLocal(utf8->c_str(), back.data(), &length), 1) << hex(line);
        ASSERT_EQ(std::string(back.data(), length - 1), line);
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
        SCOPED_TRACE(b);
        if (kUtf8) {
            EXPECT_EQ(r, 1);
            EXPECT_EQ(length, 2u);
            EXPECT_STREQ(target, source);
        } else if (kLocal == CHARSET_EUCJP && b >= 0x80) {
            // Alone, every byte from 0x80 is a lead byte cut short or one no
            // character starts with (glibc reads 0x80..0xA0 as C1 controls).
            EXPECT_EQ(r, 0);
            EXPECT_EQ(length, 8u);
        } else if (oracle) {
            EXPECT_EQ(r, 1);
            EXPECT_EQ(length, oracle->size() + 1);
            EXPECT_EQ(hex(std::string(target, length - 1)), hex(*oracle));
        } else {
            // Through UTF-16 an undecodable byte becomes U+FFFD.
            EXPECT_EQ(r, 1);
            EXPECT_EQ(hex(std::string(target, length - 1)), hex("\xEF\xBF\xBD"));
        }
    }
}

// Local text to UTF-16 and back four ways: the string engine, one character
// at a time, and the Windows Unicode helpers; glibc gives the units.
TEST(LOCAL_SUITE, UnicodeBothWays) {
    REQUIRE_CORPORA();
    int checked = 0;
    for (const Line &line : lines()) {
        if (!line.local) continue;
        SCOPED_TRACE(hex(*line.local));
        const std::u16string units = *testsupport::iconv_to_utf16("UTF-8", line.utf8);
        const uint32_t bytes = static_cast<uint32_t>(2 * (units.size() + 1));
        std::vector<uint16_t> u16(units.size() + 8, 0x7f7f);
        uint32_t length = static_cast<uint32_t>(2 * u16.size());
        ASSERT_EQ(StringFromLocalToUnicode(line.local->c_str(), u16.data(), &length), 1);
        ASSERT_EQ(length, bytes);
        EXPECT_EQ(std::u16string(u16.begin(), u16.begin() + units.size() + 1), units + u'\0');

        std::vector<uint16_t> wide(units.size() + 8, 0x7f7f);
        host_stringToWindowsUnicode(line.local->c_str(), wide.data(), &length);
        ASSERT_EQ(length, bytes);
        EXPECT_EQ(std::u16string(wide.begin(), wide.begin() + units.size() + 1), units + u'\0');

        const char *cursor = line.local->c_str();
        for (char16_t expected : units) {
            uint16_t unit = 0;
            uint32_t count = 0;
            ASSERT_EQ(FromLocalToUnicode(&cursor, &unit, &count), 1);
            ASSERT_EQ(count, 2u);
            ASSERT_EQ(unit, expected);
        }
        EXPECT_EQ(cursor, line.local->c_str() + line.local->size());

        std::vector<char> back(line.local->size() + 8, '\x7f');
        length = static_cast<uint32_t>(back.size());
        ASSERT_EQ(StringFromUnicodeToLocal(u16.data(), back.data(), &length), 1);
        ASSERT_EQ(std::string(back.data(), length), *line.local + '\0');
        int32_t fromWide = static_cast<int32_t>(bytes);
        host_stringFromWindowsUnicode(reinterpret_cast<const char *>(wide.data()), back.data(), &fromWide);
        ASSERT_EQ(std::string(back.data(), fromWide), *line.local + '\0');
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
        if (expected) {
            ASSERT_EQ(r, 1) << std::hex << u;
            ASSERT_EQ(hex(std::string(out, cursor - out)), hex(*expected)) << std::hex << u;
            ++held;
        } else {
            ASSERT_EQ(r, 0) << std::hex << u;
            ASSERT_EQ(cursor, out);
            ASSERT_EQ(out[0], '\x7f');
        }
    }
    EXPECT_GT(held, 127);
}

TEST(LOCAL_SUITE, WindowsUnicodeStopsAtTheFirstUnitThatDoesNotFit) {
    localtest::UnitOracle oracle(kCharset);
    // A unit the charset lacks: a lone surrogate for UTF-8, else the first of
    // a few that some charset here does not hold.
    char16_t missing = 0xD800;
    for (char16_t u : {0x4E00, 0x05D0, 0x0430, 0x00E9, 0x3042}) {
        if (!oracle.bytes(u)) {
            missing = u;
            break;
        }
    }
    const char bytes[] = {'A', 0, static_cast<char>(missing & 0xFF), static_cast<char>(missing >> 8), 'B', 0};
    char target[8];
    std::memset(target, 0x7f, sizeof target);
    int32_t length = 6;
    host_stringFromWindowsUnicode(bytes, target, &length);
    EXPECT_EQ(length, 2);
    EXPECT_STREQ(target, "A");
    // A length that ends inside a unit, or no length at all.
    length = 3;
    host_stringFromWindowsUnicode(bytes, target, &length);
    EXPECT_EQ(length, 2);
    for (int32_t none : {0, -5}) {
        length = none;
        host_stringFromWindowsUnicode(bytes, target, &length);
        EXPECT_EQ(length, 1);
        EXPECT_EQ(target[0], '\0');
    }
    uint16_t wide[4] = {0x7f7f, 0x7f7f, 0x7f7f, 0x7f7f};
    uint32_t wideLength = 0;
    host_stringToWindowsUnicode("", wide, &wideLength);
    EXPECT_EQ(wideLength, 2u);
    EXPECT_EQ(wide[0], 0);
    EXPECT_EQ(wide[1], 0x7f7f);
}

// A list of corpus lines and empty strings, converted as the oracle says.
TEST(LOCAL_SUITE, ListOfStrings) {
    REQUIRE_CORPORA();
    localtest::UnitOracle oracle(kCharset);
    std::u16string list;
    std::string expected;
    std::mt19937 rng(7);
    for (size_t i = 0; i < lines().size(); i += 7) {
        if (rng() % 3 == 0) {
            list += u'\0';
            expected += '\0';
        }
        auto units = testsupport::iconv_to_utf16("UTF-8", lines()[i].utf8);
        list += *units;
        list += u'\0';
        for (char16_t u : *units) expected += oracle.bytes(u).value_or("?");
        expected += '\0';
    }
    expected += '\0';
    auto *block = static_cast<uint16_t *>(HostMalloc(static_cast<uint32_t>(2 * list.size()), 1));
    std::memcpy(block, list.data(), 2 * list.size());
    uint32_t length = static_cast<uint32_t>(2 * list.size());
    StringListFromUnicodeToLocal(&block, &length);
    ASSERT_EQ(length, expected.size());
    EXPECT_EQ(std::string(reinterpret_cast<const char *>(block), length), expected);
    HostFree(block);
}

TEST(LOCAL_SUITE, ListWhoseLastStringHasNoTerminator) {
    // "ab", "" and then "cd" cut by the length before its 0 unit; the odd
    // byte is ignored.
    const char16_t units[] = u"ab\0\0cdXYZ";
    auto *block = static_cast<uint16_t *>(HostMalloc(sizeof units, 1));
    std::memcpy(block, units, sizeof units);
    uint32_t length = 2 * 6 + 1;
    StringListFromUnicodeToLocal(&block, &length);
    ASSERT_EQ(length, 8u);
    EXPECT_EQ(hex(std::string(reinterpret_cast<const char *>(block), length)),
              hex(std::string("ab\0\0cd\0\0", 8)));
    HostFree(block);

    for (uint32_t none : {0u, 1u}) {
        block = static_cast<uint16_t *>(HostMalloc(2, 1));
        length = none;
        StringListFromUnicodeToLocal(&block, &length);
        ASSERT_EQ(length, 1u);
        EXPECT_EQ(reinterpret_cast<const char *>(block)[0], '\0');
        HostFree(block);
    }
}

TEST(LOCAL_SUITE, DirectionEscapingInTheLocalCharset) {
    REQUIRE_CORPORA();
    int checked = 0;
    for (size_t i = 0; i < lines().size(); i += 5) {
        const Line &line = lines()[i];
        if (!line.local) continue;
        const uint32_t room = static_cast<uint32_t>(3 * line.local->size() + 16);
        std::vector<char> a(room, '\x7f'), b(room, '\x7f');
        uint32_t la = room, lb = room;
        StringFromLocalToDirectionEscapedString(a.data(), line.local->c_str(), &la);
        StringFromCharsetToDirectionEscapedString(kLocal, b.data(), line.local->c_str(), &lb);
        EXPECT_EQ(la, lb);
        EXPECT_EQ(a, b);
        ++checked;
    }
    EXPECT_GT(checked, 5);
}

// A UTF-8 line against the same line in the local charset, and against
// changed copies of it.
TEST(LOCAL_SUITE, EquivalenceAcrossEncodings) {
    REQUIRE_CORPORA();
    int checked = 0;
    for (const Line &line : lines()) {
        if (!line.local || line.utf8.size() < 2) continue;
        const char *u = line.utf8.c_str();
        const char *l = line.local->c_str();
        EXPECT_EQ(StringsEquivalent(u, CHARSET_UTF8, l, kLocal, 0), 1) << line.utf8;
        EXPECT_EQ(StringsEquivalent(l, CHARSET_LATIN1, u, CHARSET_UTF8, 1), 1) << line.utf8;
        EXPECT_EQ(StringsEquivalent(l, CHARSET_NONE, l, CHARSET_UTF16, 0), 1) << line.utf8;
        // One string a character short of the other.
        std::string shorter = line.local->substr(0, line.local->size() - 1);
        if (static_cast<unsigned char>(line.local->back()) < 0x80) {
            EXPECT_EQ(StringsEquivalent(u, CHARSET_UTF8, shorter.c_str(), kLocal, 0), 0);
            EXPECT_EQ(StringsEquivalent(shorter.c_str(), kLocal, u, CHARSET_UTF8, 0), 0);
        }
        // The last ASCII letter's case changed: equal only when case is ignored.
        std::string other = *line.local;
        size_t k = other.find_last_of("abcdefghijklmnopqrstuvwxyz");
        if (k != std::string::npos && (k == 0 || static_cast<unsigned char>(other[k - 1]) < 0x80)) {
            other[k] = static_cast<char>(other[k] - 'a' + 'A');
            EXPECT_EQ(StringsEquivalent(u, CHARSET_UTF8, other.c_str(), kLocal, 0), 0);
            EXPECT_EQ(StringsEquivalent(u, CHARSET_UTF8, other.c_str(), kLocal, 1), 1);
        }
        ++checked;
        if (HasFailure()) return;
    }
    EXPECT_GT(checked, 10);
}

// The cases that only one local charset shows.
TEST(LOCAL_SUITE, CasesOfOneCharsetOnly) {
    char target[32];
    uint32_t length = 0;
    if constexpr (kLocal == CHARSET_LATIN1) {
        // e acute then the euro sign, which Latin-1 lacks.
        EXPECT_EQ(StringFromUTF8ToLocal("\xC3\xA9\xE2\x82\xAC", target, &length), 0);
        EXPECT_EQ(length, 3u);
        EXPECT_EQ(hex(std::string(target, 3)), hex(std::string("\xE9?\0", 3)));
        length = 0;
        EXPECT_EQ(StringFromLocalToUTF8("A\xE9", target, &length), 1);
        EXPECT_EQ(length, 4u);
        EXPECT_STREQ(target, "A\xC3\xA9");
        const char wide[] = {0x41, 0, static_cast<char>(0xE9), 0, 0, 0};
        int32_t wideLength = 6;
        host_stringFromWindowsUnicode(wide, target, &wideLength);
        EXPECT_EQ(wideLength, 3);
        EXPECT_STREQ(target, "A\xE9");
        wideLength = 2;
        host_stringFromWindowsUnicode(wide, target, &wideLength);
        EXPECT_EQ(wideLength, 2);
        EXPECT_STREQ(target, "A");
    } else if constexpr (kLocal == CHARSET_KOI8R) {
        EXPECT_EQ(StringFromLocalToUTF8("\xC1", target, &length), 1);
        EXPECT_EQ(length, 3u);
        EXPECT_STREQ(target, "\xD0\xB0");
    } else if constexpr (kLocal == CHARSET_EUCJP) {
        std::memset(target, 0x7f, sizeof target);
        length = 77;
        EXPECT_EQ(StringFromLocalToUTF8("", target, &length), 1);
        EXPECT_EQ(length, 1u);
        EXPECT_EQ(target[0], '\0');
        // A byte no character starts with: what came before stays, unterminated.
        std::memset(target, 0x7f, sizeof target);
        length = 77;
        EXPECT_EQ(StringFromLocalToUTF8("A\x80"
                                        "B",
                                        target, &length),
                  0);
        EXPECT_EQ(length, 77u);
        EXPECT_EQ(target[0], 'A');
        EXPECT_EQ(target[1], '\x7f');
    } else if constexpr (kLocal != CHARSET_UTF8) {
        // Through UTF-16: a room too small leaves the empty string, length 0;
        // a room of 0 is not written at all.
        std::memset(target, 0x7f, sizeof target);
        length = 3;
        EXPECT_EQ(StringFromLocalToUTF8("abcd", target, &length), 1);
        EXPECT_EQ(length, 0u);
        EXPECT_EQ(target[0], '\0');
        std::memset(target, 0x7f, sizeof target);
        length = 0;
        EXPECT_EQ(StringFromLocalToUTF8("abcd", target, &length), 1);
        EXPECT_EQ(length, 0u);
        EXPECT_EQ(target[0], '\x7f');
        length = 5;
        EXPECT_EQ(StringFromLocalToUTF8("abcd", target, &length), 1);
        EXPECT_EQ(length, 5u);
        EXPECT_STREQ(target, "abcd");
    }
}

}  // namespace
