// Reading direction-escaped text back, and the properties every escaped text
// must have, written independently of the walk.
#pragma once

#include <gtest/gtest.h>

#include <cstdint>
#include <string>

namespace escape_checks {

// Classes as the markup's reader sees them: 0 left-to-right, 1 right-to-left,
// 2 neutral (the values of DIRECTION_LTR, DIRECTION_RTL, DIRECTION_NEUTRAL).
inline int class_of(char16_t u) {
    if ((u >= u'0' && u <= u'9') || (u >= u'A' && u <= u'Z') || (u >= u'a' && u <= u'z')) return 0;
    if (u >= 0xC0 && u <= 0xFF && u != 0xD7 && u != 0xF7) return 0;
    if ((u >= 0x0590 && u <= 0x06FF) || (u >= 0x0750 && u <= 0x07FF) || (u >= 0xFB1D && u <= 0xFDFF) ||
        (u >= 0xFE70 && u <= 0xFEFF))
        return 1;
    return 2;
}

// The cost of taking a unit: "%" is held as two.
inline uint64_t cost(char16_t u) { return u == u'%' ? 2 : 1; }

// Checks escaped (without its terminator) against the source it came from
// and the room L. Returns the number of source units the walk took.
inline size_t check_escaped(const std::u16string &source, const std::u16string &escaped, uint32_t L) {
    std::u16string text;           // the escapes removed
    int mark = 2;                  // the run announced last, 2 = none yet
    bool awaitingStrong = false;   // a mark was written and its unit not yet seen
    size_t afterLastStrong = 0;    // escaped units through the last strong unit
    size_t afterStrongBefore = 0;  // the same for the strong unit before that
    char16_t previous = 0;         // the token before a mark (0 at the start)
    bool previousIsText = false;
    for (size_t i = 0; i < escaped.size(); ++i) {
        char16_t u = escaped[i];
        if (u == u'%') {
            EXPECT_LT(i + 1, escaped.size()) << "a lone % at the end";
            if (i + 1 >= escaped.size()) break;
            char16_t next = escaped[++i];
            if (next == u'%') {
                text += u'%';
                previous = u'%';
                previousIsText = true;
                continue;
            }
            EXPECT_TRUE(next == u'l' || next == u'r') << "unknown escape %" << static_cast<char>(next);
            int newMark = next == u'l' ? 0 : 1;
            EXPECT_NE(newMark, mark) << "an escape that changes nothing, at " << i;
            EXPECT_FALSE(awaitingStrong) << "two escapes without a strong unit between them, at " << i;
            if (newMark == 0) {
                // Neutral units before a left-to-right run join it: the
                // escape follows the last strong unit (or the start) at once.
                EXPECT_TRUE(!previousIsText || class_of(previous) == 1) << "%l after neutral text, at " << i;
            } else {
                // Neutral units before a right-to-left run stay outside it:
                // the escape comes right before its strong unit.
                EXPECT_TRUE(i + 1 < escaped.size() && escaped[i + 1] != u'%' && class_of(escaped[i + 1]) == 1)
                    << "%r not right before a right-to-left unit, at " << i;
            }
            mark = newMark;
            awaitingStrong = true;
            continue;
        }
        int cls = class_of(u);
        if (cls != 2) {
            EXPECT_EQ(cls, mark) << "strong unit U+" << std::hex << static_cast<unsigned>(u)
                                 << " outside a run of its direction, at " << std::dec << i;
            awaitingStrong = false;
            afterStrongBefore = afterLastStrong;
            afterLastStrong = i + 1;
        }
        text += u;
        previous = u;
        previousIsText = true;
    }
    EXPECT_FALSE(awaitingStrong) << "an escape with no strong unit after it";

    // What comes out is the source's beginning, unchanged.
    EXPECT_LE(text.size(), source.size());
    EXPECT_EQ(text, source.substr(0, text.size()));

    // The budget: the units taken plus the units written up to the last
    // strong unit (the final neutral units are written after the walk).
    const size_t taken = text.size();
    uint64_t budget = afterLastStrong;
    for (size_t i = 0; i < taken; ++i) budget += cost(source[i]);
    if (taken < source.size()) {
        EXPECT_GE(budget, L) << "the walk stopped before the budget was spent";
    }
    if (taken > 0) {
        // Before the last unit was taken the budget was still below L.
        char16_t last = source[taken - 1];
        uint64_t before = budget - cost(last);
        // A strong unit's step wrote everything since the strong unit before.
        if (class_of(last) != 2) before -= afterLastStrong - afterStrongBefore;
        EXPECT_LT(before, L) << "a unit was taken although the budget was spent";
    }
    // The slack: escapes and a pending run written at the last step can pass
    // L by at most 2 units (L + 3 with the terminator).
    EXPECT_LE(escaped.size(), static_cast<size_t>(L) + 2);
    return taken;
}

}  // namespace escape_checks
