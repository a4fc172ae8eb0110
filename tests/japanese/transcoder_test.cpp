// The string transcoders against glibc on real text and on random strings
// from the whole code space, and their handling of bad bytes.
#include <gtest/gtest.h>

#include <random>

#include "japanese_test_util.h"
#include "test_support.h"
#include "textconv.h"

using testsupport::hex;

namespace {

struct Result {
    int ok;
    std::string out;
    int64_t length;
};

// Sources end at an unreadable page; guard bytes after the output must stay.
// The UTF-8 transcoders get exactly the room their contract asks for.
template <typename Transcoder>
Result to_utf8(Transcoder transcoder, const std::string &in, size_t size) {
    jptest::Guarded source(in);
    std::string out(size + 8, '\x01');
    uint32_t length = 0xDEAD;
    const int ok = transcoder(source.c_str(), out.data(), &length);
    EXPECT_EQ(out.find_first_not_of('\x01', size), std::string::npos) << hex(in);
    return {ok, out.substr(0, ok ? length - 1 : out.find('\x01')), length};
}
Result eucjp_to_utf8(const std::string &euc) {
    return to_utf8(StringFromEUCJPToUTF8, euc, euc.size() * 3 / 2 + 1);
}
Result sjis_to_utf8(const std::string &sjis) {
    return to_utf8(StringFromSJISToUTF8, sjis, sjis.size() * 3 + 1);
}

// room: bytes allowed before the terminator.
Result eucjp_to_sjis(const std::string &euc, int32_t room) {
    jptest::Guarded in(euc);
    std::string out((room > 0 ? room : 0) + 1 + 8, '\x01');
    int32_t length = room;
    const int ok = StringFromEUCJPToSJIS(in.c_str(), out.data(), &length);
    EXPECT_EQ(out.find_first_not_of('\x01', room >= 0 ? room + 1 : 0), std::string::npos) << room << hex(euc);
    return {ok, length > 0 ? out.substr(0, length - 1) : "", length};
}

std::string utf8_of(char16_t u) {
    char buf[4];
    uint8_t n = 0;
    FromUCS4toUTF8(u, buf, &n);
    return std::string(buf, n);
}

std::string ascii_only(const std::string &s) {
    std::string out;
    for (char c : s)
        if (static_cast<unsigned char>(c) < 0x80) out += c;
    return out;
}

}  // namespace

TEST(JapaneseTranscoders, CorpusAgreesWithGlibc) {
    jptest::Oracle eucToUtf8("UTF-8", "EUC-JP"), sjisToUtf8("UTF-8", "SJIS"), eucToSjis("SJIS", "EUC-JP");
    for (const std::string &file : testsupport::corpus_files(".eucjp.txt")) {
        auto text = testsupport::read_corpus(file);
        if (!text) GTEST_SKIP() << "no corpora";
        const Result utf8 = eucjp_to_utf8(*text);  // control characters pass: the whole file at once
        EXPECT_EQ(utf8.ok, 1) << file;
        EXPECT_TRUE(utf8.out == eucToUtf8(*text).value_or("glibc failed")) << file;
        // Shift-JIS has no JIS X 0212: each such character becomes a space.
        std::string without0212 = *text;
        for (size_t at; (at = without0212.find('\x8F')) != std::string::npos;)
            without0212.replace(at, 3, " ");
        const Result sjis = eucjp_to_sjis(*text, static_cast<int32_t>(text->size()));
        EXPECT_EQ(sjis.ok, without0212 == *text ? 1 : 0) << file;
        EXPECT_TRUE(sjis.out == eucToSjis(without0212).value_or("glibc failed")) << file;
    }
    for (const std::string &file : testsupport::corpus_files(".sjis.txt")) {
        for (const std::string &piece : jptest::split_on_controls(*testsupport::read_corpus(file))) {
            const Result utf8 = sjis_to_utf8(piece);
            // glibc's Shift-JIS reads 0x5C and 0x7E as YEN SIGN and OVERLINE; here they stay ASCII.
            std::string want = sjisToUtf8(piece).value_or("glibc failed");
            for (auto [from, to] : {std::pair<std::string, char>{"\xC2\xA5", '\\'}, {"\xE2\x80\xBE", '~'}})
                for (size_t at; (at = want.find(from)) != std::string::npos;)
                    want.replace(at, from.size(), 1, to);
            ASSERT_TRUE(utf8.ok == 1 && utf8.out == want) << file << hex(piece);
        }
    }
}

