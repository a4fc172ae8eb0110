// Direction escaping through the library: conversion to UTF-16 and back,
// the room, the fallback copy, and real Hebrew and Arabic text.
#include <gtest/gtest.h>

#include <cstring>
#include <string>
#include <vector>

#include "escape_checks.h"
#include "test_support.h"
#include "textconv.h"

namespace {

struct Outcome {
    std::string bytes;  // the target up to its first NUL (or all of it)
    uint32_t length;
};

Outcome escape(CharsetId charset, const std::string &source, uint32_t room, size_t targetSize = 0) {
    std::vector<char> target(std::max<size_t>(targetSize, room) + 16, '\x7f');
    uint32_t length = room;
    EXPECT_EQ(StringFromCharsetToDirectionEscapedString(charset, target.data(), source.c_str(), &length), 1);
    for (size_t i = std::max<size_t>(targetSize, room); i < target.size(); ++i)
        EXPECT_EQ(target[i], '\x7f') << "written past the room at " << i;
    size_t n = strnlen(target.data(), room);
    return {std::string(target.data(), n), length};
}

struct Example {
    CharsetId charset;
    const char *source;
    uint32_t room;
    const char *escaped;
};

// What the walk's own tests leave out: the charsets. Hebrew letters in
// ISO-8859-8: alef E0, bet E1.
const Example kExamples[] = {
    {CHARSET_LATIN1, "abc", 100, "%labc"},
    {CHARSET_ISO8859_8, "\xE0\xE1", 100, "%r\xE0\xE1"},
    {CHARSET_ISO8859_8, "abc \xE0\xE1 12", 100, "%labc %r\xE0\xE1%l 12"},
    {CHARSET_LATIN1, "50%", 100, "%l50%%"},
    {CHARSET_LATIN1, "caf\xE9 \xD7 2", 100, "%lcaf\xE9 \xD7 2"},  // the multiplication sign is neutral
    {CHARSET_LATIN1, "abcde", 10, "%labcd"},                      // the d brings the budget to 10
    {CHARSET_UTF8,
     "\xEF\xBB\xBF"
     "abc",
     100, "%r\xEF\xBB\xBF%labc"},                                   // the source's own mark is right-to-left
    {CHARSET_UTF8, "12\xD8\xA8", 100, "%l12%r\xD8\xA8"},            // ASCII digits, then an Arabic letter
    {CHARSET_UTF8, "\xD9\xA1\xD9\xA2", 100, "%r\xD9\xA1\xD9\xA2"},  // Arabic-Indic digits
    {CHARSET_UTF8, "\xD0\x9C\xD0\xB8\xD1\x80", 100, "\xD0\x9C\xD0\xB8\xD1\x80"},  // Cyrillic: no escape
    {CHARSET_UTF8, "\xDC\x90 a", 100, "%l\xDC\x90 a"},                            // U+0710 is neutral
    {CHARSET_CP1256, "\xC7 x", 100, "%r\xC7%l x"},
};

TEST(DirectionEscape, Examples) {
    for (const Example &e : kExamples) {
        SCOPED_TRACE(testsupport::hex(e.source));
        Outcome o = escape(e.charset, e.source, e.room);
        EXPECT_EQ(testsupport::hex(o.bytes), testsupport::hex(e.escaped));
        EXPECT_EQ(o.length, std::strlen(e.escaped) + 1);
    }
}

// Every failure leaves strncpy's copy of the source and the length as it was.
TEST(DirectionEscape, FailuresCopyTheSource) {
    // No converter for CHARSET_NONE.
    Outcome none = escape(CHARSET_NONE, "abc", 100);
    EXPECT_EQ(none.bytes, "abc");
    EXPECT_EQ(none.length, 100u);

    // The text in UTF-16 does not fit in 2 L bytes: cut to L, no terminator.
    std::vector<char> target(12, '\x7f');
    uint32_t length = 8;
    StringFromCharsetToDirectionEscapedString(CHARSET_LATIN1, target.data(), "abcdefghijkl", &length);
    EXPECT_EQ(std::string(target.data(), 8), "abcdefgh");
    EXPECT_EQ(target[8], '\x7f');
    EXPECT_EQ(length, 8u);

    // The escaped text needs 11 bytes with its NUL where only 10 are given.
    Outcome tooLong = escape(CHARSET_LATIN1, "       a", 10);
    EXPECT_EQ(tooLong.bytes, "       a");
    EXPECT_EQ(tooLong.length, 10u);

    // With no room nothing is written at all.
    Outcome empty = escape(CHARSET_LATIN1, "abc", 0);
    EXPECT_EQ(empty.length, 0u);
}

TEST(DirectionEscape, UnitCharsetsWidenTheOutput) {
    // In UTF-16 the source is units and each escape takes two units; the
    // converter's byte-order mark stays in front of what it writes.
    const char16_t source[] = u"a\u05D0";
    std::vector<char> target(128, '\x7f');
    uint32_t length = 100;
    StringFromCharsetToDirectionEscapedString(CHARSET_UTF16, target.data(),
                                              reinterpret_cast<const char *>(source), &length);
    const char16_t expected[] = u"\uFEFF%la%r\u05D0";
    ASSERT_EQ(length, sizeof expected);
    EXPECT_EQ(std::memcmp(target.data(), expected, sizeof expected), 0);
}

TEST(DirectionEscape, LocalEncodingGivesTheSameBytes) {
    const std::string source = "- abc 50% \xE9";
    std::vector<char> a(64), b(64);
    uint32_t la = 64, lb = 64;
    StringFromLocalToDirectionEscapedString(a.data(), source.c_str(), &la);
    StringFromCharsetToDirectionEscapedString(LocalEncoding(), b.data(), source.c_str(), &lb);
    EXPECT_EQ(la, lb);
    EXPECT_EQ(a, b);
}

// Whole lines of real text, and a whole file in one call: a large room takes
// its scratch from the host rather than the stack.
TEST(DirectionEscape, RealTextRoundTrips) {
    int files = 0;
    for (const char *name :
         {"hebrew.utf8.txt", "arabic.utf8.txt", "hebrew-lipsum.utf8.txt", "english.utf8.txt"}) {
        auto text = testsupport::read_corpus(name);
        if (!text) GTEST_SKIP() << "corpora not available";
        ++files;
        // Lines with a room of 4 units per character and more: all is taken.
        size_t start = 0;
        int lines = 0;
        while (start < text->size() && lines < 400) {
            size_t end = text->find('\n', start);
            if (end == std::string::npos) end = text->size();
            std::string line = text->substr(start, end - start);
            start = end + 1;
            auto units = testsupport::iconv_to_utf16("UTF-8", line);
            ASSERT_TRUE(units);
            const uint32_t room = static_cast<uint32_t>(6 * line.size() + 8);
            Outcome o = escape(CHARSET_UTF8, line, room);
            ASSERT_EQ(o.length, o.bytes.size() + 1) << name << ": " << line;
            auto escaped = testsupport::iconv_to_utf16("UTF-8", o.bytes);
            ASSERT_TRUE(escaped);
            size_t taken = escape_checks::check_escaped(*units, *escaped, room);
            EXPECT_EQ(taken, units->size()) << name << ": " << line;
            ++lines;
            if (HasFailure()) return;
        }
        // The whole file, and then a room that cuts it about halfway (the
        // source in UTF-16 must still fit in 2 L bytes).
        auto units = testsupport::iconv_to_utf16("UTF-8", *text);
        ASSERT_TRUE(units);
        const uint32_t wholeRoom = static_cast<uint32_t>(6 * text->size() + 8);
        for (uint32_t room : {wholeRoom, static_cast<uint32_t>(units->size() + 1)}) {
            Outcome o = escape(CHARSET_UTF8, *text, room);
            if (o.length == room) {
                // Two bytes a letter do not fit a room counted in units: the
                // fallback copy. English text fits.
                EXPECT_NE(std::string(name), "english.utf8.txt");
                EXPECT_EQ(o.bytes, text->substr(0, room));
                continue;
            }
            ASSERT_EQ(o.length, o.bytes.size() + 1) << name;
            auto escaped = testsupport::iconv_to_utf16("UTF-8", o.bytes);
            ASSERT_TRUE(escaped);
            size_t taken = escape_checks::check_escaped(*units, *escaped, room);
            if (room == wholeRoom) {
                EXPECT_EQ(taken, units->size()) << name;
            } else {
                EXPECT_GT(taken, units->size() / 4) << name;
                EXPECT_LT(taken, units->size()) << name;
            }
        }
    }
    EXPECT_EQ(files, 4);
}

// Scratch for a room of 16 MiB would need about 100 MB of stack.
TEST(DirectionEscape, HugeRoomDoesNotExhaustTheStack) {
    const uint32_t room = 16u << 20;
    Outcome o = escape(CHARSET_LATIN1, "abc \xE9", room);
    EXPECT_EQ(o.bytes, "%labc \xE9");
    EXPECT_EQ(o.length, 8u);
}

}  // namespace
