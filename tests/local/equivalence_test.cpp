// StringsEquivalent under TEST_LOCALE, whose upper-case table folds the
// Latin-1 letters when FOLDS_LATIN1 is 1 and only ASCII when it is 0. Both
// locales give the local charset Latin-1.
#include <gtest/gtest.h>
#include <sys/mman.h>
#include <unistd.h>

#include <cstring>
#include <random>
#include <string>
#include <vector>

#include "test_support.h"
#include "textconv.h"

namespace {

using testsupport::hex;
constexpr bool kFolds = FOLDS_LATIN1;
constexpr int U = CHARSET_UTF8;
constexpr int L = CHARSET_LATIN1;  // any value but 4 reads the local charset

class EQUIVALENCE_SUITE : public ::testing::Test {
  protected:
    void SetUp() override { ASSERT_EQ(LocalEncoding(), CHARSET_LATIN1); }
};

// What the random pairs below do not reach: other encodings' values, bad
// UTF-8, characters whose capital lies outside Latin-1.
TEST_F(EQUIVALENCE_SUITE, Cases) {
    const struct {
        const char *a;
        int ea;
        const char *b;
        int eb, ignoreCase, expected;
    } cases[] = {
        {"", U, "", U, 0, 1},
        {"a", L, "", U, 1, 0},
        {"\351", L, "\303\251", U, 0, 1},
        {"\351", CHARSET_UTF16, "\303\251", U, 0, 1},  // 5 reads the local charset too
        {"\303\211", U, "\351", L, 1, kFolds},
        {"\303\277", U, "\305\270", U, 1, 0},                  // y diaeresis: its capital lies above 0xFF
        {"\360\237\230\200", U, "\360\237\230\200", L, 0, 0},  // two units against one
        {"\340\200\200", U, "\340\200\200", U, 0, 0},          // illegal: fails even against itself
        {"a\377b", U, "a\376b", U, 0, 1},                      // one-byte garbage is U+FFFD on both sides
        {"ab\343", U, "ab\343", U, 0, 0},                      // cut short by the terminator
        {"ab\343\201", U, "ab", U, 0, 0},
    };
    for (const auto &c : cases)
        EXPECT_EQ(StringsEquivalent(c.a, c.ea, c.b, c.eb, c.ignoreCase), c.expected)
            << hex(c.a) << " against " << hex(c.b) << ", ignoreCase " << c.ignoreCase;
    EXPECT_EQ(StringsEquivalent("abc", U, "ABC", U, static_cast<uint8_t>(0x100)), 0);  // only the low 8 bits
}

// glibc's units compared one by one; up to 0xFF through the locale's toupper.
int oracle(const std::string &a, const std::string &b, bool ignoreCase) {
    auto ua = testsupport::iconv_to_utf16("UTF-8", a), ub = testsupport::iconv_to_utf16("UTF-8", b);
    if (!ua || !ub || ua->size() != ub->size()) return 0;
    for (size_t i = 0; i < ua->size(); ++i) {
        char16_t x = (*ua)[i], y = (*ub)[i];
        if (x != y && (!ignoreCase || x > 0xFF || y > 0xFF || toupper(x) != toupper(y))) return 0;
    }
    return 1;
}

// Random valid UTF-8 pairs, equal, case-changed, cut or changed in one place,
// in UTF-8 on both sides and, where Latin-1 holds them, Latin-1 on one.
TEST_F(EQUIVALENCE_SUITE, RandomPairsAgreeWithTheOracle) {
    // clang-format off
    const std::vector<std::string> pieces = {"a", "Z", "q", "Q", "0", " ", "%", "\303\251", "\303\211", "\303\237",
        "\303\277", "\303\227", "\316\261", "\316\221", "\327\220", "\344\270\200", "\360\237\230\200"};
    // clang-format on
    const std::pair<std::string, std::string> flips[] = {
        {"a", "A"}, {"Q", "q"}, {"\303\251", "\303\211"}, {"\316\261", "\316\221"}};
    std::mt19937 rng(314159);
    int latin1Pairs = 0;
    for (int round = 0; round < 4000; ++round) {
        std::vector<std::string> chars(rng() % 24);
        for (auto &c : chars) c = pieces[rng() % pieces.size()];
        std::vector<std::string> other = chars;
        size_t at = other.empty() ? 0 : rng() % other.size();
        switch (other.empty() ? 0 : rng() % 5) {
            case 1:
                for (auto &[from, to] : flips)
                    if (other[at] == from) other[at] = to;
                break;
            case 2:
                other.resize(at);
                break;
            case 3:
                other[at] = pieces[rng() % pieces.size()];
                break;
            case 4:
                other.push_back(pieces[rng() % pieces.size()]);
        }
        std::string a, b;
        for (auto &c : chars) a += c;
        for (auto &c : other) b += c;
        for (uint8_t ignoreCase : {0, 1}) {
            int expected = oracle(a, b, ignoreCase);
            ASSERT_EQ(StringsEquivalent(a.c_str(), U, b.c_str(), U, ignoreCase), expected)
                << hex(a) << " against " << hex(b) << ", ignoreCase " << int(ignoreCase);
            ASSERT_EQ(StringsEquivalent(b.c_str(), U, a.c_str(), U, ignoreCase), expected);
            if (auto la = testsupport::iconv_convert("ISO-8859-1", "UTF-8", a)) {
                ++latin1Pairs;
                ASSERT_EQ(StringsEquivalent(la->c_str(), L, b.c_str(), U, ignoreCase), expected) << hex(*la);
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
        return static_cast<char *>(std::memcpy(pageStart + page - (s.size() + 1), s.c_str(), s.size() + 1));
    };
    const std::string endings[] = {"",     "a",         "ab\343", "ab\343\201",  "\360\237\230",    "\360",
                                   "\303", "x\340\200", "\351",   "abc\303\251", "\360\237\230\200"};
    int equal = 0;
    for (const std::string &x : endings)
        for (const std::string &y : endings)
            for (int ea : {U, L})
                for (int eb : {U, L})
                    equal += StringsEquivalent(place(area, x), ea, place(area + 2 * page, y), eb, 1);
    EXPECT_GT(equal, 0);
    munmap(area, 4 * page);
}

}  // namespace
