// JIS forms <-> UTF-16, one character at a time: every cell and every BMP
// unit against glibc's EUC-JP, row 13 from the library's table.
#include <gtest/gtest.h>

#include <cstring>

#include "japanese_test_util.h"
#include "test_support.h"
#include "textconv.h"

using testsupport::hex;

namespace {

const uint8_t kHiragana[2] = {4, 2};

// glibc's EUC-JP bytes for a unit, else the row-13 cell holding it.
std::optional<std::string> expected_eucjp(jptest::Oracle &glibc, char16_t u) {
    std::string in(2, '\0');
    std::memcpy(in.data(), &u, 2);
    if (auto bytes = glibc(in)) return bytes;
    for (int i = 0; i < 94; ++i)
        if (u != 0xFFFF && MS_Sun_extension_table[i] == u)
            return std::string{'\xAD', static_cast<char>(0xA1 + i)};
    return std::nullopt;
}

}  // namespace

// Twice over: once through the converter, once through what the library keeps.
TEST(JisToUnicode, EveryCellAgreesWithGlibc) {
    jptest::Oracle glibc("UTF-16LE", "EUC-JP");
    int converted = 0;
    for (int pass = 0; pass < 2; ++pass) {
        for (uint32_t form : {JIS_FORM_ASCII, JIS_FORM_X0208, JIS_FORM_KATAKANA, JIS_FORM_X0212}) {
            const bool twoBytes = form == JIS_FORM_X0208 || form == JIS_FORM_X0212;
            for (int g0 = 1; g0 <= 94; ++g0) {
                for (int g1 = 1; g1 <= (twoBytes ? 94 : 1); ++g1) {
                    const uint8_t given[2] = {static_cast<uint8_t>(g0), static_cast<uint8_t>(g1)};
                    const char r = static_cast<char>(g0 + 0xA0), c = static_cast<char>(g1 + 0xA0);
                    const std::string euc = form == JIS_FORM_ASCII ? std::string{static_cast<char>(g0 + 0x20)}
                                            : form == JIS_FORM_KATAKANA ? std::string{'\x8E', r}
                                            : form == JIS_FORM_X0208    ? std::string{r, c}
                                                                        : std::string{'\x8F', r, c};
                    std::optional<char16_t> expected = glibc.unit(euc);
                    if (form == JIS_FORM_X0208 && g0 == 13 && MS_Sun_extension_table[g1 - 1] != 0xFFFF)
                        expected = MS_Sun_extension_table[g1 - 1];
                    uint16_t unit = 0;
                    const int ok = ConvertFromJISToUnicode(given, &unit, form);
                    ASSERT_EQ(ok, expected ? 1 : 0) << form << " " << g0 << " " << g1;
                    ASSERT_EQ(unit, expected.value_or(0xFFFF)) << form << " " << g0 << " " << g1;
                    converted += ok;
                }
            }
        }
    }
    EXPECT_GT(converted, 2 * (6879 + 5801 + 94 + 63));
}

// The first conversion of the process is the character asked for, although
// the converter's first output goes to a throwaway character.
TEST(JisToUnicode, FirstConversionOfTheProcess) {
    uint16_t unit = 0;
    EXPECT_EQ(ConvertFromJISToUnicode(kHiragana, &unit, JIS_FORM_X0208), 1);
    EXPECT_EQ(unit, 0x3042);
}

// A failing first use, then row/cell 128 (two spaces the converter partly
// takes before running out of room) and a bad form: failures with U+FFFF.
TEST(JisToUnicode, FailingFirstConversionAndGarbage) {
    const uint8_t emptyRow13Cell[2] = {13, 31}, spaces[2] = {0x80, 0x80};
    const struct {
        const uint8_t *jis;
        uint32_t form;
        uint16_t unit;  // 0xFFFF: failure
    } steps[] = {{emptyRow13Cell, JIS_FORM_X0208, 0xFFFF},
                 {kHiragana, JIS_FORM_X0208, 0x3042},
                 {spaces, JIS_FORM_X0208, 0xFFFF},
                 {kHiragana, 4, 0xFFFF}};
    for (const auto &s : steps) {
        uint16_t unit = 0;
        EXPECT_EQ(ConvertFromJISToUnicode(s.jis, &unit, s.form), s.unit != 0xFFFF);
        EXPECT_EQ(unit, s.unit);
    }
}

