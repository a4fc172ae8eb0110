// The direction-escaping walk on UTF-16 units, apart from any conversion. In
// the readable cases upper-case ASCII letters stand for Hebrew letters:
// "A" is U+05D0, "B" U+05D1 and so on.
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
using textconv::direction::unit_class;

std::u16string hebrew(const std::string &standIn) {
    std::u16string units;
    for (unsigned char c : standIn)
        units += c >= 'A' && c <= 'Z' ? char16_t(0x05D0 + (c - 'A')) : char16_t(c);
    return units;
}

std::string standIn(const std::u16string &units) {
    std::string text;
    for (char16_t u : units) {
        if (u >= 0x05D0 && u < 0x05D0 + 26)
            text += char('A' + (u - 0x05D0));
        else if (u < 0x80)
            text += char(u);
        else
            text += "{" + std::to_string(unsigned(u)) + "}";
    }
    return text;
}

// Runs the walk with a guard zone after the room it may use.
std::u16string walk(const std::u16string &text, uint32_t L) {
    std::vector<uint16_t> in(text.begin(), text.end());
    in.push_back(0);
    constexpr uint16_t kGuard = 0xBEEF;
    std::vector<uint16_t> out(static_cast<size_t>(L) + 4 + 8, kGuard);
    uint32_t n = escape_walk(in.data(), L, out.data());
    EXPECT_GE(n, 1u);
    EXPECT_LE(n, L + 3) << "more than L + 3 units with the terminator";
    EXPECT_EQ(out[n - 1], 0) << "no terminator";
    for (size_t i = n; i < out.size(); ++i)
        EXPECT_EQ(out[i], kGuard) << "written past the terminator at " << i;
    return std::u16string(out.begin(), out.begin() + (n - 1));
}

struct Example {
    const char *source;
    uint32_t room;
    const char *escaped;
};

// Left-to-right letters, Hebrew letters (upper case), neutral units and "%".
const Example kExamples[] = {
    {"abc", 100, "%labc"},
    {"AB", 100, "%rAB"},
    // The space before the Hebrew stays before "%r", the one after follows "%l".
    {"abc AB 12", 100, "%labc %rAB%l 12"},
    {"- A", 100, "- %rA"},    // leading neutrals stay out of a right-to-left run
    {"- ab", 100, "%l- ab"},  // and join a left-to-right one
    {"?!", 100, "?!"},        // no strong unit, no escape
    {"A.", 100, "%rA."},      // trailing neutrals get no escape
    {"A B", 100, "%rA B"},    // neutrals inside a run stay in place
    {"a b", 100, "%la b"},
    {"50%", 100, "%l50%%"},
    {"%lx", 100, "%l%%lx"},  // the source's own "%l" cannot be read as an escape
    {"%%", 100, "%%%%"},
    {"A-b-C", 100, "%rA%l-b-%rC"},
    {"", 100, ""},
    {"abcde", 10, "%labcd"},  // the d brings the budget to 10
    {"abcde", 11, "%labcde"},
    {"abc", 0, ""},  // with no room no unit is taken
    {"abc", 1, "%la"},
    {"       a", 10, "%l       a"},      // seven spaces: ten units
    {"         a", 10, "%l         a"},  // nine: twelve units, the most past the room
    {"          a", 10, "          "},   // ten: the budget runs out among the spaces
    {"%%%%%a", 10, "%%%%%%%%%%"},        // "%" costs two: the a is never taken
};

TEST(DirectionWalk, Examples) {
    for (const Example &e : kExamples) {
        SCOPED_TRACE(std::string("source \"") + e.source + "\", L " + std::to_string(e.room));
        std::u16string escaped = walk(hebrew(e.source), e.room);
        EXPECT_EQ(standIn(escaped), e.escaped);
        escape_checks::check_escaped(hebrew(e.source), escaped, e.room);
    }
}

