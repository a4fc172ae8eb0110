// The charset engine against glibc iconv: every byte of the single-byte
// charsets, every code of the multi-byte ones, random and real text,
// substitutes, and the caller's room.
#include <random>

#include "engine_checks.h"
#include "test_support.h"

using namespace enginetest;

namespace {

const char *name_of(CharsetId charset) { return charsetConversion[charset].iconvName; }

// Every code worth trying: each byte of a single-byte charset; else all
// lead/trail pairs, EUC-JP's three-byte codes and GB18030's four-byte codes
// under 0x81.
std::vector<std::string> candidate_codes(CharsetId charset, bool singleByte) {
    std::vector<std::string> codes;
    for (int b = 1; singleByte && b < 256; ++b) codes.push_back(std::string(1, char(b)));
    for (int lead = 0x81; !singleByte && lead <= 0xFE; ++lead)
        for (int trail = 0x40; trail <= 0xFE; ++trail) codes.push_back({char(lead), char(trail)});
    for (int a = 0xA1; charset == CHARSET_EUCJP && a <= 0xFE; ++a)
        for (int b = 0xA1; b <= 0xFE; ++b) codes.push_back({'\x8F', char(a), char(b)});
    for (int a = 0x30; charset == CHARSET_GB18030 && a <= 0x39; ++a)
        for (int b = 0x81; b <= 0xFE; ++b)
            for (int c = 0x30; c <= 0x39; ++c) codes.push_back({'\x81', char(a), char(b), char(c)});
    return codes;
}

// FromCharsetToUnicode steps through text a character of sizes[i] bytes at a
// time, delivering units[i].
void walk_characters(CharsetId charset, const std::string &text, const std::vector<size_t> &sizes,
                     const std::u16string &units) {
    for (size_t i = 0, at = 0; i < units.size(); at += sizes[i++])
        ASSERT_EQ(decode_char(charset, text.c_str() + at), Char(1, units[i], sizes[i]))
            << i << ": " << testsupport::hex(text.substr(at, sizes[i]));
}

}  // namespace

TEST(EngineOracle, EveryCodeBothWays) {
    for (CharsetId charset = CHARSET_LATIN1; charset < CHARSET_COUNT; ++charset) {
        if (charset == CHARSET_UTF8 || is_utf16(charset)) continue;
        const bool singleByte = charset == CHARSET_LATIN1 || charset == CHARSET_KOI8R ||
                                (charset >= CHARSET_ISO8859_11 && charset != CHARSET_EUCKR);
        SCOPED_TRACE(name_of(charset));
        Oracle decode("UTF-16LE", name_of(charset)), encode(name_of(charset), "UTF-16LE");
        std::string text, single;  // all codes; those that make one BMP character
        std::u16string expected, valid, singleUnits;
        std::vector<size_t> sizes;
        for (const std::string &code : candidate_codes(charset, singleByte)) {
            auto units = decode(code);
            if (!units && !singleByte) continue;
            // An undecodable byte: U+FFFD in place.
            const std::u16string u = units ? as_units(*units) : u"\uFFFD";
            text += code;
            expected += u;
            if (units) valid += u;
            if (u.size() == 1) {
                single += code;
                sizes.push_back(code.size());
                singleUnits += u;
            }
        }
        ASSERT_GT(sizes.size(), singleByte ? 250u : 5000u);
        Outcome run = to_unicode(charset, text);
        EXPECT_EQ(run.units(), z(expected));
        EXPECT_EQ(run.length, 2 * (expected.size() + 1));
        EXPECT_EQ(run.sourceMoved, text.size() + 1);
        EXPECT_EQ(run.destinationMoved, run.length);
        walk_characters(charset, single, sizes, singleUnits);
        EXPECT_EQ(from_unicode(charset, valid).output, *encode(as_bytes(valid)) + '\0');
        for (char16_t u : singleByte ? valid : u"")
            EXPECT_EQ(encode_char(charset, u), encode(as_bytes(std::u16string(1, u))));
    }
}

