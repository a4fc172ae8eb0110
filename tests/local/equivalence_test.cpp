// StringsEquivalent under a locale named by TEST_LOCALE, whose upper-case
// table folds the Latin-1 letters when FOLDS_LATIN1 is 1 (de_DE.ISO-8859-1)
// and only ASCII when it is 0 (C). Both give the local charset Latin-1. The
// build names the suite (EQUIVALENCE_SUITE).
#include <gtest/gtest.h>
#include <sys/mman.h>
#include <unistd.h>

#include <clocale>
#include <cstring>
#include <random>
#include <string>
#include <vector>

#include "test_support.h"
#include "textconv.h"

namespace {

constexpr bool kFolds = FOLDS_LATIN1;
constexpr int U = CHARSET_UTF8;
constexpr int L = CHARSET_LATIN1;  // any value but 4 reads the local charset

class EQUIVALENCE_SUITE : public ::testing::Test {
  protected:
    void SetUp() override {
        // The comparison folds with the current locale's table: take the
        // locale from the environment, as the library's detection does.
        ASSERT_EQ(LocalEncoding(), CHARSET_LATIN1);
    }
};

struct Case {
    const char *first;
    int firstEncoding;
    const char *second;
    int secondEncoding;
    uint8_t ignoreCase;
    int expected;
};

TEST_F(EQUIVALENCE_SUITE, Cases) {
    const Case cases[] = {
        {"abc", U, "abc", U, 0, 1},
        {"abc", U, "ABC", U, 0, 0},
        {"abc", U, "ABC", U, 1, 1},
        {"abc", U, "abcd", U, 0, 0},
        {"abcd", U, "abc", U, 0, 0},
        {"", U, "", U, 0, 1},
        {"", U, "a", U, 0, 0},
        {"a", L, "", U, 1, 0},
        {"\xC3\xA9", U, "\xE9", L, 0, 1},  // U+00E9 both
        {"\xE9", L, "\xC3\xA9", U, 0, 1},
        {"\xE9", CHARSET_UTF16, "\xC3\xA9", U, 0, 1},  // 5 reads the local charset too
        {"\xC3\x89", U, "\xE9", L, 1, kFolds},         // E acute against e acute
        {"\xC3\x89", U, "\xC3\xA9", U, 1, kFolds},
        {"\xC3\x89", U, "\xC3\xA9", U, 0, 0},
        {"\xC3\xBF", U, "\xC5\xB8", U, 1, 0},  // y diaeresis: its capital lies above 0xFF
        {"\xCE\x91", U, "\xCE\xB1", U, 1, 0},  // Greek never folds
        {"\xF0\x9F\x98\x80", U, "\xF0\x9F\x98\x80", U, 0, 1},
        {"\xF0\x9F\x98\x80", U, "\xF0\x9F\x98\x80", L, 0, 0},  // two units against one
        {"\xF0\x9F\x98\x80x", U, "\xF0\x9F\x98\x81x", U, 0, 0},
        {"\xE0\x80\x80", U, "\xE0\x80\x80", U, 0, 0},  // an illegal sequence fails even against itself
        {"a\xFF"
         "b",
         U,
         "a\xFF"
         "b",
         U, 0, 1},  // one-byte garbage is U+FFFD on both sides
        {"a\xFE"
         "b",
         U,
         "a\xFF"
         "b",
         U, 0, 1},
        {"ab\xE3", U, "ab\xE3", U, 0, 0},  // cut short by the terminator
        {"ab\xE3\x81", U, "ab", U, 0, 0},
        {"\xD7\x90", U, "\xD7\x91", U, 1, 0},
    };
    for (const Case &c : cases) {
        EXPECT_EQ(StringsEquivalent(c.first, c.firstEncoding, c.second, c.secondEncoding, c.ignoreCase),
                  c.expected)
            << testsupport::hex(c.first) << " (" << c.firstEncoding << ") against "
            << testsupport::hex(c.second) << " (" << c.secondEncoding << "), ignoreCase "
            << int(c.ignoreCase);
    }
    // Only the low 8 bits of the flag count.
    EXPECT_EQ(StringsEquivalent("abc", U, "ABC", U, static_cast<uint8_t>(0x100)), 0);
}

// The oracle: both strings as UTF-16 by glibc, unit by unit, units up to 0xFF
// through the locale's toupper when case is ignored.
int oracle(const std::string &a, const std::string &b, bool ignoreCase) {
    auto ua = testsupport::iconv_to_utf16("UTF-8", a);
    auto ub = testsupport::iconv_to_utf16("UTF-8", b);
    if (!ua || !ub || ua->size() != ub->size()) return 0;
    for (size_t i = 0; i < ua->size(); ++i) {
        char16_t x = (*ua)[i], y = (*ub)[i];
        if (x == y) continue;
        if (!ignoreCase || x > 0xFF || y > 0xFF || toupper(x) != toupper(y)) return 0;
    }
    return 1;
}

// Random valid UTF-8 pairs, equal, case-changed, cut or changed in one place,
// in UTF-8 on both sides and, where Latin-1 holds them, Latin-1 on one.
TEST_F(EQUIVALENCE_SUITE, RandomPairsAgreeWithTheOracle) {
    const char *pieces[] = {"a",
                            "Z",
                            "q",
                            "Q",
                            "0",
                            " ",
                            "%",
                            "\xC3\xA9",
                            "\xC3\x89",
                            "\xC3\x9F",
                            "\xC3\xBF",
                            "\xC3\x97",
                            "\xCE\xB1",
                            "\xCE\x91",
                            "\xD7\x90",
                            "\xE4\xB8\x80",
                            "\xF0\x9F\x98\x80"};
    std::mt19937 rng(314159);
    int latin1Pairs = 0;
    for (int round = 0; round < 4000; ++round) {
        std::vector<std::string> chars;
        size_t n = rng() % 24;
        for (size_t i = 0; i < n; ++i) chars.push_back(pieces[rng() % std::size(pieces)]);
        std::vector<std::string> other = chars;
        switch (rng() % 5) {
            case 0:
                break;
            case 1:  // flip the case of one ASCII or Latin-1 letter
                if (!other.empty()) {
                    std::string &c = other[rng() % other.size()];
                    if (c == "a")
                        c = "A";
                    else if (c == "Q")
                        c = "q";
                    else if (c == "\xC3\xA9")
                        c = "\xC3\x89";
                    else if (c == "\xCE\xB1")
                        c = "\xCE\x91";
                }
                break;
            case 2:  // cut
                if (!other.empty()) other.resize(rng() % other.size());
                break;
            case 3:  // replace one character
                if (!other.empty()) other[rng() % other.size()] = pieces[rng() % std::size(pieces)];
                break;
            default:  // grow
                other.push_back(pieces[rng() % std::size(pieces)]);
        }
        std::string a, b;
        for (auto &c : chars) a += c;
        for (auto &c : other) b += c;
        for (uint8_t ignoreCase : {0, 1}) {
            int expected = oracle(a, b, ignoreCase);
            ASSERT_EQ(StringsEquivalent(a.c_str(), U, b.c_str(), U, ignoreCase), expected)
                << testsupport::hex(a) << " against " << testsupport::hex(b) << ", ignoreCase "
                << int(ignoreCase);
            ASSERT_EQ(StringsEquivalent(b.c_str(), U, a.c_str(), U, ignoreCase), expected);
            auto la = testsupport::iconv_convert("ISO-8859-1", "UTF-8", a);
            if (la) {
                ++latin1Pairs;
                ASSERT_EQ(StringsEquivalent(la->c_str(), L, b.c_str(), U, ignoreCase), expected)
                    << testsupport::hex(*la) << " (Latin-1) against " << testsupport::hex(b);
            }
        }
    }
    EXPECT_GT(latin1Pairs, 100);
}

// Strings that end right at an inaccessible page: the comparison never reads
// past either terminator, whatever precedes it.
TEST_F(EQUIVALENCE_SUITE, NeverReadsPastATerminator) {
    const long page = sysconf(_SC_PAGESIZE);
    auto *area = static_cast<char *>(
        mmap(nullptr, 4 * page, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0));
    ASSERT_NE(area, MAP_FAILED);
    ASSERT_EQ(mprotect(area + page, page, PROT_NONE), 0);
    ASSERT_EQ(mprotect(area + 3 * page, page, PROT_NONE), 0);
    auto place = [&](char *pageStart, const std::string &s) {
        char *p = pageStart + page - (s.size() + 1);
        std::memcpy(p, s.c_str(), s.size() + 1);
        return p;
    };
    const std::string endings[] = {"",     "a",         "ab\xE3", "ab\xE3\x81",  "\xF0\x9F\x98",    "\xF0",
                                   "\xC3", "x\xE0\x80", "\xE9",   "abc\xC3\xA9", "\xF0\x9F\x98\x80"};
    int equal = 0;
    for (const std::string &x : endings) {
        for (const std::string &y : endings) {
            const char *a = place(area, x);
            const char *b = place(area + 2 * page, y);
            for (int ea : {U, L})
                for (int eb : {U, L}) equal += StringsEquivalent(a, ea, b, eb, 1);
        }
    }
    EXPECT_GT(equal, 0);
    munmap(area, 4 * page);
}

}  // namespace