TEST(JisToUnicode, KindsAndEucJpCursor) {
    const struct {
        uint32_t kind;
        const char *code;
        uint16_t unit;  // 0x1234: refused, unit untouched
    } kinds[] = {       // clang-format off
        {MB_KIND_SINGLE, "A", 0x41}, {MB_KIND_SINGLE, "\xE0", 0xE0}, {MB_KIND_SINGLE, "\xB1", 0xFF71},
        {MB_KIND_SJIS, "\x82\xA0", 0x3042}, {MB_KIND_SJIS, "\x87\x40", 0x2460}, {MB_KIND_SJIS, "\x81\x3F", 0x1234},
        {MB_KIND_JISX0212, "\x10\x01", 0x4E02}, {0, "A", 0x1234}, {MB_KIND_ANY, "A", 0x1234},
        {MB_KIND_ASCII, "A", 0x1234}, {7, "A", 0x1234}};
    // clang-format on
    for (const auto &k : kinds) {
        uint16_t unit = 0x1234;
        EXPECT_EQ(FromMultiByteToUnicode(k.kind, reinterpret_cast<const uint8_t *>(k.code), &unit),
                  k.unit != 0x1234);
        EXPECT_EQ(unit, k.unit) << k.kind << " " << hex(k.code);
    }
    const struct {
        const char *euc;
        uint16_t unit;
        int advance;  // 0: failure
    } cursors[] = {
        {"\xA4\xA2", 0x3042, 2}, {"\x8E\xB1", 0xFF71, 2}, {"\x8E\x41", 0x41, 2},  {"\x8F\xB0\xA1", 0x4E02, 3},
        {"\x85", 0x85, 1},       {"\xAD\xA1", 0x2460, 2}, {"\xA4", 0, 0},         {"\x8E", 0, 0},
        {"\x8F\xB0", 0, 0},      {"\xF5\xA1", 0xFFFF, 0}, {"\xA4\x41", 0xFFFF, 0}};
    for (const auto &c : cursors) {
        jptest::Guarded text(c.euc);
        const char *cursor = text.c_str();
        uint16_t unit = 0;
        EXPECT_EQ(FromEUCJPToUnicode(&cursor, &unit), c.advance != 0) << hex(c.euc);
        EXPECT_EQ(unit, c.unit) << hex(c.euc);
        EXPECT_EQ(cursor - text.c_str(), c.advance) << hex(c.euc);
    }
}

// Every unit: ConvertFromUnicodeToEUCJP against glibc and the table;
// FromUnicodeToEUCJP the same bytes (controls pass directly, a control result
// is refused); FromUnicodeToMultiByte the same character under each request
// accepting its kind, and Shift-JIS bytes that decode back to it.
TEST(UnicodeToEucJp, EveryBmpUnit) {
    jptest::Oracle glibc("EUC-JP", "UTF-16LE"), sjisDecoder("UTF-16LE", "SJIS");
    for (uint32_t u = 0; u <= 0xFFFF; ++u) {
        SCOPED_TRACE(u);
        const uint16_t unit = static_cast<uint16_t>(u);
        const auto expected = expected_eucjp(glibc, unit);
        char euc[3] = {0, 0, 0};
        ASSERT_EQ(ConvertFromUnicodeToEUCJP(unit, euc), expected ? 1 : 0);
        const uint8_t lead = static_cast<uint8_t>(euc[0]);
        const size_t size = lead == 0x8F ? 3 : (lead == 0x8E || (lead >= 0xA1 && lead <= 0xFE)) ? 2 : 1;
        ASSERT_TRUE(!expected || std::string(euc, size) == *expected);

        const bool direct = u <= 0x8D || (u >= 0x90 && u <= 0x9F);
        const bool refused =
            !expected || lead <= 0x1F || (lead >= 0x7F && lead <= 0x9F && lead != 0x8E && lead != 0x8F);
        char out[4] = {0, 0, 0, 0}, *cursor = out;
        ASSERT_EQ(FromUnicodeToEUCJP(unit, &cursor), direct || !refused ? 1 : 0);
        ASSERT_EQ(std::string(out, cursor - out), direct    ? std::string(1, static_cast<char>(u))
                                                  : refused ? std::string()
                                                            : *expected);

        uint8_t anyKind = 0, anyCode[2] = {0, 0}, anyLength = 0;
        const int any = FromUnicodeToMultiByte(unit, MB_KIND_ANY, &anyKind, anyCode, &anyLength);
        ASSERT_EQ(any, refused ? 0 : 1);
        for (uint32_t request : {0u, 1u, 2u, 3u, 6u, 7u}) {
            uint8_t code[2] = {0, 0}, length = 0;
            const bool accepted =
                any && request <= 3 &&
                (request == anyKind || (request == MB_KIND_SINGLE && anyKind == MB_KIND_ASCII));
            ASSERT_EQ(FromUnicodeToMultiByte(unit, request, nullptr, code, &length), accepted ? 1 : 0);
            ASSERT_TRUE(!accepted || (length == anyLength && std::memcmp(code, anyCode, length) == 0));
        }
        uint8_t kind = 0, sjis[3] = {0, 0, 0}, length = 0;
        if (!FromUnicodeToMultiByte(unit, MB_KIND_SJIS, &kind, sjis, &length)) {
            ASSERT_TRUE(!any || anyKind == MB_KIND_JISX0212);
            continue;
        }
        ASSERT_EQ(kind, MB_KIND_SJIS);
        uint16_t back = 0;
        ASSERT_EQ(FromMultiByteToUnicode(MB_KIND_SJIS, sjis, &back), 1);
        ASSERT_EQ(back, u == 0xA5 ? 0x5C : u == 0x203E ? 0x7E : u);  // glibc's EUC-JP folds these two
        auto viaGlibc = sjisDecoder.unit(std::string(reinterpret_cast<char *>(sjis), length));
        ASSERT_TRUE(!viaGlibc || (length == 1 && (sjis[0] == 0x5C || sjis[0] == 0x7E)) || *viaGlibc == u);
    }
}