// Random strings of ASCII, half-width katakana, JIS X 0208 (mapped, unmapped,
// row 13) and JIS X 0212, each character's expected output from glibc alone.
TEST(JapaneseTranscoders, RandomTextAgreesWithGlibcPerCharacter) {
    jptest::Oracle eucToUnit("UTF-16LE", "EUC-JP"), eucToSjis("SJIS", "EUC-JP");
    std::mt19937 rng(2024);
    for (int round = 0; round < 300; ++round) {
        std::string euc, sjis, utf8FromEuc, utf8FromSjis, sjisFromEuc;
        for (int i = 0; i < 40; ++i) {
            JisCode jis = {{static_cast<uint8_t>(1 + rng() % 94), static_cast<uint8_t>(1 + rng() % 94)}};
            const unsigned pick = rng() % 5;  // ASCII, katakana, row 13, JIS X 0212, JIS X 0208
            const uint32_t kind = pick < 2 ? MB_KIND_SINGLE : pick == 3 ? MB_KIND_JISX0212 : MB_KIND_JISX0208;
            if (pick == 0) jis.byte[0] = static_cast<uint8_t>(0x20 + rng() % 0x5F);
            if (pick == 1) jis.byte[0] = static_cast<uint8_t>(0xA1 + rng() % 63);
            if (pick == 2) jis.byte[0] = 13;
            std::string e = pick == 0   ? std::string(1, jis.byte[0])
                            : pick == 1 ? std::string{'\x8E', static_cast<char>(jis.byte[0])}
                                        : std::string{static_cast<char>(jis.byte[0] + 0xA0),
                                                      static_cast<char>(jis.byte[1] + 0xA0)};
            if (kind == MB_KIND_JISX0212) e.insert(0, 1, '\x8F');
            std::optional<char16_t> unit = eucToUnit.unit(e);
            if (kind == MB_KIND_JISX0208 && jis.byte[0] == 13 &&
                MS_Sun_extension_table[jis.byte[1] - 1] != 0xFFFF)
                unit = MS_Sun_extension_table[jis.byte[1] - 1];
            euc += e;
            utf8FromEuc += utf8_of(unit.value_or(0xFFFF));
            uint8_t s[2], n;
            if (auto viaGlibc = eucToSjis(e))
                sjisFromEuc += *viaGlibc;
            else if (unit && FromUnicodeToMultiByte(*unit, MB_KIND_SJIS, nullptr, s, &n))
                sjisFromEuc.append(reinterpret_cast<char *>(s), n);  // row 13: wherever EUC-JP puts it
            else
                sjisFromEuc += ' ';
            if (kind != MB_KIND_JISX0212) {
                ASSERT_TRUE(FromJisToSJis(kind, &jis, reinterpret_cast<char *>(s), &n));
                sjis.append(reinterpret_cast<char *>(s), n);
                utf8FromSjis += utf8_of(unit.value_or(0xFFFF));
            }
        }
        const Result a = eucjp_to_utf8(euc), b = sjis_to_utf8(sjis), c = eucjp_to_sjis(euc, 4 * 40);
        ASSERT_TRUE(a.ok == 1 && a.out == utf8FromEuc) << hex(euc);
        ASSERT_TRUE(b.ok == 1 && b.out == utf8FromSjis) << hex(sjis);
        ASSERT_EQ(c.out, sjisFromEuc) << hex(euc);
    }
}

