// Server code pages: each known page against glibc iconv, the bounded copy
// of text that is not converted, and the scratch buffer always given back.
#include <gtest/gtest.h>

#include <cstdlib>
#include <tuple>

#include "engine_checks.h"
#include "platform_shim.h"

using namespace enginetest;

namespace {

struct Result {
    std::string bytes;  // the whole room
    uint32_t length;
    bool guardIntact;
    std::string text() const { return bytes.c_str(); }
};

Result from_server(CharsetId charset, int32_t codePage, const std::string &source, uint32_t room) {
    std::vector<char> buffer(room + kGuard, kGuardByte);
    uint32_t length = room;
    EXPECT_EQ(StringFromServerCPToCharset(charset, codePage, source.c_str(), buffer.data(), &length), 1);
    return {std::string(buffer.data(), room), length, guard_intact(buffer, room)};
}

}  // namespace

TEST(EngineServerCP, EveryKnownCodePageAgainstIconv) {
    const std::pair<int32_t, const char *> pages[] = {
        {874, "ISO-8859-11"}, {932, "SJIS"},    {936, "GBK"},         {949, "EUC-KR"},      {950, "BIG5"},
        {1250, "CP1250"},     {1251, "CP1251"}, {1252, "ISO-8859-1"}, {1255, "ISO-8859-8"}, {1256, "CP1256"}};
    for (const auto &[page, name] : pages) {
        SCOPED_TRACE(page);
        Oracle decode("UTF-8", name);
        // Every byte the charset decodes alone, then double-byte codes.
        std::string source;
        for (int b = 1; b < 256; ++b)
            if (decode(std::string(1, char(b)))) source += char(b);
        for (int lead = 0x81; lead <= 0xFE; lead += 5)
            for (int trail = 0x40; trail <= 0xFE; ++trail) {
                const std::string code = {char(lead), char(trail)};
                if (decode(code) && decode(code)->size() > 1 && !decode(code.substr(0, 1))) source += code;
            }
        const std::string expected = *decode(source);
        const int mallocs = shim::mallocs;
        Result r = from_server(CHARSET_UTF8, page, source, uint32_t(expected.size() + 1));
        EXPECT_TRUE(r.bytes == expected + '\0');
        EXPECT_EQ(r.length, expected.size() + 1);
        EXPECT_EQ(shim::mallocs, mallocs + 1);
        EXPECT_EQ(shim::frees, shim::mallocs);
    }
    // 1252 is read as ISO-8859-1: 0x80 is U+0080, not the euro sign.
    EXPECT_EQ(from_server(CHARSET_UTF8, 1252, "\x80", 3).bytes, std::string("\xC2\x80\0", 3));
}

TEST(EngineServerCP, UnknownCodePagesAreCopiedAndCut) {
    for (int32_t page : {1253, 0, -1, 65001}) {
        Result cut = from_server(CHARSET_UTF8, page, "abcdef", 4),
               padded = from_server(CHARSET_UTF8, page, "ab", 8);
        EXPECT_EQ(std::tuple(cut.bytes, cut.length), std::tuple(std::string("abc\0", 4), 4u));
        EXPECT_EQ(std::tuple(padded.bytes, padded.length), std::tuple(std::string("ab\0\0\0\0\0\0", 8), 3u));
    }
    Result none = from_server(CHARSET_UTF8, 1253, "ab", 0);  // no room: nothing written
    EXPECT_EQ(std::tuple(none.guardIntact, none.length), std::tuple(true, 0u));
    EXPECT_EQ(shim::mallocs, 0);
}

TEST(EngineServerCP, TextNotConvertedIsCopiedFromItsStart) {
    const std::string cyrillic = "\xCF\xF0\xE8\xE2\xE5\xF2 world";  // CP1251, 19 bytes converted
    testing::internal::CaptureStderr();
    const auto expect_copy = [&](const Result &r, uint32_t length) {
        EXPECT_EQ(std::tuple(r.text(), r.length, r.guardIntact),
                  std::tuple(cyrillic.substr(0, length - 1), length, true));
    };
    shim::mallocFails = true;
    expect_copy(from_server(CHARSET_UTF8, 1251, cyrillic, 32), 13);  // no memory
    shim::mallocFails = false;
    expect_copy(from_server(CHARSET_UTF16LE, 1251, cyrillic, 32), 13);  // no converter to the target
    expect_copy(from_server(CHARSET_UTF8, 1251, cyrillic, 16), 13);     // converted text does not fit
    expect_copy(from_server(CHARSET_UTF8, 1251, cyrillic, 8), 8);       // ... nor the source
    shim::missingNames = {"SJIS"};                                      // no converter from the page
    EXPECT_EQ(from_server(CHARSET_UTF8, 932, "\x82\xA0 A", 16).text(), "\x82\xA0 A");
    EXPECT_EQ(testing::internal::GetCapturedStderr(),
              "Cannot use iconv to convert from UTF-16 to UTF16-LE (1055)\n"
              "Cannot use iconv to convert from SJIS (130) to UTF-16\n");
    EXPECT_EQ(shim::prompts, (std::vector<std::string>{"UTF-16->UTF16-LE", "SJIS->UTF-16"}));
    EXPECT_EQ(shim::frees, shim::mallocs);
    EXPECT_EQ(shim::mallocs, 4);
}

TEST(EngineServerCP, ToTheLocalEncoding) {
    setenv("LC_ALL", "C.UTF-8", 1);
    char out[8];
    uint32_t length = sizeof out;
    EXPECT_EQ(StringFromServerCPToLocal(1251, "\xC0\xE1", out, &length), 1);
    EXPECT_EQ(std::string(out, length), std::string("\xD0\x90\xD0\xB1\0", 5));
}