TEST(EngineOracle, KOI8RCharacterFunctionsEveryByte) {
    Oracle decode("UTF-16LE", "KOI8-R");
    for (int b = 1; b < 256; ++b) {
        const char byte[2] = {char(b), 0}, *p = byte;
        char out[2] = {0, 0}, *q = out;
        uint16_t unit = 0;
        ASSERT_EQ(FromKOI8RToUnicode(&p, &unit), 1);
        EXPECT_EQ(std::tuple(unit, p), std::tuple(as_units(*decode(byte))[0], byte + 1)) << b;
        ASSERT_EQ(FromUnicodeToKOI8R(unit, &q), 1);
        EXPECT_EQ(std::string(out, q), std::string(1, char(b)));
    }
    char out = 'x', *q = &out;
    EXPECT_EQ(FromUnicodeToKOI8R(0x20AC, &q), 0);
    EXPECT_EQ(std::tuple(q, out), std::tuple(&out, 'x'));
}

TEST(EngineOracle, RandomUtf8BothWaysAndByCharacter) {
    Oracle decode("UTF-16LE", "UTF-8");
    // The leading ASCII letter takes the converter's first-output mark, which
    // would leave no room for a surrogate pair in the 4-byte buffer.
    const std::string text = "x" + testsupport::random_utf8(7, 4000);
    const std::u16string expected = as_units(*decode(text));
    EXPECT_EQ(to_unicode(CHARSET_UTF8, text, 2 * (expected.size() + 1)).units(), z(expected));
    EXPECT_EQ(from_unicode(CHARSET_UTF8, expected).output, text + '\0');
    // One unit per character: a pair gives its high surrogate, the source
    // moves past the whole character.
    std::u16string firstUnits;
    std::vector<size_t> sizes;
    for (size_t i = 0; i < text.size(); i += sizes.back()) {
        const unsigned char lead = text[i];
        sizes.push_back(lead < 0x80 ? 1 : lead < 0xE0 ? 2 : lead < 0xF0 ? 3 : 4);
        firstUnits += as_units(*decode(text.substr(i, sizes.back())))[0];
    }
    walk_characters(CHARSET_UTF8, text, sizes, firstUnits);
}

TEST(EngineOracle, UnitsACharsetLacksBecomeQuestionMarks) {
    std::mt19937 rng(5);
    const std::pair<char16_t, char16_t> ranges[] = {{0x20, 0x7E},     {0xA0, 0xC9},     {0x400, 0x45F},
                                                    {0x5D0, 0x5EA},   {0x620, 0x64A},   {0xE01, 0xE5B},
                                                    {0x3041, 0x30FF}, {0x4E00, 0x9FA5}, {0xAC00, 0xD7A3},
                                                    {0x20AC, 0x20AC}, {0xD800, 0xDBFF}, {0xDC00, 0xDFFF}};
    for (CharsetId charset = CHARSET_LATIN1; charset < CHARSET_COUNT; ++charset) {
        if (is_utf16(charset)) continue;  // marked target; byte orders unknown to glibc by these names
        SCOPED_TRACE(name_of(charset));
        Oracle encode(name_of(charset), "UTF-16LE");
        std::u16string text;
        std::string expected;
        for (int i = 0; i < 400; ++i) {
            const auto &[lo, hi] = ranges[rng() % std::size(ranges)];
            std::u16string ch(1, char16_t(lo + rng() % (hi - lo + 1)));
            // Half the high surrogates get a low one; a lone low one must not
            // pair with a lone high one before it.
            if (ch[0] >= 0xD800 && ch[0] < 0xDC00 && rng() % 2) ch += char16_t(0xDC00 + rng() % 0x400);
            if (ch[0] >= 0xDC00 && ch[0] < 0xE000 && !text.empty() && text.back() >= 0xD800 &&
                text.back() < 0xDC00)
                continue;
            text += ch;
            expected += encode(as_bytes(ch)).value_or(std::string(ch.size(), '?'));
        }
        Outcome run = from_unicode(charset, text);
        ASSERT_EQ(run.result, 1);
        EXPECT_EQ(run.output, expected + '\0');
        EXPECT_EQ(run.sourceMoved, 2 * (text.size() + 1));
        EXPECT_EQ(run.destinationMoved, run.length);
    }
}

