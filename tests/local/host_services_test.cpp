// The local layer and direction escaping with a host that tracks every block
// and can run out of memory, on a platform that can lack the local charset's
// converters. Runs under he_IL.ISO-8859-8, whose text goes through UTF-16.
#include <dlfcn.h>
#include <gtest/gtest.h>
#include <iconv.h>

#include <algorithm>
#include <cstdlib>
#include <cstring>
#include <set>
#include <string>
#include <vector>

#include "textconv.h"

namespace {
bool memoryExhausted = false, convertersMissing = false;
std::set<void *> liveBlocks;
std::vector<uint32_t> requests;
int prompts = 0, iconvCalls = 0;
}  // namespace

extern "C" {
void *HostMalloc(uint32_t size, uint32_t flags) {
    EXPECT_EQ(flags, 1u);
    requests.push_back(size);
    if (memoryExhausted) return nullptr;
    void *p = std::malloc(size ? size : 1);
    liveBlocks.insert(p);
    return p;
}
void HostFree(void *block) {
    EXPECT_EQ(liveBlocks.erase(block), 1u) << "released a block HostMalloc did not give";
    std::free(block);
}
int Mem_alloc(uint32_t, uint32_t size, void **block) { return (*block = std::malloc(size)) ? 0 : 1; }
void Mem_free(uint32_t, void *block) { std::free(block); }
int UIYesNoDisplay(uint32_t, uint32_t, uint32_t, const char *, const char *) { return ++prompts, 1; }
int32_t GetiStringID(const char *key, const StringIDEntry *table) {
    for (; table->name; ++table)
        if (key && std::strcmp(key, table->name) == 0) return table->id;
    return table->id;
}
void *memmove_soc(void *d, const void *s, uint32_t n) { return std::memmove(d, s, n); }

size_t iconv(iconv_t cd, char **in, size_t *inLeft, char **out, size_t *outLeft) {
    static auto real = reinterpret_cast<size_t (*)(iconv_t, char **, size_t *, char **, size_t *)>(
        dlsym(RTLD_NEXT, "iconv"));
    ++iconvCalls;
    return real(cd, in, inLeft, out, outLeft);
}
iconv_t iconv_open(const char *to, const char *from) {
    static auto real =
        reinterpret_cast<iconv_t (*)(const char *, const char *)>(dlsym(RTLD_NEXT, "iconv_open"));
    if (convertersMissing && (std::strcmp(to, "ISO-8859-8") == 0 || std::strcmp(from, "ISO-8859-8") == 0)) {
        errno = EINVAL;
        return reinterpret_cast<iconv_t>(-1);
    }
    return real(to, from);
}
}