TEST(DirectionWalk, UnitClassesAtTheRangeEdges) {
    struct Edge {
        char16_t unit;
        int cls;
    };
    const int L = DIRECTION_LTR, R = DIRECTION_RTL, N = DIRECTION_NEUTRAL;
    const Edge edges[] = {
        {0x01, N},   {0x2F, N},   {0x30, L},   {0x39, L},   {0x3A, N},   {0x40, N},   {0x41, L},
        {0x5A, L},   {0x5B, N},   {0x60, N},   {0x61, L},   {0x7A, L},   {0x7B, N},   {0xBF, N},
        {0xC0, L},   {0xD6, L},   {0xD7, N},   {0xD8, L},   {0xF6, L},   {0xF7, N},   {0xF8, L},
        {0xFF, L},   {0x100, N},  {0x410, N},  {0x58F, N},  {0x590, R},  {0x5D0, R},  {0x661, R},
        {0x6FF, R},  {0x700, N},  {0x710, N},  {0x74F, N},  {0x750, R},  {0x7FF, R},  {0x800, N},
        {0x4E00, N}, {0xFB1C, N}, {0xFB1D, R}, {0xFDFF, R}, {0xFE00, N}, {0xFE6F, N}, {0xFE70, R},
        {0xFEFF, R}, {0xFF00, N}, {0xD800, N}, {0xDFFF, N}, {0xFFFF, N},
    };
    for (const Edge &e : edges) EXPECT_EQ(unit_class(e.unit), e.cls) << "U+" << std::hex << unsigned(e.unit);
    // The reader's classes in escape_checks.h agree on every unit.
    for (uint32_t u = 1; u <= 0xFFFF; ++u)
        ASSERT_EQ(unit_class(static_cast<uint16_t>(u)), escape_checks::class_of(static_cast<char16_t>(u)))
            << "U+" << std::hex << u;
}

// Random text of left-to-right, right-to-left and neutral units and "%",
// walked with a random room: every property of escaped text holds.
TEST(DirectionWalk, RandomTextKeepsEveryProperty) {
    const char16_t ltr[] = {u'a', u'z', u'Q', u'0', u'9', 0xE9, 0xC0, 0xFF};
    const char16_t rtl[] = {0x5D0, 0x5EA, 0x627, 0x661, 0x750, 0xFB1D, 0xFE70, 0xFEFF};
    const char16_t neutral[] = {u' ', u'.', u'-', u'!', 0xD7, 0x410, 0x710, 0x4E00, 0xD83D, 0x2028};
    std::mt19937 rng(20261206);
    for (int round = 0; round < 20000; ++round) {
        std::u16string text;
        size_t n = rng() % 40;
        for (size_t i = 0; i < n; ++i) {
            switch (rng() % 7) {
                case 0:
                case 1:
                    text += ltr[rng() % std::size(ltr)];
                    break;
                case 2:
                case 3:
                    text += rtl[rng() % std::size(rtl)];
                    break;
                case 4:
                case 5:
                    text += neutral[rng() % std::size(neutral)];
                    break;
                default:
                    text += u'%';
            }
        }
        uint32_t L = rng() % 3 == 0 ? rng() % 8 : rng() % 100;
        std::u16string escaped = walk(text, L);
        SCOPED_TRACE("source " + standIn(text) + ", L " + std::to_string(L) + ", escaped " +
                     standIn(escaped));
        size_t taken = escape_checks::check_escaped(text, escaped, L);
        // A room twice the text plus the escapes takes the whole text.
        if (L >= 4 * text.size() + 2) {
            EXPECT_EQ(taken, text.size());
        }
        if (HasFailure()) break;
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
        // L units right before the inaccessible page, each costing one.
        auto *text = reinterpret_cast<uint16_t *>(base + page) - L;
        for (uint32_t i = 0; i < L; ++i) text[i] = i % 3 ? u' ' : u'x';
        std::vector<uint16_t> out(L + 4);
        uint32_t n = escape_walk(text, L, out.data());
        EXPECT_LE(n, L + 3);
    }
    munmap(base, 2 * page);
}

}  // namespace