TEST(EngineOracle, UnitTextOfEveryLengthAndAlignment) {
    // The terminator is found word by word: units that look like a 0 unit in
    // part, at every start address, ended at every length.
    const char16_t kinds[] = {0x0001, 0x0100, 0x8000, 0x7FFF, 0x00FF, 0xFF00, u'A'};
    Oracle encode("UTF-8", "UTF-16LE");
    for (size_t offset = 0; offset < 9; ++offset)
        for (size_t length = 0; length < 70; ++length) {
            SCOPED_TRACE(testing::Message() << offset << " " << length);
            std::u16string buffer(offset + length + 40, u'\x0101');
            for (size_t i = 0; i < length; ++i) buffer[offset + i] = kinds[(i * 5 + offset) % 7];
            buffer[offset + length] = 0;
            const std::u16string text = buffer.substr(offset, length);
            const uint16_t *in = reinterpret_cast<const uint16_t *>(buffer.data()) + offset;
            char out[300], *q = out;
            uint32_t room = sizeof out;
            ASSERT_EQ(StringFromUnicodeToCharset(CHARSET_UTF8, &in, &q, &room), 1);
            ASSERT_EQ(std::string(out, room), *encode(as_bytes(text)) + '\0');
            // The same units as a UTF-16 source, also at odd addresses.
            for (size_t odd = 0; odd < 2; ++odd) {
                const std::string bytes = std::string(odd, ' ') + as_bytes(buffer);
                const char *src = bytes.data() + odd + 2 * offset;
                std::u16string units(length + 8, u'\0');
                uint16_t *dst = reinterpret_cast<uint16_t *>(units.data());
                uint32_t unitRoom = uint32_t(units.size() * 2);
                ASSERT_EQ(StringFromCharsetToUnicode(CHARSET_UTF16, &src, &dst, &unitRoom), 1);
                ASSERT_EQ(units.substr(0, unitRoom / 2), z(text)) << odd;
            }
        }
}

TEST(EngineOracle, SixteenBitTextStaysInStepAfterARejectedUnit) {
    // A UTF-16 target takes "?" as a unit (after glibc's first-output mark).
    Outcome out = from_unicode(CHARSET_UTF16, {'A', 0xD800, 'B', 0xDC00});
    EXPECT_EQ(out.units(), z(u"\xFEFF\x41?B?"));
    EXPECT_EQ(out.destinationMoved, out.length);
    Outcome run = to_unicode(CHARSET_UTF16, as_bytes({'A', 0xDC00, 'B', 0xD800, 'C'}));
    EXPECT_EQ(run.units(), z({'A', 0xFFFD, 'B', 0xFFFD, 'C'}));
    EXPECT_EQ(run.sourceMoved, 12u);
    EXPECT_EQ(decode_char(CHARSET_UTF16, as_bytes({0xDC00, 'D'}).c_str()), Char(1, 0xFFFD, 2));
}

// The converter's first output: its mark comes first even when the text
// opens with a unit the target lacks, and a room without space for the mark
// fails.
TEST(EngineOracle, UnitTargetMarkStaysInFrontOfALeadingSubstitute) {
    for (uint32_t room = 0; room <= 10; ++room) {
        Outcome out = from_unicode(CHARSET_UTF16, {0xDC00, 'A', 0xD800}, room);
        EXPECT_EQ(out.result, room >= 10) << room;
        if (out.result) {
            EXPECT_EQ(out.units(), z(u"\xFEFF?A?"));
        }
        EXPECT_TRUE(out.guardIntact);
    }
}

TEST(EngineOracle, CharacterDecoderThatTakesAMarkDeliversTheNextCharacter) {
    ASSERT_EQ(decode_char(CHARSET_LATIN1, "Z"), Char(1, 'Z', 1));  // left in the shared buffer
    // glibc's "UTF-16" decoder takes FF FE as a mark: success, no unit.
    EXPECT_EQ(decode_char(CHARSET_UTF16, "\xFF\xFE\x41\0\0"), Char(1, 'A', 4));
}

