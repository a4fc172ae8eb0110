// The charset registry and the open-on-first-use procedure, white-box: the
// test supplies its own host prompt and watches iconv_open.
#include <dlfcn.h>
#include <gtest/gtest.h>

#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

#include "frame/registry.h"

namespace {
std::vector<std::string> openCalls;
std::vector<std::string> prompts;
int promptAnswer = 1;
}  // namespace

extern "C" {
iconv_t iconv_open(const char *to, const char *from) {
    openCalls.push_back(std::string(to) + "<-" + from);
    using Fn = iconv_t (*)(const char *, const char *);
    static Fn real = reinterpret_cast<Fn>(dlsym(RTLD_NEXT, "iconv_open"));
    return real(to, from);
}
int UIYesNoDisplay(uint32_t question, uint32_t a, uint32_t b, const char *from, const char *to) {
    prompts.push_back(std::to_string(question) + std::to_string(a) + std::to_string(b) + " " + from + "->" + to);
    return promptAnswer;
}
void *HostMalloc(uint32_t size, uint32_t) { return std::malloc(size); }
void HostFree(void *p) { std::free(p); }
int Mem_alloc(uint32_t, uint32_t size, void **block) { return (*block = std::malloc(size)) ? 0 : 1; }
void Mem_free(uint32_t, void *block) { std::free(block); }
int32_t GetiStringID(const char *, const StringIDEntry *table) {
    while (table->name) ++table;
    return table->id;
}
void *memmove_soc(void *d, const void *s, uint32_t n) { return std::memmove(d, s, n); }
}

using namespace textconv;

TEST(Registry, TableRowsAndIdentification) {
    const char *names[CHARSET_COUNT] = {nullptr,      "ISO-8859-1", "EUC-JP",      "SJIS",       "UTF-8",
                                        "UTF-16",     "UTF16-LE",   "UTF16-BE",    "KOI8-R",     "GB18030",
                                        "GB2312",     "GBK",        "BIG5",        "BIG5HKSCS",  "ISO-8859-11",
                                        "ISO-8859-6", "ISO-8859-8", "ISO-8859-2",  "ISO-8859-15", "EUC-KR",
                                        "CP1250",     "CP1251",     "CP1256"};
    for (int id = 0; id < CHARSET_COUNT; ++id) {
        SCOPED_TRACE(id);
        if (!names[id]) {
            EXPECT_EQ(charsetConversion[id].iconvName, nullptr);
            EXPECT_EQ(charsetConversion[id].availability, 0u);
            continue;
        }
        EXPECT_STREQ(charsetConversion[id].iconvName, names[id]);
        EXPECT_EQ(charsetConversion[id].availability, id == CHARSET_EUCJP ? 7u : 3u);
    }
    EXPECT_STREQ(version_info, "@(#)2012-07-20 13:02:10 BST");
    EXPECT_EQ(conversions_availability, 2u);
    EXPECT_STREQ(printable_charset_name(CHARSET_NONE), "(none)");
}

TEST(Registry, CellsStartUnopenedExceptNone) {
    EXPECT_EQ(fromUnicodeConverters[CHARSET_NONE], failed_cell());
    EXPECT_EQ(toUnicodeConverters[CHARSET_NONE], failed_cell());
    for (int id = 1; id < CHARSET_COUNT; ++id) {
        EXPECT_EQ(fromUnicodeConverters[id], unopened_cell());
        EXPECT_EQ(toUnicodeConverters[id], unopened_cell());
    }
    for (ConverterCell c : {eucjpToUnicodeConverter, unicodeToEucjpConverter, unicodeToKoi8rConverter,
                            koi8rToUnicodeConverter})
        EXPECT_EQ(c, unopened_cell());
}

TEST(Registry, NoneFailsWithoutOpeningOrAsking) {
    EXPECT_EQ(acquire_converter(&fromUnicodeConverters[CHARSET_NONE], nullptr, Pivot::Source), nullptr);
    EXPECT_EQ(acquire_converter(&toUnicodeConverters[CHARSET_NONE], nullptr, Pivot::Target), nullptr);
    EXPECT_TRUE(openCalls.empty());
    EXPECT_TRUE(prompts.empty());
}

TEST(Registry, OpensOnceAndKeepsTheDescriptor) {
    ConverterCell *cell = &toUnicodeConverters[CHARSET_LATIN1];
    iconv_t first = acquire_converter(cell, "ISO-8859-1", Pivot::Target);
    ASSERT_NE(first, nullptr);
    EXPECT_EQ(acquire_converter(cell, "ISO-8859-1", Pivot::Target), first);
    ASSERT_EQ(openCalls.size(), 1u);
    EXPECT_EQ(openCalls[0], "UTF-16<-ISO-8859-1");
    // The other direction's cell stays unopened.
    EXPECT_EQ(fromUnicodeConverters[CHARSET_LATIN1], unopened_cell());
    // Decoding UTF-16 names host order explicitly.
    ASSERT_NE(acquire_converter(&fromUnicodeConverters[CHARSET_LATIN1], "ISO-8859-1", Pivot::Source), nullptr);
    EXPECT_EQ(openCalls.back(), std::string("ISO-8859-1<-UTF-16") +
                                    (__BYTE_ORDER__ == __ORDER_BIG_ENDIAN__ ? "BE" : "LE"));
    EXPECT_TRUE(prompts.empty());
}

TEST(Registry, MissingConverterAsksOnceThenFailsQuietly) {
    // glibc knows no "UTF16-LE": the id takes the failure path.
    ConverterCell *cell = &fromUnicodeConverters[CHARSET_UTF16LE];
    EXPECT_EQ(acquire_converter(cell, "UTF16-LE", Pivot::Source), nullptr);
    EXPECT_EQ(*cell, failed_cell());
    EXPECT_EQ(acquire_converter(cell, "UTF16-LE", Pivot::Source), nullptr);
    ASSERT_EQ(prompts.size(), 1u);
    EXPECT_EQ(prompts[0], "300 UTF-16->UTF16-LE");
    EXPECT_EQ(openCalls.size(), 1u);

    EXPECT_EQ(acquire_converter(&toUnicodeConverters[CHARSET_UTF16BE], "UTF16-BE", Pivot::Target), nullptr);
    ASSERT_EQ(prompts.size(), 2u);
    EXPECT_EQ(prompts[1], "300 UTF16-BE->UTF-16");
}

TEST(Registry, DeclinedPromptEndsTheProcess) {
    promptAnswer = 0;
    EXPECT_EXIT(acquire_converter(&toUnicodeConverters[CHARSET_UTF16LE], "UTF16-LE", Pivot::Target),
                testing::ExitedWithCode(1), "");
}
