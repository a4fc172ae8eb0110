// UTF-8 <-> UTF-16 core: glibc iconv as oracle on valid text, sharp cases for
// the ill-formed input rules, and every capacity and cut point.
#include <gtest/gtest.h>

#include <cstring>
#include <string>
#include <vector>

#include "test_support.h"
#include "textconv.h"

using testsupport::hex;

namespace {

constexpr uint16_t kSentinel = 0x5A5A;

struct Decoded {
    uint32_t result;
    std::u16string units;  // everything written (up to the first untouched unit on failure)
    uint32_t written;
};

// Decodes with the given capacity into a sentinel-filled buffer; checks that
// nothing past the reported (or, on failure, produced) output is touched.
Decoded decode(const std::string &in, uint32_t cap = 0xFFFFFFFF) {
    const size_t room = cap == 0xFFFFFFFF ? 2 * in.size() + 8 : cap / 2 + 8;
    std::vector<uint16_t> buf(room, kSentinel);
    uint32_t written = 0xDEADBEEF;
    uint32_t r = ConvertUTF8toUTF16(in.data(), static_cast<uint32_t>(in.size()), buf.data(),
                                    cap == 0xFFFFFFFF ? static_cast<uint32_t>(room * 2) : cap, &written);
    size_t n = r == 0 ? written / 2 : 0;
    if (r != 0) {
        EXPECT_EQ(written, 0xDEADBEEF) << "written stored on failure";
        while (n < buf.size() && buf[n] != kSentinel) ++n;
    }
    for (size_t i = n; i < buf.size(); ++i) EXPECT_EQ(buf[i], kSentinel) << "unit " << i << " touched";
    return {r, std::u16string(buf.begin(), buf.begin() + n), written};
}

std::string encode(const std::u16string &in, uint32_t cap, uint32_t *result, uint32_t *written) {
    std::string buf(cap + 8, '\xFF');
    *written = 0xDEADBEEF;
    *result = ConvertUTF16toUTF8(reinterpret_cast<const uint16_t *>(in.data()),
                                 static_cast<uint32_t>(in.size() * 2), buf.data(), cap, written);
    size_t n = *result == 0 ? *written : buf.find('\xFF');
    EXPECT_EQ(buf.find_first_not_of('\xFF', n), std::string::npos) << "byte past the output touched";
    return buf.substr(0, n);
}

// Ill-formed and boundary input, each with the exact units it decodes to.
struct DecodeCase {
    const char *what;
    std::string in;
    std::u16string out;
};
const std::vector<DecodeCase> &decode_cases() {
    static const std::vector<DecodeCase> cases = {
        {"ascii", "Az\x7F", u"Az\x7F"},
        {"embedded NUL is a character", std::string("a\0b", 3), std::u16string(u"a\0b", 3)},
        {"2-byte bounds", "\xC2\x80\xDF\xBF", u"\x0080\x07FF"},
        {"3-byte bounds", "\xE0\xA0\x80\xEF\xBF\xBF", u"\x0800\xFFFF"},
        {"4-byte to a pair", "\xF0\x9F\x98\x80", u"\xD83D\xDE00"},
        {"largest scalar", "\xF4\x8F\xBF\xBF", u"\xDBFF\xDFFF"},
        {"overlong 2-byte then stray", "\xC0\x80", u"\xFFFD\xFFFD"},
        {"overlong C1", "\xC1\xBF", u"\xFFFD\xFFFD"},
        {"overlong 3-byte", "\xE0\x80\x80", u"\xFFFD\xFFFD\xFFFD"},
        {"overlong 4-byte", "\xF0\x8F\xBF\xBF", u"\xFFFD\xFFFD\xFFFD\xFFFD"},
        {"encoded surrogates", "\xED\xA0\x80\xED\xBF\xBF", u"\xFFFD\xFFFD\xFFFD\xFFFD\xFFFD\xFFFD"},
        {"just below surrogates", "\xED\x9F\xBF", u"\xD7FF"},
        {"beyond U+10FFFF consumes all",
         "\xF4\x90\x80\x80"
         "A",
         u"\xFFFD"
         "A"},
        {"F7 form beyond Unicode", "\xF7\xBF\xBF\xBF", u"\xFFFD"},
        {"5-byte form",
         "\xF8\x88\x80\x80\x80"
         "A",
         u"\xFFFD"
         "A"},
        {"overlong 5-byte", "\xF8\x80\x80\x80\x80", u"\xFFFD\xFFFD\xFFFD\xFFFD\xFFFD"},
        {"6-byte form", "\xFD\xBF\xBF\xBF\xBF\xBF", u"\xFFFD"},
        {"FE and FF leads",
         "\xFE\x80\x80\x80\x80\x80\xFF"
         "A",
         u"\xFFFD\xFFFD\xFFFD\xFFFD\xFFFD\xFFFD\xFFFD"
         "A"},
        {"stray continuation",
         "a\x80\xBF"
         "b",
         u"a\xFFFD\xFFFD"
         "b"},
        // A trailing position holding a non-continuation byte: one U+FFFD for
        // the lead, then every following byte decodes on its own.
        {"ascii in 3-byte", "\xE3\x41\x42",
         u"\xFFFD"
         "AB"},
        {"ascii after one good trail", "\xE3\x81\x41",
         u"\xFFFD\xFFFD"
         "A"},
        {"ascii in 2-byte", "\xC3\x41",
         u"\xFFFD"
         "A"},
        {"lead in lead", "\xE3\xE3\x81\x82", u"\xFFFD\x3042"},
        {"ascii in 4-byte", "\xF0\x9F\x98\x41",
         u"\xFFFD\xFFFD\xFFFD"
         "A"},
        {"NUL in 2-byte", std::string("\xC3\0", 2), std::u16string(u"\xFFFD\0", 2)},
        {"broken sequence at the end", "\xE3\x41",
         u"\xFFFD"
         "A"},
        {"ascii in 6-byte", "\xFC\x80\x41",
         u"\xFFFD\xFFFD"
         "A"},
    };
    return cases;
}

TEST(ConvertUTF8toUTF16, IllFormedInputTable) {
    for (const auto &c : decode_cases()) {
        Decoded d = decode(c.in);
        EXPECT_EQ(d.result, 0u) << c.what;
        EXPECT_EQ(hex(d.units), hex(c.out)) << c.what;
        EXPECT_EQ(d.written, c.out.size() * 2) << c.what;
    }
}

TEST(ConvertUTF8toUTF16, EmptyInputWritesZeroWithoutReading) {
    uint32_t written = 77;
    EXPECT_EQ(ConvertUTF8toUTF16(nullptr, 0, nullptr, 0, &written), 0u);
    EXPECT_EQ(written, 0u);
}

TEST(ConvertUTF8toUTF16, SequenceRunningPastTheEndIsIncomplete) {
    // Every proper prefix of a multi-byte sequence, after some text.
    for (std::string seq : {"\xC3\xA9", "\xE3\x81\x82", "\xF0\x9F\x98\x80", "\xF8\x88\x80\x80\x80",
                            "\xFC\x84\x80\x80\x80\x80", "\xE0\x80\x80", "\xED\xA0\x80"}) {
        for (size_t k = 1; k < seq.size(); ++k) {
            Decoded d = decode("ab" + seq.substr(0, k));
            EXPECT_EQ(d.result, 1u) << hex(seq) << " cut at " << k;
            EXPECT_EQ(hex(d.units), hex(std::u16string(u"ab"))) << hex(seq);
        }
    }
}

// Valid text of every kind: random, then every corpus, against iconv.
TEST(ConvertUTF8toUTF16, RandomValidTextMatchesIconv) {
    for (uint32_t seed = 1; seed <= 300; ++seed) {
        std::string s = testsupport::random_utf8(seed, seed % 97 + (seed % 7) * 300);
        Decoded d = decode(s);
        ASSERT_EQ(d.result, 0u);
        ASSERT_EQ(hex(d.units), hex(*testsupport::iconv_to_utf16("UTF-8", s))) << seed;
    }
}

TEST(ConvertUTF8toUTF16, CorporaMatchIconvBothWays) {
    auto names = testsupport::corpus_files(".utf8.txt");
    if (names.empty()) GTEST_SKIP() << "corpora not available";
    for (const auto &name : names) {
        std::string text = *testsupport::read_corpus(name);
        Decoded d = decode(text);
        ASSERT_EQ(d.result, 0u) << name;
        std::u16string want = *testsupport::iconv_to_utf16("UTF-8", text);
        EXPECT_TRUE(d.units == want) << name;
        uint32_t result = 9, written = 0;
        std::string back = encode(want, static_cast<uint32_t>(text.size()), &result, &written);
        EXPECT_EQ(result, 0u) << name;
        EXPECT_TRUE(back == text) << name;
    }
}

// Every capacity below what the whole output needs: result 2, written not
// stored, and exactly the whole characters that fit are in the target.
TEST(ConvertUTF8toUTF16, EveryCapacityCut) {
    const std::string in = "a\xC3\xA9\xE3\x81\x82\xF0\x9F\x98\x80\xE3\x41\xF4\x90\x80\x80\xC0\x80z";
    Decoded full = decode(in);
    ASSERT_EQ(full.result, 0u);
    for (uint32_t cap = 0; cap < full.written; ++cap) {
        Decoded d = decode(in, cap);
        EXPECT_EQ(d.result, 2u) << cap;
        size_t fit = cap / 2;
        // A surrogate pair is written whole or not at all.
        if (fit > 0 && full.units[fit - 1] >= 0xD800 && full.units[fit - 1] <= 0xDBFF) --fit;
        EXPECT_EQ(hex(d.units), hex(full.units.substr(0, fit))) << cap;
    }
    EXPECT_EQ(decode(in, full.written).result, 0u);
    EXPECT_EQ(decode(in, full.written + 1).result, 0u);
}

TEST(ConvertUTF16toUTF8, SurrogateRules) {
    struct {
        std::u16string in;
        std::string out;
    } cases[] = {
        {u"\xD83D\xDE00", "\xF0\x9F\x98\x80"},
        {u"\xDBFF\xDFFF", "\xF4\x8F\xBF\xBF"},
        {u"\xDC00", "\xED\xB0\x80"},
        {u"\xD800", "\xED\xA0\x80"},
        {u"\xD800"
         "A",
         "\xED\xA0\x80"
         "A"},
        {u"\xD800\xE000", "\xED\xA0\x80\xEE\x80\x80"},
        {u"\xD800\xD800\xDC00", "\xED\xA0\x80\xF0\x90\x80\x80"},
        {u"\xDC00\xD800", "\xED\xB0\x80\xED\xA0\x80"},
        {std::u16string(u"\xD800\0", 2), std::string("\xED\xA0\x80\0", 4)},
    };
    for (const auto &c : cases) {
        uint32_t result = 9, written = 0;
        std::string got = encode(c.in, 64, &result, &written);
        EXPECT_EQ(result, 0u);
        EXPECT_EQ(hex(got), hex(c.out)) << hex(c.in);
        EXPECT_EQ(written, c.out.size());
    }
    uint32_t written = 5;
    EXPECT_EQ(ConvertUTF16toUTF8(nullptr, 0, nullptr, 0, &written), 0u);
    EXPECT_EQ(written, 0u);
}

TEST(ConvertUTF16toUTF8, RandomValidTextMatchesIconvAndEveryCapacityCut) {
    for (uint32_t seed = 1; seed <= 200; ++seed) {
        std::string utf8 = testsupport::random_utf8(seed, seed % 61 + (seed % 5) * 200);
        std::u16string units = *testsupport::iconv_to_utf16("UTF-8", utf8);
        uint32_t result = 9, written = 0;
        ASSERT_EQ(hex(encode(units, static_cast<uint32_t>(utf8.size()), &result, &written)), hex(utf8));
        ASSERT_EQ(result, 0u);
        if (seed > 20) continue;
        // Cut the capacity everywhere: the whole characters that fit.
        for (uint32_t cap = 0; cap < utf8.size(); ++cap) {
            std::string got = encode(units, cap, &result, &written);
            ASSERT_EQ(result, 2u);
            size_t fit = cap;
            while (fit > 0 && (static_cast<uint8_t>(utf8[fit]) & 0xC0) == 0x80) --fit;
            ASSERT_EQ(hex(got), hex(utf8.substr(0, fit))) << seed << " cap " << cap;
        }
    }
}

TEST(FromUnicodeToUTF8, EveryUnit) {
    for (uint32_t u = 0; u <= 0xFFFF; ++u) {
        char buf[8] = {};
        char *cursor = buf;
        ASSERT_EQ(FromUnicodeToUTF8(u | 0xABCD0000u, &cursor), 1);  // high bits ignored
        char want[8];
        uint8_t n = 0;
        FromUCS4toUTF8(u, want, &n);
        ASSERT_EQ(hex(std::string(buf, cursor - buf)), hex(std::string(want, n))) << u;
    }
}

// The string wrappers: terminators, capacity, and a sequence cut short by
// the NUL (never completed by it or by what lies behind it).
TEST(StringFromUTF8ToUnicode, TerminatorAndCapacity) {
    uint16_t out[8];
    uint32_t len = 2;
    EXPECT_EQ(StringFromUTF8ToUnicode("A", out, &len), 0);
    EXPECT_EQ(len, 0u);
    len = 4;
    EXPECT_EQ(StringFromUTF8ToUnicode("A", out, &len), 1);
    EXPECT_EQ(len, 4u);
    EXPECT_EQ(out[0], 0x41);
    EXPECT_EQ(out[1], 0);
    len = 2;
    EXPECT_EQ(StringFromUTF8ToUnicode("", out, &len), 1);
    EXPECT_EQ(len, 2u);
    len = 1;
    EXPECT_EQ(StringFromUTF8ToUnicode("", out, &len), 0);
    EXPECT_EQ(len, 0u);
}

TEST(StringFromUTF8ToUnicode, SequenceCutShortByTheTerminatorFails) {
    // Bytes behind the NUL would complete each sequence: they must not be read.
    for (std::string s : {std::string("ab\xC3\0\xA9\0", 6), std::string("\xE3\x81\0\x82\0", 5),
                          std::string("\xE3\0\x81\x82\0", 5), std::string("x\xF0\x9F\x98\0\x80\0", 7)}) {
        uint16_t out[16];
        uint32_t len = sizeof out;
        EXPECT_EQ(StringFromUTF8ToUnicode(s.data(), out, &len), 0) << hex(s);
        EXPECT_EQ(len, 0u);
    }
    uint16_t out[16];
    uint32_t len = sizeof out;
    EXPECT_EQ(StringFromUTF8ToUnicode("\xE3\x41\x42", out, &len), 1);
    EXPECT_EQ(hex(std::u16string(reinterpret_cast<char16_t *>(out), len / 2)), hex(std::u16string(u"\xFFFD"
                                                                                                  "AB\0",
                                                                                                  4)));
}

TEST(StringFromUnicodeToUTF8, TerminatorAndCapacity) {
    const uint16_t in[] = {0x41, 0xE9, 0x20AC, 0xD83D, 0xDE00, 0};
    const std::string want("A\xC3\xA9\xE2\x82\xAC\xF0\x9F\x98\x80\0", 11);
    char out[16];
    for (uint32_t cap = 0; cap <= 12; ++cap) {
        uint32_t len = cap;
        int ok = StringFromUnicodeToUTF8(in, out, &len);
        EXPECT_EQ(ok, cap >= 11) << cap;
        EXPECT_EQ(len, cap >= 11 ? 11u : 0u) << cap;
    }
    EXPECT_EQ(hex(std::string(out, 11)), hex(want));
    const uint16_t lone[] = {0xD800, 0};
    uint32_t len = 8;
    EXPECT_EQ(StringFromUnicodeToUTF8(lone, out, &len), 1);
    EXPECT_EQ(hex(std::string(out, len)), hex(std::string("\xED\xA0\x80\0", 4)));
}

// One character at a time: result, count, units and how far the cursor goes.
TEST(FromUTF8ToUnicode, OneCharacterTable) {
    struct {
        std::string in;  // followed by a NUL and a guard byte that must never be read
        int ok;
        std::u16string out;
        size_t advance;
    } cases[] = {
        {"A", 1, u"A", 1},
        {"", 1, std::u16string(1, u'\0'), 1},
        {"\xC3\xA9", 1, u"\xE9", 2},
        {"\xE2\x82\xAC", 1, u"\x20AC", 3},
        {"\xF0\x9F\x98\x80", 1, u"\xD83D\xDE00", 4},
        {"\xC0\x80", 1, u"\xFFFD\xFFFD", 2},      // illegal 2-byte: two units fit
        {"\xE0\x80\x80", 0, u"\xFFFD\xFFFD", 3},  // illegal 3-byte: no room for the third
        {"\xF4\x90\x80\x80", 1, u"\xFFFD", 4},
        {"\x80", 1, u"\xFFFD", 1},
        {"\xE3\x41\x42", 1, u"\xFFFD", 1},  // the A and B come with the next calls
        {"\xE3\x81\x41", 1, u"\xFFFD", 1},
        {"\xC3", 0, u"", 1},  // cut short by the NUL: stop on it
        {"\xE3\x81", 0, u"", 2},
        {"\xF0\x9F\x98", 0, u"", 3},
    };
    for (const auto &c : cases) {
        std::string buf = c.in + '\0' + '\x80';
        const char *cursor = buf.data();
        uint16_t out[3] = {kSentinel, kSentinel, kSentinel};
        uint32_t written = 99;
        EXPECT_EQ(FromUTF8ToUnicode(&cursor, out, &written), c.ok) << hex(c.in);
        EXPECT_EQ(static_cast<size_t>(cursor - buf.data()), c.advance) << hex(c.in);
        size_t n = 0;
        while (n < 2 && out[n] != kSentinel) ++n;
        EXPECT_EQ(hex(std::u16string(out, out + n)), hex(c.out)) << hex(c.in);
        EXPECT_EQ(out[2], kSentinel);
        EXPECT_EQ(written, c.ok ? c.out.size() * 2 : 99u) << hex(c.in);
    }
}

std::u16string list_units(char *list, uint32_t len) {
    return std::u16string(reinterpret_cast<char16_t *>(list), len / 2);
}

TEST(StringListFromUTF8toUTF16, ListsAndTerminators) {
    struct {
        std::string in;
        std::u16string out;
    } cases[] = {
        {std::string("ab\0\0c\0", 6), std::u16string(u"ab\0\0c\0", 6)},
        {std::string("\xC3\xA9\0\xF0\x9F\x98\x80\0", 8), std::u16string(u"\xE9\0\xD83D\xDE00\0", 5)},
        {std::string("ab\0cd", 5), std::u16string(u"ab\0cd\0", 6)},  // last string without its NUL
        {std::string("\xE3\x41\0", 3), std::u16string(u"\xFFFD"
                                                      "A\0",
                                                      3)},
        {std::string("\x80\x80\x80\x80", 4), std::u16string(u"\xFFFD\xFFFD\xFFFD\xFFFD\0", 5)},
        {std::string(1, '\0'), std::u16string(1, u'\0')},
    };
    for (const auto &c : cases) {
        std::string input = c.in;
        char *list = input.data();
        uint32_t len = static_cast<uint32_t>(input.size());
        ASSERT_EQ(StringListFromUTF8toUTF16(&list, &len), 1) << hex(c.in);
        EXPECT_NE(list, input.data());
        EXPECT_EQ(hex(list_units(list, len)), hex(c.out));
        EXPECT_EQ(input, c.in) << "input list changed";
        HostFree(list);
    }
    std::string empty = "x";
    char *list = empty.data();
    uint32_t len = 0;
    ASSERT_EQ(StringListFromUTF8toUTF16(&list, &len), 1);
    EXPECT_NE(list, empty.data());
    EXPECT_EQ(len, 0u);
    HostFree(list);
}

TEST(StringListFromUTF8toUTF16, SequenceCutShortByATerminatorFailsAndChangesNothing) {
    for (std::string in : {std::string("ab\0\xC3\0\xA9\0", 7), std::string("\xE3\x81", 2),
                           std::string("ok\0\xF0\x9F\x98", 6)}) {
        char *list = in.data();
        uint32_t len = static_cast<uint32_t>(in.size());
        EXPECT_EQ(StringListFromUTF8toUTF16(&list, &len), 0) << hex(in);
        EXPECT_EQ(list, in.data());
        EXPECT_EQ(len, in.size());
    }
}

TEST(StringListFromUTF8toUTF16, CorpusLinesMatchIconv) {
    auto text = testsupport::read_corpus("chinese.utf8.txt");
    if (!text) GTEST_SKIP() << "corpora not available";
    std::string in = *text;
    for (char &c : in)
        if (c == '\n') c = '\0';
    std::u16string want = *testsupport::iconv_to_utf16("UTF-8", in);
    if (in.back() != '\0') want += u'\0';
    char *list = in.data();
    uint32_t len = static_cast<uint32_t>(in.size());
    ASSERT_EQ(StringListFromUTF8toUTF16(&list, &len), 1);
    EXPECT_TRUE(list_units(list, len) == want);
    HostFree(list);
}

}  // namespace
