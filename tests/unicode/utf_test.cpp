// UTF-8 <-> UTF-16 core: glibc iconv as oracle on valid text, the ill-formed
// input rules, and every capacity and cut point.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <random>
#include <string>
#include <vector>

#include "test_support.h"
#include "textconv.h"

using testsupport::hex;
using namespace std::string_literals;

namespace {

constexpr uint16_t kSentinel = 0x5A5A;

struct Decoded {
    uint32_t result;
    std::u16string units;  // on failure: up to the first untouched unit
    uint32_t written;
};

// Decodes into a sentinel-filled buffer; nothing past the output is touched
// and written is not stored on failure.
Decoded decode(const std::string &in, uint32_t cap = 0xFFFFFFFF) {
    const size_t room = cap == 0xFFFFFFFF ? 2 * in.size() + 8 : cap / 2 + 8;
    std::vector<uint16_t> buf(room, kSentinel);
    uint32_t written = 0xDEADBEEF;
    const uint32_t r =
        ConvertUTF8toUTF16(in.data(), static_cast<uint32_t>(in.size()), buf.data(),
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
    const size_t n = *result == 0 ? *written : buf.find('\xFF');
    EXPECT_EQ(buf.find_first_not_of('\xFF', n), std::string::npos) << "byte past the output touched";
    return buf.substr(0, n);
}

std::u16string units_of(const void *p, uint32_t bytes) {
    return std::u16string(static_cast<const char16_t *>(p), bytes / 2);
}

}  // namespace

// Ill-formed and boundary input, each with the exact units it decodes to. A
// trailing position holding a non-continuation byte: one U+FFFD for the lead,
// then every following byte decodes on its own.
TEST(ConvertUTF8toUTF16, IllFormedInputTable) {
    const std::pair<std::string, std::u16string> cases[] = {
        // clang-format off
        {"Az\x7F", u"Az\x7F"}, {"a\0b"s, u"a\0b"s},
        {"\xC2\x80\xDF\xBF", u"\x0080\x07FF"}, {"\xE0\xA0\x80\xEF\xBF\xBF", u"\x0800\xFFFF"},
        {"\xF0\x9F\x98\x80", u"\xD83D\xDE00"}, {"\xF4\x8F\xBF\xBF", u"\xDBFF\xDFFF"},
        {"\xC0\x80", u"\xFFFD\xFFFD"}, {"\xC1\xBF", u"\xFFFD\xFFFD"},                            // overlong
        {"\xE0\x80\x80", u"\xFFFD\xFFFD\xFFFD"}, {"\xF0\x8F\xBF\xBF", u"\xFFFD\xFFFD\xFFFD\xFFFD"},
        {"\xED\xA0\x80\xED\xBF\xBF", u"\xFFFD\xFFFD\xFFFD\xFFFD\xFFFD\xFFFD"}, {"\xED\x9F\xBF", u"\xD7FF"},
        {"\xF4\x90\x80\x80" "A", u"\xFFFD" "A"}, {"\xF7\xBF\xBF\xBF", u"\xFFFD"},               // beyond U+10FFFF
        {"\xF8\x88\x80\x80\x80" "A", u"\xFFFD" "A"}, {"\xF8\x80\x80\x80\x80", u"\xFFFD\xFFFD\xFFFD\xFFFD\xFFFD"},
        {"\xFD\xBF\xBF\xBF\xBF\xBF", u"\xFFFD"},
        {"\xFE\x80\x80\x80\x80\x80\xFF" "A", u"\xFFFD\xFFFD\xFFFD\xFFFD\xFFFD\xFFFD\xFFFD" "A"},
        {"a\x80\xBF" "b", u"a\xFFFD\xFFFD" "b"}, {"\xE3\x41\x42", u"\xFFFD" "AB"},
        {"\xE3\x81\x41", u"\xFFFD\xFFFD" "A"}, {"\xC3\x41", u"\xFFFD" "A"}, {"\xE3\xE3\x81\x82", u"\xFFFD\x3042"},
        {"\xF0\x9F\x98\x41", u"\xFFFD\xFFFD\xFFFD" "A"}, {"\xC3\0"s, u"\xFFFD\0"s}, {"\xFC\x80\x41", u"\xFFFD\xFFFD" "A"},
        // clang-format on
    };
    for (const auto &[in, out] : cases) {
        const Decoded d = decode(in);
        EXPECT_TRUE(d.result == 0 && d.written == out.size() * 2) << hex(in);
        EXPECT_EQ(hex(d.units), hex(out)) << hex(in);
    }
}

TEST(ConvertUTF, EmptyInputWritesZeroWithoutReading) {
    uint32_t written = 77;
    EXPECT_EQ(ConvertUTF8toUTF16(nullptr, 0, nullptr, 0, &written), 0u);
    EXPECT_EQ(written, 0u);
    written = 5;
    EXPECT_EQ(ConvertUTF16toUTF8(nullptr, 0, nullptr, 0, &written), 0u);
    EXPECT_EQ(written, 0u);
}

// Every proper prefix of a multi-byte sequence, after some text: incomplete.
TEST(ConvertUTF8toUTF16, SequenceRunningPastTheEndIsIncomplete) {
    for (std::string seq : {"\xC3\xA9", "\xE3\x81\x82", "\xF0\x9F\x98\x80", "\xF8\x88\x80\x80\x80",
                            "\xFC\x84\x80\x80\x80\x80", "\xE0\x80\x80", "\xED\xA0\x80"}) {
        for (size_t k = 1; k < seq.size(); ++k) {
            const Decoded d = decode("ab" + seq.substr(0, k));
            EXPECT_TRUE(d.result == 1 && d.units == u"ab") << hex(seq) << " cut at " << k;
        }
    }
}

TEST(ConvertUTF8toUTF16, RandomValidTextMatchesIconv) {
    for (uint32_t seed = 1; seed <= 300; ++seed) {
        const std::string s = testsupport::random_utf8(seed, seed % 97 + (seed % 7) * 300);
        const Decoded d = decode(s);
        ASSERT_EQ(d.result, 0u);
        ASSERT_EQ(hex(d.units), hex(*testsupport::iconv_to_utf16("UTF-8", s))) << seed;
    }
}

TEST(ConvertUTF8toUTF16, CorporaMatchIconvBothWays) {
    const auto names = testsupport::corpus_files(".utf8.txt");
    if (names.empty()) GTEST_SKIP() << "corpora not available";
    for (const auto &name : names) {
        const std::string text = *testsupport::read_corpus(name);
        const Decoded d = decode(text);
        const std::u16string want = *testsupport::iconv_to_utf16("UTF-8", text);
        EXPECT_TRUE(d.result == 0 && d.units == want) << name;
        uint32_t result = 9, written = 0;
        EXPECT_TRUE(encode(want, static_cast<uint32_t>(text.size()), &result, &written) == text) << name;
        EXPECT_EQ(result, 0u) << name;
    }
}

// Every capacity short of the whole output: result 2 and exactly the whole
// characters that fit (a surrogate pair whole or not at all).
TEST(ConvertUTF8toUTF16, EveryCapacityCut) {
    const std::string in = "a\xC3\xA9\xE3\x81\x82\xF0\x9F\x98\x80\xE3\x41\xF4\x90\x80\x80\xC0\x80z";
    const Decoded full = decode(in);
    ASSERT_EQ(full.result, 0u);
    for (uint32_t cap = 0; cap < full.written; ++cap) {
        const Decoded d = decode(in, cap);
        size_t fit = cap / 2;
        if (fit > 0 && full.units[fit - 1] >= 0xD800 && full.units[fit - 1] <= 0xDBFF) --fit;
        EXPECT_EQ(d.result, 2u) << cap;
        EXPECT_EQ(hex(d.units), hex(full.units.substr(0, fit))) << cap;
    }
    EXPECT_EQ(decode(in, full.written).result, 0u);
    EXPECT_EQ(decode(in, full.written + 1).result, 0u);
}

// Lone surrogates are encoded as they are; only a high-low pair is combined.
TEST(ConvertUTF16toUTF8, SurrogateRules) {
    const std::pair<std::u16string, std::string> cases[] = {
        // clang-format off
        {u"\xD83D\xDE00", "\xF0\x9F\x98\x80"}, {u"\xDBFF\xDFFF", "\xF4\x8F\xBF\xBF"}, {u"\xDC00", "\xED\xB0\x80"},
        {u"\xD800" "A", "\xED\xA0\x80" "A"}, {u"\xD800\xE000", "\xED\xA0\x80\xEE\x80\x80"},
        {u"\xD800\xD800\xDC00", "\xED\xA0\x80\xF0\x90\x80\x80"}, {u"\xDC00\xD800", "\xED\xB0\x80\xED\xA0\x80"},
        {u"\xD800\0"s, "\xED\xA0\x80\0"s},
        // clang-format on
    };
    for (const auto &[in, out] : cases) {
        uint32_t result = 9, written = 0;
        EXPECT_EQ(hex(encode(in, 64, &result, &written)), hex(out)) << hex(in);
        EXPECT_TRUE(result == 0 && written == out.size()) << hex(in);
    }
}

TEST(ConvertUTF16toUTF8, RandomValidTextMatchesIconvAndEveryCapacityCut) {
    for (uint32_t seed = 1; seed <= 200; ++seed) {
        const std::string utf8 = testsupport::random_utf8(seed, seed % 61 + (seed % 5) * 200);
        const std::u16string units = *testsupport::iconv_to_utf16("UTF-8", utf8);
        uint32_t result = 9, written = 0;
        ASSERT_EQ(hex(encode(units, static_cast<uint32_t>(utf8.size()), &result, &written)), hex(utf8));
        ASSERT_EQ(result, 0u);
        for (uint32_t cap = 0; seed <= 20 && cap < utf8.size(); ++cap) {
            const std::string got = encode(units, cap, &result, &written);
            size_t fit = cap;
            while (fit > 0 && (static_cast<uint8_t>(utf8[fit]) & 0xC0) == 0x80) --fit;
            ASSERT_EQ(result, 2u);
            ASSERT_EQ(hex(got), hex(utf8.substr(0, fit))) << seed << " cap " << cap;
        }
    }
}

TEST(FromUnicodeToUTF8, EveryUnit) {
    for (uint32_t u = 0; u <= 0xFFFF; ++u) {
        char buf[8] = {}, want[8], *cursor = buf;
        uint8_t n = 0;
        ASSERT_EQ(FromUnicodeToUTF8(u | 0xABCD0000u, &cursor), 1);  // high bits ignored
        FromUCS4toUTF8(u, want, &n);
        ASSERT_EQ(hex(std::string(buf, cursor - buf)), hex(std::string(want, n))) << u;
    }
}

// The string wrappers: capacity includes the terminator; nothing is written
// on failure.
TEST(StringWrappers, TerminatorAndCapacity) {
    const struct {
        const char *in;
        uint32_t cap, len;  // len 0: failure
    } toUnicode[] = {{"A", 2, 0}, {"A", 4, 4}, {"", 2, 2}, {"", 1, 0}};
    for (const auto &c : toUnicode) {
        uint16_t out[8] = {};
        uint32_t len = c.cap;
        EXPECT_EQ(StringFromUTF8ToUnicode(c.in, out, &len), c.len != 0) << c.in << " " << c.cap;
        EXPECT_EQ(len, c.len);
        EXPECT_TRUE(c.len != 4 || (out[0] == 0x41 && out[1] == 0));
    }
    const uint16_t in[] = {0x41, 0xE9, 0x20AC, 0xD83D, 0xDE00, 0}, lone[] = {0xD800, 0};
    char out[16];
    for (uint32_t cap = 0; cap <= 12; ++cap) {
        uint32_t len = cap;
        EXPECT_EQ(StringFromUnicodeToUTF8(in, out, &len), cap >= 11) << cap;
        EXPECT_EQ(len, cap >= 11 ? 11u : 0u) << cap;
    }
    EXPECT_EQ(hex(std::string(out, 11)), hex("A\xC3\xA9\xE2\x82\xAC\xF0\x9F\x98\x80\0"s));
    uint32_t len = 8;
    EXPECT_EQ(StringFromUnicodeToUTF8(lone, out, &len), 1);
    EXPECT_EQ(hex(std::string(out, len)), hex("\xED\xA0\x80\0"s));
}

// A sequence cut short by the NUL fails; the bytes behind the NUL, which
// would complete it, are never read.
TEST(StringFromUTF8ToUnicode, SequenceCutShortByTheTerminatorFails) {
    for (std::string s :
         {"ab\xC3\0\xA9\0"s, "\xE3\x81\0\x82\0"s, "\xE3\0\x81\x82\0"s, "x\xF0\x9F\x98\0\x80\0"s}) {
        uint16_t out[16];
        uint32_t len = sizeof out;
        EXPECT_EQ(StringFromUTF8ToUnicode(s.data(), out, &len), 0) << hex(s);
        EXPECT_EQ(len, 0u);
    }
    uint16_t out[16];
    uint32_t len = sizeof out;
    EXPECT_EQ(StringFromUTF8ToUnicode("\xE3\x41\x42", out, &len), 1);
    EXPECT_EQ(hex(units_of(out, len)), hex(u"\xFFFD"
                                           "AB\0"s));
}

// One character at a time: result, units and how far the cursor goes. The
// input is followed by a NUL and a byte that must never be read.
TEST(FromUTF8ToUnicode, OneCharacterTable) {
    const struct {
        std::string in;
        int ok;
        std::u16string out;
        size_t advance;
    } cases[] = {
        // clang-format off
        {"A", 1, u"A", 1}, {"", 1, u"\0"s, 1}, {"\xC3\xA9", 1, u"\xE9", 2}, {"\xE2\x82\xAC", 1, u"\x20AC", 3},
        {"\xF0\x9F\x98\x80", 1, u"\xD83D\xDE00", 4},
        {"\xC0\x80", 1, u"\xFFFD\xFFFD", 2}, {"\xE0\x80\x80", 0, u"\xFFFD\xFFFD", 3},  // two units fit, not three
        {"\xF4\x90\x80\x80", 1, u"\xFFFD", 4}, {"\x80", 1, u"\xFFFD", 1},
        {"\xE3\x41\x42", 1, u"\xFFFD", 1}, {"\xE3\x81\x41", 1, u"\xFFFD", 1},  // A and B come with the next calls
        {"\xC3", 0, u"", 1}, {"\xE3\x81", 0, u"", 2}, {"\xF0\x9F\x98", 0, u"", 3},  // cut short: stop on the NUL
        // clang-format on
    };
    for (const auto &c : cases) {
        const std::string buf = c.in + '\0' + '\x80';
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

// A new list each time (the input stays as it was); a last string without
// its NUL gets one. A sequence cut short by a terminator fails, changing nothing.
TEST(StringListFromUTF8toUTF16, ListsAndTerminators) {
    const std::pair<std::string, std::u16string> cases[] = {
        // clang-format off
        {"ab\0\0c\0"s, u"ab\0\0c\0"s}, {"\xC3\xA9\0\xF0\x9F\x98\x80\0"s, u"\xE9\0\xD83D\xDE00\0"s},
        {"ab\0cd"s, u"ab\0cd\0"s}, {"\xE3\x41\0"s, u"\xFFFD" "A\0"s},
        {"\x80\x80\x80\x80", u"\xFFFD\xFFFD\xFFFD\xFFFD\0"s}, {"\0"s, u"\0"s}, {"", u""},
        {"ab\0\xC3\0\xA9\0"s, u""}, {"\xE3\x81", u""}, {"ok\0\xF0\x9F\x98"s, u""},
        // clang-format on
    };
    for (const auto &[in, out] : cases) {
        std::string input = in.empty() ? "x" : in;
        char *list = input.data();
        uint32_t len = static_cast<uint32_t>(in.size());
        const int ok = StringListFromUTF8toUTF16(&list, &len);
        EXPECT_EQ(input.substr(0, in.size()), in) << "input list changed";
        if (!in.empty() && out.empty()) {
            EXPECT_TRUE(ok == 0 && list == input.data() && len == in.size()) << hex(in);
            continue;
        }
        ASSERT_EQ(ok, 1) << hex(in);
        EXPECT_NE(list, input.data());
        EXPECT_EQ(hex(units_of(list, len)), hex(out));
        HostFree(list);
    }
}

// Random lists against decoding string by string: strings cut inside a
// sequence (the list fails), ill-formed bytes and real U+FFFD among them.
TEST(StringListFromUTF8toUTF16, RandomListsMatchStringByString) {
    std::mt19937 rng(3);
    const std::string damage[] = {"\xEF\xBF\xBD", "\xE3\x81", "\xC3", "\xFF", "\x80", "\xF0\x9F\x98", ""};
    for (uint32_t seed = 1; seed <= 400; ++seed) {
        std::string in;
        std::u16string want;
        bool fails = false;
        for (uint32_t k = 0, strings = 1 + rng() % 6; k < strings; ++k) {
            std::string str =
                testsupport::random_utf8(seed * 7 + k, rng() % 50) + damage[rng() % std::size(damage)];
            str.erase(std::remove(str.begin(), str.end(), '\0'), str.end());
            std::u16string units(str.size() + 1, u'\0');
            uint32_t w = 0;
            fails |= ConvertUTF8toUTF16(str.data(), static_cast<uint32_t>(str.size()),
                                        reinterpret_cast<uint16_t *>(units.data()), 2 * str.size() + 2,
                                        &w) != TEXTCONV_UTF_DONE;
            want += units.substr(0, w / 2) + u'\0';
            in += str;
            if (k + 1 < strings || rng() % 2) in += '\0';
        }
        std::string input = in + 'x';
        char *list = input.data();
        uint32_t len = static_cast<uint32_t>(in.size());
        const int ok = StringListFromUTF8toUTF16(&list, &len);
        ASSERT_EQ(ok, fails ? 0 : 1) << hex(in);
        if (!ok) continue;
        EXPECT_EQ(hex(units_of(list, len)), hex(want));
        HostFree(list);
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
    EXPECT_TRUE(units_of(list, len) == want);
    HostFree(list);
}