// Bad bytes: a space (Shift-JIS output), U+FFFF (unmappable or malformed) or
// an early stop (a byte that cannot start a character; utf8 null); an ASCII
// byte is never taken into a bad sequence.
TEST(JapaneseTranscoders, BadBytes) {
    const struct {
        const char *euc, *utf8, *sjis;
    } cases[] = {
        // clang-format off
        {"\xA4\xFF\x41", "\xEF\xBF\xBF\x41", " \x41"}, {"\xF5\xA1\x41", "\xEF\xBF\xBF\x41", " \x41"},
        {"\x8F\xB0\xA1\x41", "\xE4\xB8\x82\x41", " \x41"}, {"\xA4\x41", nullptr, " \x41"},
        {"\x8E\x41", nullptr, "\x41"}, {"\x8F\xB0\x41", nullptr, " \x41"}, {"\x8F\x41\x42", nullptr, " \x41\x42"},
        {"\x85\x41", nullptr, " \x41"}, {"\x41\x80\x42", nullptr, "\x41 \x42"}, {"\xA4", nullptr, " "},
        {"\x8F\xB0", nullptr, " "}, {"\xFF\xA4\xA2", nullptr, " \x82\xA0"},
        // clang-format on
    };
    for (const auto &c : cases) {
        const Result utf8 = eucjp_to_utf8(c.euc), sjis = eucjp_to_sjis(c.euc, 16);
        EXPECT_TRUE(c.utf8 ? utf8.ok == 1 && utf8.out == c.utf8 : utf8.ok == 0 && utf8.length == 0xDEAD)
            << hex(c.euc);
        EXPECT_EQ(sjis.out, c.sjis) << hex(c.euc);
        EXPECT_EQ(sjis.ok, std::string(c.sjis).find(' ') == std::string::npos) << hex(c.euc);
    }
    EXPECT_EQ(eucjp_to_utf8("\x41\x80\x42").out, "\x41");
    const Result tab = sjis_to_utf8("\x41\t\x42");
    EXPECT_TRUE(tab.ok == 0 && tab.length == 2 && tab.out == "\x41");
    EXPECT_EQ(sjis_to_utf8("\x81\x3F").length, 1);  // a lead byte before "?" does not decode
}

// Random bytes: no read past the terminator, no write past the room, and the
// input's ASCII bytes come out in order.
TEST(JapaneseTranscoders, RandomBytesKeepEveryAsciiByte) {
    std::mt19937 rng(99);
    for (int round = 0; round < 3000; ++round) {
        std::string in;
        for (int i = 0, n = 1 + rng() % 12; i < n; ++i)
            in += static_cast<char>(rng() % 2 ? 0x21 + rng() % 0x5E : 0x80 + rng() % 0x80);
        const Result sjis = eucjp_to_sjis(in, static_cast<int32_t>(2 * in.size()));
        std::string asciiOut;  // Shift-JIS output walked character by character
        for (const char *p = sjis.out.c_str(); *p;) {
            uint8_t kind, consumed;
            JisCode jis;
            ASSERT_TRUE(FromSJisToJis(p, &kind, &jis, &consumed)) << hex(in);
            if (consumed == 1 && *p != ' ' && static_cast<unsigned char>(*p) < 0x80) asciiOut += *p;
            p += consumed;
        }
        ASSERT_EQ(asciiOut, ascii_only(in)) << hex(in);
        const Result utf8 = eucjp_to_utf8(in);
        ASSERT_TRUE(!utf8.ok || ascii_only(utf8.out) == ascii_only(in)) << hex(in);
        sjis_to_utf8(in);
        for (size_t at = 0; at < in.size(); ++at) {
            jptest::Guarded tail(in.substr(at));
            char out[3];
            uint8_t count;
            FromEUCJPtoUTF8(tail.c_str(), out, &count);
        }
    }
}

// Every room from -1 up: the longest prefix that fits at a character boundary.
TEST(JapaneseTranscoders, EucJpToShiftJisEveryRoom) {
    const std::string euc =
                          "A\xA4\xA2\x8E\xB1\x8F\xB0\xA1\xAD\xA1"
                          "BC\xA4\xA4",
                      full =
                          "A\x82\xA0\xB1 \x87\x40"
                          "BC\x82\xA2";
    for (int32_t room = -1; room <= static_cast<int32_t>(full.size()) + 1; ++room) {
        const Result r = eucjp_to_sjis(euc, room);
        ASSERT_EQ(r.length, room < 0 ? 0 : static_cast<int64_t>(r.out.size()) + 1);
        ASSERT_EQ(full.compare(0, r.out.size(), r.out), 0) << room;
        if (r.out.size() < full.size()) {
            const unsigned char next = full[r.out.size()];
            ASSERT_GT(static_cast<int32_t>(r.out.size()) + (next >= 0x80 && next != 0xB1 ? 2 : 1), room);
        }
    }
}