TEST(EngineOracle, CharacterDecoderStepsPastATakenMarkAndARejectedUnit) {
    EXPECT_EQ(decode_char(CHARSET_UTF16, "\xFF\xFE\x00\xDC\x41\0\0"), Char(1, 0xFFFD, 4));
}

TEST(EngineOracle, RoomIsNeverExceeded) {
    // To UTF-16 (the first call meets glibc's mark) and from it, substitutes
    // in the text: every room below the need fails, nothing is written past
    // the room, and the reported part lies inside it.
    for (uint32_t room = 0; room <= 16; ++room) {
        SCOPED_TRACE(room);
        Outcome u = to_unicode(CHARSET_UTF8, "A\xFF\xC3\xA9\xE2\x82\xAC\xFE\x42", room);
        EXPECT_EQ(u.result, room >= 14);
        EXPECT_TRUE(!u.result || u.units() == z({'A', 0xFFFD, 0xE9, 0x20AC, 0xFFFD, 'B'}));
        Outcome c = from_unicode(CHARSET_LATIN1, {'A', 0x20AC, 0xD800, 0xE9, 'B', 0xD83D, 0xDE00}, room);
        EXPECT_EQ(c.result, room >= 8);
        EXPECT_TRUE(!c.result || c.output == std::string("A??\xE9\x42??\0", 8));
        for (const Outcome *run : {&u, &c}) {
            EXPECT_TRUE(run->guardIntact);
            EXPECT_TRUE(run->result || run->destinationMoved + run->length <= room);
        }
    }
}

TEST(EngineOracle, RealTextBothWays) {
    size_t files = 0;
    for (const auto &[suffix, charset] : {std::pair{".utf8.txt", CHARSET_UTF8},
                                          {".sjis.txt", CHARSET_SJIS},
                                          {".eucjp.txt", CHARSET_EUCJP},
                                          {".koi8r.txt", CHARSET_KOI8R},
                                          {".latin1.txt", CHARSET_LATIN1}}) {
        Oracle decode("UTF-16LE", name_of(charset)), encode(name_of(charset), "UTF-16LE");
        for (const std::string &file : testsupport::corpus_files(suffix)) {
            SCOPED_TRACE(file);
            const std::string text = *testsupport::read_corpus(file);
            const std::u16string expected = as_units(*decode(text));
            const std::string encoded = *encode(as_bytes(expected));
            // Exactly the room the text and its terminator need.
            EXPECT_TRUE(to_unicode(charset, text, 2 * (expected.size() + 1)).units() == z(expected));
            EXPECT_TRUE(from_unicode(charset, expected, encoded.size() + 1).output == encoded + '\0');
            ++files;
        }
    }
    if (files == 0) GTEST_SKIP() << "no corpora";
}

TEST(EngineOracle, ComposingConverterHoldsNothingAcrossCalls) {
    // glibc's Big5-HKSCS keeps U+00CA/U+00EA back in case a combining mark
    // follows; neither a single character nor a failed text may leave it held.
    char bytes[8] = {};
    char *cursor = bytes;
    ASSERT_EQ(FromUnicodeToCharset(CHARSET_BIG5HKSCS, 0x00EA, &cursor), 1);
    EXPECT_EQ(std::string(bytes, cursor), "\x88\xA7");
    cursor = bytes;
    ASSERT_EQ(FromUnicodeToCharset(CHARSET_BIG5HKSCS, 'B', &cursor), 1);
    EXPECT_EQ(std::string(bytes, cursor), "B");

    const uint16_t text[] = {'A', 0x00CA, 'B', 0};
    const uint16_t *source = text;
    char *destination = bytes;
    uint32_t length = 2;  // A fits, then the held U+00CA with B does not
    ASSERT_EQ(StringFromUnicodeToCharset(CHARSET_BIG5HKSCS, &source, &destination, &length), 0);
    const uint16_t next[] = {'B', 0};
    source = next;
    destination = bytes;
    length = sizeof bytes;
    ASSERT_EQ(StringFromUnicodeToCharset(CHARSET_BIG5HKSCS, &source, &destination, &length), 1);
    EXPECT_EQ(std::string(bytes, length), std::string("B\0", 2));
}
