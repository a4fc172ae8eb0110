// The EUC-JP converters as the host sees them: the prompt when the platform
// lacks one, silence on stderr, iconv calls per character, and the Mem_alloc
// buffer of StringToCurrentEncoding. The test supplies the host services.
#include <dlfcn.h>
#include <gtest/gtest.h>
#include <iconv.h>

#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

#include "test_support.h"
#include "textconv.h"

namespace {
bool eucjpMissing = false, memoryExhausted = false;
int promptAnswer = 1;
int iconvCalls = 0, memAllocs = 0, memFrees = 0;
std::vector<std::string> prompts;
}  // namespace

extern "C" {
iconv_t iconv_open(const char *to, const char *from) {
    if (eucjpMissing && (!std::strcmp(to, "EUC-JP") || !std::strcmp(from, "EUC-JP")))
        return reinterpret_cast<iconv_t>(-1);
    static auto real =
        reinterpret_cast<iconv_t (*)(const char *, const char *)>(dlsym(RTLD_NEXT, "iconv_open"));
    return real(to, from);
}
size_t iconv(iconv_t cd, char **in, size_t *inLeft, char **out, size_t *outLeft) {
    ++iconvCalls;
    static auto real = reinterpret_cast<size_t (*)(iconv_t, char **, size_t *, char **, size_t *)>(
        dlsym(RTLD_NEXT, "iconv"));
    return real(cd, in, inLeft, out, outLeft);
}
int UIYesNoDisplay(uint32_t question, uint32_t a, uint32_t b, const char *from, const char *to) {
    prompts.push_back(std::to_string(question) + std::to_string(a) + std::to_string(b) + " " + from + "->" +
                      to);
    return promptAnswer;
}
void *HostMalloc(uint32_t size, uint32_t) { return std::malloc(size); }
void HostFree(void *p) { std::free(p); }
int Mem_alloc(uint32_t pool, uint32_t size, void **block) {
    if (memoryExhausted || pool != 1) return 1;
    ++memAllocs;
    return (*block = std::malloc(size)) ? 0 : 1;
}
void Mem_free(uint32_t pool, void *block) {
    memFrees += pool == 1;
    std::free(block);
}
int32_t GetiStringID(const char *key, const StringIDEntry *table) {
    for (; table->name; ++table)
        if (!std::strcmp(key, table->name)) break;
    return table->id;
}
void *memmove_soc(void *d, const void *s, uint32_t n) { return std::memmove(d, s, n); }
}

// Going on without EUC-JP: asked once per direction, then every non-ASCII
// character fails quietly, row 13 included.
TEST(EucJpConverterMissing, AcceptedFailsQuietly) {
    eucjpMissing = true;
    testing::internal::CaptureStderr();
    const uint8_t row13[2] = {13, 1};
    uint16_t unit = 0;
    EXPECT_EQ(ConvertFromJISToUnicode(row13, &unit, JIS_FORM_X0208), 0);
    EXPECT_EQ(unit, 0xFFFF);
    EXPECT_EQ(prompts, std::vector<std::string>{"300 EUC-JP->UTF-16"});
    char utf8[4];
    uint8_t count = 0;
    EXPECT_EQ(FromEUCJPtoUTF8("\xA4\xA2", utf8, &count), 2u);
    EXPECT_EQ(std::string(utf8, count), "\xEF\xBF\xBF");
    char sjis[8];
    int32_t length = 7;
    EXPECT_EQ(StringFromEUCJPToSJIS("A\xA4\xA2\x42", sjis, &length), 0);
    EXPECT_STREQ(sjis, "A B");
    EXPECT_EQ(ConvertFromUnicodeToEUCJP(0x2460, sjis), 0);  // the table is not tried either
    EXPECT_EQ(prompts, (std::vector<std::string>{"300 EUC-JP->UTF-16", "300 UTF-16->EUC-JP"}));
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
}

TEST(EucJpConverterMissing, DeclinedEndsTheProcess) {
    eucjpMissing = true;
    promptAnswer = 0;
    const uint8_t hiragana[2] = {4, 2};
    uint16_t unit;
    EXPECT_EXIT(ConvertFromJISToUnicode(hiragana, &unit, JIS_FORM_X0208), testing::ExitedWithCode(1), "");
    EXPECT_EXIT(ConvertFromUnicodeToEUCJP(0x3042, reinterpret_cast<char *>(&unit)),
                testing::ExitedWithCode(1), "");
}

// One iconv call per new character plus the first use's throwaway; none for
// a character seen before or for row 13.
TEST(EucJpConverter, IconvCallsPerCharacter) {
    const uint8_t hiragana[2] = {4, 2}, other[2] = {4, 4}, row13[2] = {13, 1};
    uint16_t unit;
    ConvertFromJISToUnicode(hiragana, &unit, JIS_FORM_X0208);
    EXPECT_EQ(iconvCalls, 2);
    for (const uint8_t *seen : {hiragana, row13}) ConvertFromJISToUnicode(seen, &unit, JIS_FORM_X0208);
    EXPECT_EQ(iconvCalls, 2);
    ConvertFromJISToUnicode(other, &unit, JIS_FORM_X0208);
    EXPECT_EQ(unit, 0x3044);
    EXPECT_EQ(iconvCalls, 3);
    char sjis[16];
    int32_t length = 15;
    EXPECT_EQ(StringFromEUCJPToSJIS("\xA4\xA2\xA4\xA2\xA4\xA2\xAD\xA1", sjis, &length), 1);
    EXPECT_STREQ(sjis, "\x82\xA0\x82\xA0\x82\xA0\x87\x40");
    EXPECT_EQ(iconvCalls, 3 + 2);  // one encoding each for the hiragana and the circled digit
    EXPECT_TRUE(prompts.empty());
}

// On an EUC-JP device (a real locale through LOCPATH): a new buffer with
// glibc's conversion, or the input itself and no buffer left behind.
TEST(StringToCurrentEncoding, EucJpDevice) {
    setenv("LC_ALL", "ja_JP.eucJP", 1);  // glibc reports "EUC-JP"; the name says "eucJP"
    ASSERT_EQ(LocalEncoding(), CHARSET_EUCJP);
    char *result = nullptr;
    for (const char *sjis : {"", "A\xB1\x88\x9F", "\x82\xA0\xB6\xC5 ok"}) {
        ASSERT_EQ(StringToCurrentEncoding(sjis, &result), 1);
        EXPECT_NE(result, sjis);
        EXPECT_EQ(std::string(result), *testsupport::iconv_convert("EUC-JP", "SJIS", sjis));
        Mem_free(1, result);
    }
    for (const char *refused : {"\x82\xA0\t", "\x82\xA0"}) {  // an invalid byte, then no memory
        EXPECT_EQ(StringToCurrentEncoding(refused, &result), 0);
        EXPECT_EQ(result, refused);
        memoryExhausted = true;
    }
    EXPECT_EQ(memAllocs, 4);
    EXPECT_EQ(memFrees, 4);
}

TEST(StringToCurrentEncoding, OtherDeviceHandsBackTheInput) {
    setenv("LC_ALL", "ja_JP.SJIS", 1);
    const char *sjis = "\x82\xA0";
    char *same = nullptr;
    EXPECT_EQ(StringToCurrentEncoding(sjis, &same), 0);
    EXPECT_EQ(same, sjis);
    EXPECT_EQ(memAllocs, 0);
}
