// Shift-JIS <-> JIS row/cell arithmetic and Shift-JIS -> EUC-JP strings,
// exhaustive over every two-byte sequence with glibc as oracle.
#include <gtest/gtest.h>

#include <set>

#include "japanese_test_util.h"
#include "test_support.h"
#include "textconv.h"

using testsupport::hex;

namespace {

bool single(unsigned b) { return (b >= 0x20 && b <= 0x7E) || (b >= 0xA1 && b <= 0xDF); }
bool lead(unsigned b) { return (b >= 0x81 && b <= 0x9F) || (b >= 0xE0 && b <= 0xEF); }
bool trail(unsigned b) { return (b >= 0x40 && b <= 0x7E) || (b >= 0x80 && b <= 0xFC); }

// Converts with the given capacity; guard bytes after it must stay.
std::string sjis_to_eucjp(const std::string &sjis, uint32_t capacity, int *result) {
    std::string out(capacity + 8, '\xEE');
    uint32_t length = capacity;
    *result = StringFromSJISToEUCJP(sjis.c_str(), out.data(), &length);
    EXPECT_EQ(out.find_first_not_of('\xEE', capacity), std::string::npos) << capacity << " " << hex(sjis);
    if (capacity == 0) return length == 0 ? "" : "bad length";
    EXPECT_EQ(out[length - 1], '\0');
    return out.substr(0, length - 1);
}

}  // namespace

// Singles, every valid double-byte code (a bijection onto 94 x 94 rows/cells,
// inverted by FromJisToSJis, agreeing with glibc's EUC-JP wherever it maps),
// everything else rejected without a write.
TEST(ShiftJisJis, EveryTwoByteSequence) {
    jptest::Oracle glibc("EUC-JP", "SJIS");
    std::set<std::pair<int, int>> rowCells;
    int glibcMapped = 0;
    for (unsigned b0 = 1; b0 < 0x100; ++b0) {
        for (unsigned b1 = 0; b1 < 0x100; ++b1) {
            const char bytes[3] = {static_cast<char>(b0), static_cast<char>(b1), 0};
            const std::string code(bytes, 2);
            uint8_t kind = 0xEE, consumed = 0xEE;
            JisCode jis = {{0xEE, 0xEE}};
            const int ok = FromSJisToJis(bytes, &kind, &jis, &consumed);
            SCOPED_TRACE(hex(code));
            if (single(b0)) {
                ASSERT_TRUE(ok && kind == MB_KIND_SINGLE && consumed == 1 && jis.byte[0] == b0);
            } else if (lead(b0) && trail(b1)) {
                ASSERT_TRUE(ok && kind == MB_KIND_JISX0208 && consumed == 2);
                rowCells.insert({jis.byte[0], jis.byte[1]});
                char back[2];
                uint8_t length = 0;
                ASSERT_TRUE(FromJisToSJis(MB_KIND_JISX0208, &jis, back, &length));
                ASSERT_EQ(std::string(back, length), code);
                if (auto euc = glibc(code)) {
                    ++glibcMapped;
                    ASSERT_EQ(*euc, (std::string{static_cast<char>(jis.byte[0] + 0xA0),
                                                 static_cast<char>(jis.byte[1] + 0xA0)}));
                }
            } else {
                ASSERT_TRUE(!ok && kind == 0xEE && consumed == 0xEE && jis.byte[0] == 0xEE &&
                            jis.byte[1] == 0xEE);
            }
        }
    }
    EXPECT_EQ(rowCells.size(), 94u * 94u);
    EXPECT_EQ(rowCells.begin()->first, 1);
    EXPECT_EQ(rowCells.rbegin()->second, 94);
    EXPECT_GT(glibcMapped, 6800);
}

// FromJisToSJis takes exactly kinds 1 and 2 with in-range codes, else writes nothing.
TEST(ShiftJisJis, JisToShiftJisRange) {
    for (uint32_t kind = 0; kind <= 7; ++kind) {
        for (unsigned b0 = 0; b0 < 0x100; ++b0) {
            for (unsigned b1 = 0; b1 < 0x100; b1 += (kind == MB_KIND_JISX0208 ? 1 : 51)) {
                const JisCode jis = {{static_cast<uint8_t>(b0), static_cast<uint8_t>(b1)}};
                char out[2] = {'\xEE', '\xEE'};
                uint8_t length = 0xEE;
                const bool valid = (kind == MB_KIND_SINGLE && single(b0)) ||
                                   (kind == MB_KIND_JISX0208 && b0 >= 1 && b0 <= 94 && b1 >= 1 && b1 <= 94);
                ASSERT_EQ(FromJisToSJis(kind, &jis, out, &length), valid ? 1 : 0) << kind << " " << b0;
                ASSERT_TRUE(valid || (out[0] == '\xEE' && length == 0xEE));
            }
        }
    }
}

TEST(ShiftJisToEucJp, CorpusAgreesWithGlibc) {
    jptest::Oracle glibc("EUC-JP", "SJIS");
    for (const std::string &file : testsupport::corpus_files(".sjis.txt")) {
        auto text = testsupport::read_corpus(file);
        if (!text) GTEST_SKIP() << "no corpora";
        for (const std::string &piece : jptest::split_on_controls(*text)) {
            int result;
            ASSERT_EQ(sjis_to_eucjp(piece, 2 * piece.size() + 1, &result), glibc(piece).value_or("?"))
                << file;
            ASSERT_EQ(result, 1);
        }
    }
}

// Every capacity: the longest prefix that fits at a character boundary.
TEST(ShiftJisToEucJp, EveryCapacity) {
    const std::string sjis = "A\xB1\x88\x9F\x82\xA0 \xDF\xEF\xFCz",
                      full = "A\x8E\xB1\xB0\xA1\xA4\xA2 \x8E\xDF\xFE\xFEz";
    for (uint32_t capacity = 0; capacity <= full.size() + 2; ++capacity) {
        int result;
        const std::string part = sjis_to_eucjp(sjis, capacity, &result);
        EXPECT_EQ(result, 1);
        ASSERT_EQ(full.compare(0, part.size(), part), 0) << capacity;
        ASSERT_TRUE(part.size() == full.size() ||
                    part.size() + (static_cast<unsigned char>(full[part.size()]) >= 0x80 ? 3 : 2) > capacity);
    }
}

// Invalid bytes become one space each and never take an ASCII byte with them.
TEST(ShiftJisToEucJp, InvalidBytes) {
    // clang-format off
    const std::pair<const char *, const char *> cases[] = {
        {"A\tB", "A B"}, {"\x88", " "}, {"\x81\x3F", " ?"}, {"\x81\"x", " \"x"}, {"\x81<\x82\xA0", " <\xA4\xA2"},
        {"\x80\xA0\xF0\xFF", "    "}, {"\x81\x7F", "  "}, {"\xEF\xFD", "  "}};
    // clang-format on
    for (const auto &[in, out] : cases) {
        int result;
        EXPECT_EQ(sjis_to_eucjp(in, 64, &result), out) << hex(in);
        EXPECT_EQ(result, 0);
    }
}
