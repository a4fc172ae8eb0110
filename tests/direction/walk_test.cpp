// The direction-escaping walk on UTF-16 units, apart from any conversion.
// Upper-case ASCII letters stand for Hebrew letters: "A" is U+05D0 and so on.
#include "direction/walk.h"

#include <gtest/gtest.h>
#include <sys/mman.h>
#include <unistd.h>

#include <random>
#include <string>
#include <vector>

#include "direction/classes.h"
#include "escape_checks.h"

namespace {

using textconv::direction::escape_walk;

std::u16string hebrew(const std::string &standIn) {
    std::u16string units;
    for (unsigned char c : standIn)
        units += c >= 'A' && c <= 'Z' ? char16_t(0x05D0 + (c - 'A')) : char16_t(c);
    return units;
}

std::string standIn(const std::u16string &units) {
    std::string text;
    for (char16_t u : units)
        text += u >= 0x05D0 && u < 0x05D0 + 26 ? std::string(1, char('A' + (u - 0x05D0)))
                : u < 0x80                     ? std::string(1, char(u))
                                               : "{" + std::to_string(unsigned(u)) + "}";
    return text;
}

// Runs the walk with a guard zone after the room it may use, and checks the
// result against every property of escaped text.
std::u16string walk(const std::u16string &text, uint32_t L) {
    std::vector<uint16_t> in(text.begin(), text.end());
    in.push_back(0);
    std::vector<uint16_t> out(static_cast<size_t>(L) + 12, 0xBEEF);
    uint32_t n = escape_walk(in.data(), L, out.data());
    EXPECT_TRUE(n >= 1 && n <= L + 3) << n;
    EXPECT_EQ(out[n - 1], 0);
    for (size_t i = n; i < out.size(); ++i)
        EXPECT_EQ(out[i], 0xBEEF) << "written past the terminator at " << i;
    std::u16string escaped(out.begin(), out.begin() + (n - 1));
    escape_checks::check_escaped(text, escaped, L);
    return escaped;
}

TEST(DirectionWalk, Examples) {
    const struct {
        const char *source;
        uint32_t room;
        const char *escaped;
    } examples[] = {
        {"abc AB 12", 100, "%labc %rAB%l 12"},  // spaces around a run stay outside it
        {"- A", 100, "- %rA"},                  // leading neutrals stay out of a right-to-left run
        {"- ab", 100, "%l- ab"},                // and join a left-to-right one
        {"?!", 100, "?!"},
        {"A B.", 100, "%rA B."},
        {"%lx", 100, "%l%%lx"},
        {"A-b-C", 100, "%rA%l-b-%rC"},
        {"", 100, ""},
        {"abcde", 10, "%labcd"},  // the d brings the budget to 10
        {"abcde", 11, "%labcde"},
        {"abc", 0, ""},
        {"abc", 1, "%la"},
        {"         a", 10, "%l         a"},  // nine spaces: twelve units, the most past the room
        {"          a", 10, "          "},   // ten: the budget runs out among the spaces
        {"%%%%%a", 10, "%%%%%%%%%%"},        // "%" costs two
    };
    for (const auto &e : examples) EXPECT_EQ(standIn(walk(hebrew(e.source), e.room)), e.escaped) << e.source;
}

TEST(DirectionWalk, UnitClassesAgreeWithTheReader) {
    for (uint32_t u = 1; u <= 0xFFFF; ++u)
        ASSERT_EQ(textconv::direction::unit_class(static_cast<uint16_t>(u)),
                  escape_checks::class_of(char16_t(u)))
            << std::hex << u;
}

// Random text of strong and neutral units and "%", with a random room.
TEST(DirectionWalk, RandomTextKeepsEveryProperty) {
    const char16_t units[] = {u'a',  u'z',  u'Q',  u'0',   u'9',   0xE9,   0xC0, 0xFF, 0x5D0, 0x5EA,
                              0x627, 0x661, 0x750, 0xFB1D, 0xFE70, 0xFEFF, u' ', u'.', u'-',  u'!',
                              0xD7,  0x410, 0x710, 0x4E00, 0xD83D, 0x2028, u'%', u'%', u'%'};
    std::mt19937 rng(20261206);
    for (int round = 0; round < 20000 && !HasFailure(); ++round) {
        std::u16string text;
        for (size_t i = 0, n = rng() % 40; i < n; ++i) text += units[rng() % std::size(units)];
        uint32_t L = rng() % 3 == 0 ? rng() % 8 : rng() % 100;
        SCOPED_TRACE(standIn(text) + ", L " + std::to_string(L));
        std::u16string escaped = walk(text, L);
        // Room for twice the text plus escapes takes all of it.
        if (L >= 4 * text.size() + 2) {
            EXPECT_EQ(escape_checks::check_escaped(text, escaped, L), text.size());
        }
    }
}

// The walk reads at most L units of a text with no terminator within them.
TEST(DirectionWalk, ReadsNoFurtherThanTheRoom) {
    const long page = sysconf(_SC_PAGESIZE);
    auto *base = static_cast<char *>(
        mmap(nullptr, 2 * page, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0));
    ASSERT_NE(base, MAP_FAILED);
    ASSERT_EQ(mprotect(base + page, page, PROT_NONE), 0);
    for (uint32_t L : {1u, 2u, 7u, 64u, 100u}) {
        auto *text = reinterpret_cast<uint16_t *>(base + page) - L;
        for (uint32_t i = 0; i < L; ++i) text[i] = i % 3 ? u' ' : u'x';
        std::vector<uint16_t> out(L + 4);
        EXPECT_LE(escape_walk(text, L, out.data()), L + 3);
    }
    munmap(base, 2 * page);
}

}  // namespace