namespace {

// A list in a block from the host: the literal's units without its own 0.
template <size_t N>
uint16_t *host_list(const char16_t (&units)[N]) {
    auto *block = static_cast<uint16_t *>(HostMalloc(static_cast<uint32_t>(2 * (N - 1)), 1));
    return static_cast<uint16_t *>(std::memcpy(block, units, 2 * (N - 1)));
}

std::string bytes(const void *p, size_t n) { return std::string(static_cast<const char *>(p), n); }

TEST(LocalHost, EveryScratchBlockIsReturned) {
    ASSERT_EQ(LocalEncoding(), CHARSET_ISO8859_8);
    char target[64];
    uint32_t length = 0;
    EXPECT_EQ(StringFromUTF8ToLocal("abc \xD7\x90", target, &length), 1);
    EXPECT_STREQ(target, "abc \xE0");
    EXPECT_TRUE(requests.empty());  // decoded in place, no scratch
    length = sizeof target;
    EXPECT_EQ(StringFromLocalToUTF8("abc \xE0", target, &length), 1);
    EXPECT_STREQ(target, "abc \xD7\x90");
    std::vector<char> big(4000);
    length = 4000;
    StringFromLocalToDirectionEscapedString(big.data(), "abc \xE0", &length);
    EXPECT_STREQ(big.data(), "%labc %r\xE0");
    EXPECT_EQ(requests.size(), 2u);
    EXPECT_TRUE(liveBlocks.empty());

    // The list: the old block is released, the new one is the caller's.
    uint16_t *list = host_list(u"ab\0\u05D0\0"), *old = list;
    length = 10;
    StringListFromUnicodeToLocal(&list, &length);
    EXPECT_EQ(liveBlocks, std::set<void *>{list});
    EXPECT_NE(list, old);
    EXPECT_EQ(bytes(list, length), std::string("ab\0\xE0\0\0", 6));
    HostFree(list);
}

// Small rooms keep their scratch on the stack; large ones ask the host.
TEST(LocalHost, DirectionScratchComesFromTheHostOnlyForLargeRooms) {
    std::vector<char> target(2048);
    for (uint32_t room : {1u, 100u, 512u, 513u}) {
        uint32_t length = room;
        StringFromCharsetToDirectionEscapedString(CHARSET_LATIN1, target.data(), "ab", &length);
        EXPECT_EQ(length, room == 1 ? 1u : 5u);
    }
    EXPECT_EQ(requests, std::vector<uint32_t>{4u * (513 + 4)});  // two arrays of L + 4 units
    EXPECT_TRUE(liveBlocks.empty());
}

TEST(LocalHost, OutOfMemory) {
    ASSERT_EQ(LocalEncoding(), CHARSET_ISO8859_8);
    uint16_t *list = host_list(u"ab\0"), *old = list;
    memoryExhausted = true;

    // UTF-8 to local needs no memory from the host.
    char target[32];
    uint32_t length = 99;
    EXPECT_EQ(StringFromUTF8ToLocal("abc \xD7\x90", target, &length), 1);
    EXPECT_EQ(bytes(target, length), std::string("abc \xE0", 6));
    // Local to UTF-8 through UTF-16: the empty string, length 1.
    length = sizeof target;
    EXPECT_EQ(StringFromLocalToUTF8("abc", target, &length), 1);
    EXPECT_EQ(length, 1u);
    EXPECT_EQ(target[0], '\0');
    // The list: the caller keeps the old list and its length.
    length = 6;
    StringListFromUnicodeToLocal(&list, &length);
    EXPECT_EQ(list, old);
    EXPECT_EQ(length, 6u);
    EXPECT_EQ(liveBlocks, std::set<void *>{old});
    HostFree(list);

    // A large room without scratch: the source copied (strncpy fills the
    // room), length kept; a small one needs no memory from the host.
    std::vector<char> big(1000, '\x7f');
    length = 1000;
    StringFromCharsetToDirectionEscapedString(CHARSET_LATIN1, big.data(), "abc", &length);
    EXPECT_EQ(length, 1000u);
    EXPECT_EQ(bytes(big.data(), 1000), "abc" + std::string(997, '\0'));
    length = 100;
    StringFromCharsetToDirectionEscapedString(CHARSET_LATIN1, big.data(), "abc", &length);
    EXPECT_EQ(length, 6u);
    EXPECT_STREQ(big.data(), "%labc");
    EXPECT_TRUE(liveBlocks.empty());
}

// The local charset's converters cannot be opened and the user goes on.
TEST(LocalHost, ConvertersMissing) {
    convertersMissing = true;
    ASSERT_EQ(LocalEncoding(), CHARSET_ISO8859_8);
    // Every unit fails alone: "?" each; the empty strings and the shape survive.
    uint16_t *list = host_list(u"ab\0\0c\0");
    uint32_t length = 12;
    StringListFromUnicodeToLocal(&list, &length);
    EXPECT_EQ(bytes(list, length), std::string("??\0\0?\0\0", 7));
    HostFree(list);

    char target[32];
    length = sizeof target;
    EXPECT_EQ(StringFromLocalToUTF8("abc", target, &length), 1);
    EXPECT_EQ(bytes(target, length), std::string(1, '\0'));
    length = 0;
    EXPECT_EQ(StringFromUTF8ToLocal("ab", target, &length), 0);
    EXPECT_EQ(bytes(target, length), std::string("??\0", 3));
    length = 20;
    EXPECT_EQ(StringFromLocalToDirectionEscapedString(target, "abc", &length), 1);
    EXPECT_EQ(length, 20u);
    EXPECT_STREQ(target, "abc");
    EXPECT_EQ(StringsEquivalent("abc", CHARSET_UTF8, "abc", CHARSET_NONE, 0), 0);
    EXPECT_EQ(StringsEquivalent("abc", CHARSET_UTF8, "abc", CHARSET_UTF8, 0), 1);

    int32_t wideLength = 4;
    host_stringFromWindowsUnicode("a\0b\0", target, &wideLength);
    EXPECT_EQ(wideLength, 1);
    uint16_t wide[4];
    length = 0;
    host_stringToWindowsUnicode("ab", wide, &length);
    EXPECT_EQ(length, 2u);
    EXPECT_EQ(prompts, 2);  // once per direction
    EXPECT_TRUE(liveBlocks.empty());
}

// Units of a single-byte local charset are asked of the converter once; a
// missing converter is reported as unit by unit, every time.
TEST(LocalHost, SingleByteUnitsAreAskedOnce) {
    const char *text =
        "shalom \xD7\xA9\xD7\x9C\xD7\x95\xD7\x9D \xE2\x82\xAC!";  // a euro sign ISO-8859-8 lacks
    char target[160];
    uint32_t length = 0;
    for (int i = 0; i < 3; ++i) {
        EXPECT_EQ(StringFromUTF8ToLocal(text, target, &length), 0);
        EXPECT_EQ(bytes(target, length), std::string("shalom \xF9\xEC\xE5\xED ?!", 15));
    }
    char *cursor = target;
    EXPECT_EQ(FromUnicodeToLocal(0x05E9, &cursor), 1);
    EXPECT_EQ(FromUnicodeToLocal(0x20AC, &cursor), 0);
    EXPECT_EQ(bytes(target, cursor - target), "\xF9");
    EXPECT_EQ(iconvCalls, 13);  // s h a l o m space, four letters, euro, !

    // Known ASCII goes by whole blocks, but not past a unit seen for the first time.
    const std::string words = "shalom shalom shalom shalom shalom shalom shalom ";
    int asked = 13;
    for (const std::string &text : {words + words, words + "Z" + words, words + "Q" + words + "Z"}) {
        EXPECT_EQ(StringFromUTF8ToLocal(text.c_str(), target, &length), 1);
        EXPECT_EQ(bytes(target, length), text + '\0');
        EXPECT_EQ(iconvCalls, asked++) << text;  // none, then Z, then Q
    }
}

TEST(LocalHost, SingleByteUnitsWithoutConverterAreAskedEveryTime) {
    convertersMissing = true;
    testing::internal::CaptureStderr();
    char target[16];
    uint32_t length = 0;
    for (int i = 0; i < 2; ++i) {
        EXPECT_EQ(StringFromUTF8ToLocal("ab", target, &length), 0);
        EXPECT_STREQ(target, "??");
    }
    std::string messages = testing::internal::GetCapturedStderr();
    EXPECT_EQ(prompts, 1);
    EXPECT_EQ(std::count(messages.begin(), messages.end(), '\n'), 4) << messages;
    EXPECT_NE(messages.find("Cannot use iconv to convert from UTF-16 to ISO-8859-8 (97)"), std::string::npos);
}

}  // namespace
