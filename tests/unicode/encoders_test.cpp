// Direct encoders to UTF-8 against glibc iconv where it has the same mapping.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "test_support.h"
#include "textconv.h"

using testsupport::hex;

namespace {

std::string ucs4(uint32_t v) {
    char buf[8] = {1, 2, 3, 4, 5, 6, 7, 8};
    uint8_t n = 0xEE;
    if (!FromUCS4toUTF8(v, buf, &n))
        return n == 0xEE && std::string(buf, 8) == "\1\2\3\4\5\6\7\x08" ? "fail" : "dirty";
    return std::string(buf, n);
}

// Unicode itself in one string each way; beyond it the extended forms, and a
// set top bit fails without touching anything.
TEST(FromUCS4toUTF8, EveryValue) {
    std::string mine;
    std::u32string cps;
    for (uint32_t v = 0; v <= 0x10FFFF; ++v) {
        if (v >= 0xD800 && v <= 0xDFFF) continue;
        mine += ucs4(v);
        cps += static_cast<char32_t>(v);
    }
    const auto want = testsupport::iconv_convert(
        "UTF-8", "UTF-32LE", std::string(reinterpret_cast<const char *>(cps.data()), cps.size() * 4));
    ASSERT_TRUE(want);
    EXPECT_TRUE(mine == *want);
    const std::pair<uint32_t, std::string> cases[] = {
        // clang-format off
        {0xD800, "\xED\xA0\x80"}, {0x110000, "\xF4\x90\x80\x80"}, {0x1FFFFF, "\xF7\xBF\xBF\xBF"},
        {0x200000, "\xF8\x88\x80\x80\x80"}, {0x3FFFFFF, "\xFB\xBF\xBF\xBF\xBF"},
        {0x4000000, "\xFC\x84\x80\x80\x80\x80"}, {0x7FFFFFFF, "\xFD\xBF\xBF\xBF\xBF\xBF"},
        {0x80000000, "fail"}, {0xFFFFFFFF, "fail"},
        // clang-format on
    };
    for (const auto &[value, bytes] : cases) EXPECT_EQ(hex(ucs4(value)), hex(bytes)) << std::hex << value;
}

TEST(FromKOI8RtoUTF8, EveryByteMatchesIconv) {
    for (int b = 0; b < 256; ++b) {
        const char in = static_cast<char>(b);
        char out[4] = {};
        uint8_t n = 0;
        ASSERT_EQ(FromKOI8RtoUTF8(&in, out, &n), 1);
        const auto want = testsupport::iconv_convert("UTF-8", "KOI8-R", std::string(1, in));
        ASSERT_TRUE(want) << b;
        EXPECT_EQ(hex(std::string(out, n)), hex(*want)) << "byte " << b;
    }
}

// Every prefix and suffix of the whole byte range (lengths across every block
// size a fast path may use), the empty string and a corpus; exactly the
// bytes reported are written.
TEST(StringFromLatin1ToUTF8, EveryByteAndEveryLengthMatchIconv) {
    std::string all;
    for (int b = 1; b < 256; ++b) all += static_cast<char>(b);
    std::vector<std::string> inputs;
    for (size_t i = 0; i <= all.size(); ++i) inputs.insert(inputs.end(), {all.substr(0, i), all.substr(i)});
    if (auto text = testsupport::read_corpus("french.latin1.txt")) inputs.push_back(*text);
    for (const std::string &in : inputs) {
        const std::string want = *testsupport::iconv_convert("UTF-8", "ISO-8859-1", in) + '\0';
        std::string out(2 * in.size() + 1 + 8, '\x5A');
        uint32_t n = 0xDEAD;
        ASSERT_EQ(StringFromLatin1ToUTF8(in.c_str(), out.data(), &n), 1);
        ASSERT_EQ(n, want.size()) << in.size();
        ASSERT_EQ(hex(out.substr(0, n)), hex(want)) << in.size();
        ASSERT_EQ(out.find_first_not_of('\x5A', n), std::string::npos) << in.size();
    }
}

}  // namespace
