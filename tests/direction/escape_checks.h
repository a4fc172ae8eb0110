// The properties every direction-escaped text must have, written apart from
// the walk: a reader of the markup and the budget it implies.
#pragma once

#include <gtest/gtest.h>

#include <cstdint>
#include <string>

namespace escape_checks {

// 0 left-to-right, 1 right-to-left, 2 neutral (the DIRECTION_* values).
inline int class_of(char16_t u) {
    if ((u >= u'0' && u <= u'9') || (u >= u'A' && u <= u'Z') || (u >= u'a' && u <= u'z')) return 0;
    if (u >= 0xC0 && u <= 0xFF && u != 0xD7 && u != 0xF7) return 0;
    if ((u >= 0x0590 && u <= 0x06FF) || (u >= 0x0750 && u <= 0x07FF) || (u >= 0xFB1D && u <= 0xFDFF) ||
        (u >= 0xFE70 && u <= 0xFEFF))
        return 1;
    return 2;
}

inline uint64_t cost(char16_t u) { return u == u'%' ? 2 : 1; }

// Checks escaped (no terminator) against its source and the room L; returns
// the number of source units taken.
inline size_t check_escaped(const std::u16string &source, const std::u16string &escaped, uint32_t L) {
    std::u16string text;           // the escapes removed
    int mark = 2;                  // the run announced last, 2 = none yet
    bool awaitingStrong = false;   // a mark written, its strong unit not yet seen
    size_t afterLastStrong = 0;    // escaped units through the last strong unit
    size_t afterStrongBefore = 0;  // the same for the strong unit before that
    char16_t previous = 0;
    bool previousIsText = false;
    for (size_t i = 0; i < escaped.size(); ++i) {
        char16_t u = escaped[i];
        if (u == u'%') {
            EXPECT_LT(i + 1, escaped.size()) << "a lone % at the end";
            if (i + 1 >= escaped.size()) break;
            char16_t next = escaped[++i];
            if (next == u'%') {
                text += previous = u'%';
                previousIsText = true;
                continue;
            }
            EXPECT_TRUE(next == u'l' || next == u'r') << "unknown escape %" << static_cast<char>(next);
            int newMark = next == u'l' ? 0 : 1;
            EXPECT_NE(newMark, mark) << "an escape that changes nothing, at " << i;
            EXPECT_FALSE(awaitingStrong) << "two escapes without a strong unit between them, at " << i;
            if (newMark == 0)  // neutrals before a left-to-right run join it
                EXPECT_TRUE(!previousIsText || class_of(previous) == 1) << "%l after neutral text, at " << i;
            else  // neutrals before a right-to-left run stay outside it
                EXPECT_TRUE(i + 1 < escaped.size() && escaped[i + 1] != u'%' && class_of(escaped[i + 1]) == 1)
                    << "%r not right before a right-to-left unit, at " << i;
            mark = newMark;
            awaitingStrong = true;
            continue;
        }
        if (int cls = class_of(u); cls != 2) {
            EXPECT_EQ(cls, mark) << "strong unit " << std::hex << unsigned(u) << " outside its run, at "
                                 << std::dec << i;
            awaitingStrong = false;
            afterStrongBefore = afterLastStrong;
            afterLastStrong = i + 1;
        }
        text += previous = u;
        previousIsText = true;
    }
    EXPECT_FALSE(awaitingStrong) << "an escape with no strong unit after it";
    EXPECT_EQ(text, source.substr(0, text.size()));  // the source's beginning, unchanged
    EXPECT_LE(text.size(), source.size());

    // The budget: units taken plus units written through the last strong unit.
    const size_t taken = text.size();
    uint64_t budget = afterLastStrong;
    for (size_t i = 0; i < taken; ++i) budget += cost(source[i]);
    EXPECT_TRUE(taken == source.size() || budget >= L) << "the walk stopped before the budget was spent";
    if (taken > 0) {
        char16_t last = source[taken - 1];
        uint64_t before = budget - cost(last);
        if (class_of(last) != 2) before -= afterLastStrong - afterStrongBefore;
        EXPECT_LT(before, L) << "a unit was taken although the budget was spent";
    }
    EXPECT_LE(escaped.size(), static_cast<size_t>(L) + 2);  // at most L + 3 with the terminator
    return taken;
}

}  // namespace escape_checks
