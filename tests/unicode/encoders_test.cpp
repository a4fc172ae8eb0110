// Direct encoders to UTF-8, against glibc iconv where it has the same mapping.
#include <gtest/gtest.h>

#include <string>

#include "test_support.h"
#include "textconv.h"

using testsupport::hex;

namespace {

std::string ucs4(uint32_t v) {
    char buf[8] = {};
    uint8_t n = 0xEE;
    if (!FromUCS4toUTF8(v, buf, &n)) return "fail";
    return std::string(buf, n);
}

TEST(FromUCS4toUTF8, LengthBoundariesAndExtendedForms) {
    struct Case {
        uint32_t value;
        std::string bytes;
    } cases[] = {
        {0x00, std::string(1, '\0')},
        {0x41, "\x41"},
        {0x7F, "\x7F"},
        {0x80, "\xC2\x80"},
        {0x7FF, "\xDF\xBF"},
        {0x800, "\xE0\xA0\x80"},
        {0xD800, "\xED\xA0\x80"},  // surrogates are not rejected
        {0xFFFF, "\xEF\xBF\xBF"},
        {0x10000, "\xF0\x90\x80\x80"},
        {0x10FFFF, "\xF4\x8F\xBF\xBF"},
        {0x110000, "\xF4\x90\x80\x80"},
        {0x1FFFFF, "\xF7\xBF\xBF\xBF"},
        {0x200000, "\xF8\x88\x80\x80\x80"},
        {0x3FFFFFF, "\xFB\xBF\xBF\xBF\xBF"},
        {0x4000000, "\xFC\x84\x80\x80\x80\x80"},
        {0x7FFFFFFF, "\xFD\xBF\xBF\xBF\xBF\xBF"},
    };
    for (const auto &c : cases) EXPECT_EQ(hex(ucs4(c.value)), hex(c.bytes)) << std::hex << c.value;
}

TEST(FromUCS4toUTF8, TopBitSetFailsAndTouchesNothing) {
    for (uint32_t v : {0x80000000u, 0xFFFFFFFFu}) {
        char buf[8] = {1, 2, 3, 4, 5, 6, 7, 8};
        uint8_t n = 0xEE;
        EXPECT_EQ(FromUCS4toUTF8(v, buf, &n), 0);
        EXPECT_EQ(n, 0xEE);
        EXPECT_EQ(hex(std::string(buf, 8)), hex(std::string("\1\2\3\4\5\6\7\x08", 8)));
    }
}

TEST(FromUCS4toUTF8, EveryScalarValueMatchesIconv) {
    // The whole Unicode range in one string each way: both sides must agree.
    std::string mine;
    std::u32string cps;
    for (uint32_t v = 0; v <= 0x10FFFF; ++v) {
        if (v >= 0xD800 && v <= 0xDFFF) continue;
        mine += ucs4(v);
        cps += static_cast<char32_t>(v);
    }
    std::string raw(reinterpret_cast<const char *>(cps.data()), cps.size() * 4);
    auto want = testsupport::iconv_convert("UTF-8", "UTF-32LE", raw);
    ASSERT_TRUE(want);
    EXPECT_TRUE(mine == *want);
}

TEST(FromKOI8RtoUTF8, EveryByteMatchesIconv) {
    for (int b = 1; b < 256; ++b) {
        const char in = static_cast<char>(b);
        char out[4] = {};
        uint8_t n = 0;
        ASSERT_EQ(FromKOI8RtoUTF8(&in, out, &n), 1);
        auto want = testsupport::iconv_convert("UTF-8", "KOI8-R", std::string(1, in));
        ASSERT_TRUE(want) << b;
        EXPECT_EQ(hex(std::string(out, n)), hex(*want)) << "byte " << b;
        EXPECT_EQ(n, b < 0x80 ? 1 : (*want)[0] == '\xE2' ? 3 : 2);
    }
    char out[4] = {};
    uint8_t n = 0;
    EXPECT_EQ(FromKOI8RtoUTF8("\0", out, &n), 1);
    EXPECT_EQ(n, 1);
    EXPECT_EQ(out[0], '\0');
}

std::string latin1(const std::string &in, uint32_t *len = nullptr) {
    std::string out(2 * in.size() + 1 + 8, '\x5A');
    uint32_t n = 0xDEAD;
    EXPECT_EQ(StringFromLatin1ToUTF8(in.c_str(), out.data(), &n), 1);
    // Nothing beyond the terminator is touched.
    EXPECT_EQ(out.find_first_not_of('\x5A', n), std::string::npos);
    if (len) *len = n;
    EXPECT_GE(n, 1u);
    EXPECT_EQ(out[n - 1], '\0');
    return out.substr(0, n - 1);
}

TEST(StringFromLatin1ToUTF8, EveryByteAndEveryLengthMatchIconv) {
    std::string all;
    for (int b = 1; b < 256; ++b) all += static_cast<char>(b);
    // Each byte alone, then every prefix and suffix of the full range (the
    // lengths cross every block size a fast path may use).
    for (int b = 1; b < 256; ++b) {
        std::string s(1, static_cast<char>(b));
        EXPECT_EQ(hex(latin1(s)), hex(*testsupport::iconv_convert("UTF-8", "ISO-8859-1", s))) << b;
    }
    for (size_t i = 0; i <= all.size(); ++i) {
        for (const std::string &s : {all.substr(0, i), all.substr(i)}) {
            uint32_t n = 0;
            std::string got = latin1(s, &n);
            std::string want = *testsupport::iconv_convert("UTF-8", "ISO-8859-1", s);
            ASSERT_EQ(hex(got), hex(want)) << i;
            EXPECT_EQ(n, want.size() + 1);
        }
    }
    uint32_t n = 0;
    EXPECT_EQ(latin1("", &n), "");
    EXPECT_EQ(n, 1u);
    if (auto text = testsupport::read_corpus("french.latin1.txt")) {
        EXPECT_TRUE(latin1(*text) == *testsupport::iconv_convert("UTF-8", "ISO-8859-1", *text));
    }
}

}  // namespace
