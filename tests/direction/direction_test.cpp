// Direction escaping through the library: the charsets, the room, the
// fallback copy, and real Hebrew and Arabic text.
#include <gtest/gtest.h>

#include <cstring>
#include <string>
#include <vector>

#include "escape_checks.h"
#include "test_support.h"
#include "textconv.h"

namespace {

using testsupport::hex;

struct Outcome {
    std::string bytes;  // the target up to its first NUL or the room
    uint32_t length;
};

Outcome escape(CharsetId charset, const std::string &source, uint32_t room) {
    std::vector<char> target(room + 16, '\x7f');
    uint32_t length = room;
    EXPECT_EQ(StringFromCharsetToDirectionEscapedString(charset, target.data(), source.c_str(), &length), 1);
    for (size_t i = room; i < target.size(); ++i)
        EXPECT_EQ(target[i], '\x7f') << "written past the room at " << i;
    return {std::string(target.data(), strnlen(target.data(), room)), length};
}

// Hebrew letters in ISO-8859-8: alef E0, bet E1.
TEST(DirectionEscape, Examples) {
    const struct {
        CharsetId charset;
        const char *source, *escaped;
    } examples[] = {
        {CHARSET_ISO8859_8, "abc \xE0\xE1 12", "%labc %r\xE0\xE1%l 12"},
        {CHARSET_LATIN1, "50%", "%l50%%"},
        {CHARSET_LATIN1, "caf\xE9 \xD7 2", "%lcaf\xE9 \xD7 2"},    // the multiplication sign is neutral
        {CHARSET_UTF8, "\357\273\277abc", "%r\xEF\xBB\xBF%labc"},  // the source's own mark is right-to-left
        {CHARSET_UTF8, "12\xD8\xA8", "%l12%r\xD8\xA8"},
        {CHARSET_UTF8, "\xD9\xA1\xD9\xA2", "%r\xD9\xA1\xD9\xA2"},  // Arabic-Indic digits
        {CHARSET_UTF8, "\xD0\x9C\xD0\xB8", "\xD0\x9C\xD0\xB8"},    // Cyrillic: no escape
        {CHARSET_UTF8, "\xDC\x90 a", "%l\xDC\x90 a"},              // U+0710 is neutral
        {CHARSET_CP1256, "\xC7 x", "%r\xC7%l x"},
    };
    for (const auto &e : examples) {
        Outcome o = escape(e.charset, e.source, 100);
        EXPECT_EQ(hex(o.bytes), hex(e.escaped));
        EXPECT_EQ(o.length, std::strlen(e.escaped) + 1);
    }
    EXPECT_EQ(escape(CHARSET_LATIN1, "abcde", 10).bytes, "%labcd");
}

// Every failure leaves strncpy's copy of the source and the length as it was.
TEST(DirectionEscape, FailuresCopyTheSource) {
    const struct {
        CharsetId charset;
        const char *source;
        uint32_t room;
        const char *copy;
    } failures[] = {
        {CHARSET_NONE, "abc", 100, "abc"},                // no converter
        {CHARSET_LATIN1, "abcdefghijkl", 8, "abcdefgh"},  // UTF-16 text over 2 L bytes: no terminator
        {CHARSET_LATIN1, "       a", 10, "       a"},     // escaped needs 11 bytes
        {CHARSET_LATIN1, "abc", 0, ""},                   // no room: nothing written
    };
    for (const auto &f : failures) {
        Outcome o = escape(f.charset, f.source, f.room);
        EXPECT_EQ(o.bytes, f.copy);
        EXPECT_EQ(o.length, f.room);
    }
}

// In UTF-16 each escape takes two units; the converter's byte-order mark stays.
TEST(DirectionEscape, UnitCharsetsWidenTheOutput) {
    const char16_t source[] = u"a\u05D0", expected[] = u"\uFEFF%la%r\u05D0";
    std::vector<char> target(128, '\x7f');
    uint32_t length = 100;
    StringFromCharsetToDirectionEscapedString(CHARSET_UTF16, target.data(),
                                              reinterpret_cast<const char *>(source), &length);
    ASSERT_EQ(length, sizeof expected);
    EXPECT_EQ(std::memcmp(target.data(), expected, sizeof expected), 0);
}

// Whole files of real text; a large room takes its scratch from the host.
TEST(DirectionEscape, RealTextKeepsEveryProperty) {
    for (const char *name :
         {"hebrew.utf8.txt", "arabic.utf8.txt", "hebrew-lipsum.utf8.txt", "english.utf8.txt"}) {
        auto text = testsupport::read_corpus(name);
        if (!text) GTEST_SKIP() << "corpora not available";
        SCOPED_TRACE(name);
        // Returns the units taken, or -1 for the fallback copy.
        auto check = [](const std::string &s, uint32_t room) -> long {
            auto units = testsupport::iconv_to_utf16("UTF-8", s);
            Outcome o = escape(CHARSET_UTF8, s, room);
            if (o.length == room) {
                EXPECT_EQ(o.bytes, s.substr(0, room));
                return -1;
            }
            EXPECT_EQ(o.length, o.bytes.size() + 1);
            auto escaped = testsupport::iconv_to_utf16("UTF-8", o.bytes);
            return escaped ? long(escape_checks::check_escaped(*units, *escaped, room)) : -2;
        };
        // The whole file, then a room that cuts it about halfway, where two
        // bytes a letter may not fit a room counted in units: the fallback copy.
        const long units = long(testsupport::iconv_to_utf16("UTF-8", *text)->size());
        EXPECT_EQ(check(*text, 6 * text->size() + 8), units);
        long cut = check(*text, units + 1);
        EXPECT_TRUE(cut == -1 ? std::string(name) != "english.utf8.txt" : cut > units / 4 && cut < units)
            << cut;
    }
}

// Scratch for a room of 16 MiB would need about 100 MB of stack.
TEST(DirectionEscape, HugeRoomDoesNotExhaustTheStack) {
    Outcome o = escape(CHARSET_LATIN1, "abc \xE9", 16u << 20);
    EXPECT_EQ(o.bytes, "%labc \xE9");
    EXPECT_EQ(o.length, 8u);
}

}  // namespace
