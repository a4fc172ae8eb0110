// The detection with the platform's answers simulated: setlocale, nl_langinfo,
// getenv, setenv and strdup are interposed (forwarding to the C library unless
// a test overrides them) and the host lookup is the test's own, so every call
// the detection makes is recorded in order.
#include "locale/detection.h"

#include <dlfcn.h>
#include <gtest/gtest.h>
#include <langinfo.h>

#include <clocale>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

namespace {

struct Platform {
    bool fakeName, fakeCodeset;  // answer setlocale(LC_CTYPE, NULL) and nl_langinfo(CODESET)
    const char *name, *codeset;
    bool failStrdup;
} platform;

using Calls = std::vector<std::string>;
Calls calls;

std::string shown(const char *s) { return s ? s : "null"; }

template <typename Fn>
Fn next(const char *symbol) {
    return reinterpret_cast<Fn>(dlsym(RTLD_NEXT, symbol));
}

}  // namespace

extern "C" {

char *setlocale(int category, const char *locale) noexcept {
    calls.push_back("setlocale(" + std::to_string(category) + "," + shown(locale) + ")");
    if (category == LC_CTYPE && !locale && platform.fakeName) return const_cast<char *>(platform.name);
    static auto real = next<char *(*)(int, const char *)>("setlocale");
    return real(category, locale);
}

char *nl_langinfo(nl_item item) noexcept {
    calls.push_back("nl_langinfo(" + std::to_string(item) + ")");
    if (item == CODESET && platform.fakeCodeset) return const_cast<char *>(platform.codeset);
    static auto real = next<char *(*)(nl_item)>("nl_langinfo");
    return real(item);
}

char *getenv(const char *name) noexcept {
    calls.push_back("getenv(" + shown(name) + ")");
    static auto real = next<char *(*)(const char *)>("getenv");
    return real(name);
}

int setenv(const char *name, const char *value, int overwrite) noexcept {
    calls.push_back("setenv(" + shown(name) + "," + shown(value) + "," + std::to_string(overwrite) + ")");
    static auto real = next<int (*)(const char *, const char *, int)>("setenv");
    return real(name, value, overwrite);
}

char *strdup(const char *s) noexcept {
    calls.push_back("strdup(" + shown(s) + ")");
    static auto real = next<char *(*)(const char *)>("strdup");
    return platform.failStrdup ? nullptr : real(s);
}

// The host's lookup: exact, case-sensitive.
int32_t GetiStringID(const char *key, const StringIDEntry *table) {
    const char *name = table == charsets ? "charsets" : table == locales ? "locales" : "languages";
    calls.push_back("GetiStringID(" + shown(key) + "," + name + ")");
    while (table->name && !(key && std::strcmp(key, table->name) == 0)) ++table;
    return table->id;
}

void *HostMalloc(uint32_t size, uint32_t) { return std::malloc(size); }
void HostFree(void *p) { std::free(p); }
int Mem_alloc(uint32_t, uint32_t size, void **block) { return (*block = std::malloc(size)) ? 0 : 1; }
void Mem_free(uint32_t, void *block) { std::free(block); }
int UIYesNoDisplay(uint32_t, uint32_t, uint32_t, const char *, const char *) { return 1; }
void *memmove_soc(void *d, const void *s, uint32_t n) { return std::memmove(d, s, n); }
}

namespace {

const Calls kQueries = {"setlocale(6,)", "setlocale(0,null)", "nl_langinfo(14)"};  // every detection's start

Calls with(Calls head, const Calls &tail) {
    head.insert(head.end(), tail.begin(), tail.end());
    return head;
}
Calls apply(const std::string &name) {
    return {"setenv(LANG," + name + ",1)", "setenv(LC_ALL," + name + ",1)", "setlocale(6,)"};
}

// A clean environment per test; the library's state is fresh because every
// test is a process.
class Detection : public ::testing::Test {
  protected:
    void SetUp() override {
        for (const char *name : {"LC_ALL", "LC_CTYPE", "LANG"}) unsetenv(name);
        calls.clear();
    }
    static void simulate(const char *name, const char *codeset) {
        platform.fakeName = platform.fakeCodeset = true;
        platform.name = name;
        platform.codeset = codeset;
    }
    static std::string env(const char *name) { return shown(std::getenv(name)); }
};

TEST_F(Detection, SecondCallsTouchNothing) {
    setenv("LANG", "C", 1);
    ASSERT_EQ(LocalEncoding(), CHARSET_LATIN1);  // "C": found in no table
    ASSERT_FALSE(calls.empty());
    calls.clear();
    EXPECT_EQ(LocalEncoding(), CHARSET_LATIN1);
    EXPECT_EQ(SetCurrentLocale(1), CHARSET_LATIN1);
    EXPECT_EQ(LocalEncoding(), CHARSET_LATIN1);
    EXPECT_EQ(calls, Calls{});
    // Only the switch changed.
    EXPECT_EQ(textconv::utf8LocaleRewrite, 1);
    EXPECT_EQ(textconv::currentLocalEncoding, CHARSET_LATIN1);
    EXPECT_EQ(SetCurrentLocale(0x100), CHARSET_LATIN1);
    EXPECT_EQ(textconv::utf8LocaleRewrite, 0);  // the low byte only
}

// A failed copy of the name must not reach the host as a null key nor crash:
// the language matches nothing and the default stands.
TEST_F(Detection, FailedLanguageCopyGivesTheDefault) {
    platform.failStrdup = true;
    simulate("ar_EG", nullptr);
    EXPECT_EQ(LocalEncoding(), CHARSET_LATIN1);
    EXPECT_EQ(calls, with(kQueries, {"GetiStringID(ar_EG,locales)", "strdup(ar_EG)"}));
    EXPECT_EQ(get_language_from_locale("ar_EG"), nullptr);
    EXPECT_EQ(find_charset_from("ar_EG"), CHARSET_LATIN1);
}

TEST_F(Detection, NullNameAsksTheHostNothing) {
    EXPECT_EQ(find_charset_from(nullptr), CHARSET_LATIN1);
    EXPECT_EQ(calls, Calls{});
}

// One detection: LANG beforehand, the platform's answers, the switch
// (~0u: LocalEncoding alone), the result, the lookups after the queries, and
// the name then set in LANG and LC_ALL ("" when untouched).
struct Case {
    const char *label, *lang;
    std::string name;  // "null" for none
    const char *codeset;
    uint32_t rewrite;
    CharsetId id;
    Calls lookups;
    std::string applied;
};

void PrintTo(const Case &c, std::ostream *os) { *os << c.label; }

class Decides : public Detection, public ::testing::WithParamInterface<Case> {};

TEST_P(Decides, TheLocalEncoding) {
    const Case &c = GetParam();
    if (c.lang) setenv("LANG", c.lang, 1);
    calls.clear();
    simulate(c.name == "null" ? nullptr : c.name.c_str(), c.codeset);
    EXPECT_EQ(c.rewrite == ~0u ? LocalEncoding() : SetCurrentLocale(c.rewrite), c.id);
    EXPECT_EQ(textconv::currentLocalEncoding, c.id);
    EXPECT_EQ(calls, with(with(kQueries, c.lookups), c.applied.empty() ? Calls{} : apply(c.applied)));
    EXPECT_EQ(env("LANG"), c.applied.empty() ? shown(c.lang) : c.applied);
    EXPECT_EQ(env("LC_ALL"), c.applied.empty() ? "null" : c.applied);
}

std::string long_name(size_t length, const char *suffix) {
    return std::string(length - std::strlen(suffix), 'x') + suffix;
}

Case rewrite(const char *label, std::string name, uint32_t rewrite, std::string applied = "",
             CharsetId id = CHARSET_UTF8) {
    return {label, "before", name, "UTF-8", rewrite, id, {"GetiStringID(UTF-8,charsets)"}, applied};
}

Case plain(const char *label, const char *lang, std::string name, const char *codeset, CharsetId id,
           Calls lookups, std::string applied = "") {
    return {label, lang, name, codeset, ~0u, id, lookups, applied};
}

INSTANTIATE_TEST_SUITE_P(
    Cases, Decides,
    ::testing::Values(
        plain("CodesetInTheTable", nullptr, "ko_KR.UTF-8", "eucJP", CHARSET_EUCJP,
              {"GetiStringID(eucJP,charsets)"}),
        plain("UnknownCodesetLeavesItToTheName", nullptr, "ja_JP.SJIS", "SHIFT_JIS", CHARSET_SJIS,
              {"GetiStringID(SHIFT_JIS,charsets)", "GetiStringID(SJIS,charsets)"}),
        plain("ThenToTheLanguage", nullptr, "ar_EG", "ISO-8859-1", CHARSET_ISO8859_6,
              {"GetiStringID(ISO-8859-1,charsets)", "GetiStringID(ar_EG,locales)", "strdup(ar_EG)",
               "GetiStringID(ar,languages)"}),
        plain("NoLocaleNameFallsBackToLang", "zh_TW", "null", nullptr, CHARSET_BIG5,
              {"getenv(LANG)", "GetiStringID(zh_TW,locales)"}),
        plain("NothingNamesALocale", nullptr, "null", nullptr, CHARSET_LATIN1, {"getenv(LANG)"},
              "en_US.ISO8859-1"),
        // The ".UTF8" rewrite.
        rewrite("On", "en_US.utf8", 1, "en_US.UTF-8"), rewrite("AnyCase", "de_DE.uTf8", 1, "de_DE.UTF-8"),
        rewrite("AnyNonZeroLowByte", "en_US.UTF8", 0x1FF, "en_US.UTF-8"),
        rewrite("SixCharacters", "x.utf8", 1, "x.UTF-8"), rewrite("Off", "en_US.utf8", 0),
        rewrite("OffByDefault", "en_US.utf8", ~0u), rewrite("HighBytesOnly", "en_US.utf8", 0x100),
        rewrite("FiveCharacters", ".UTF8", 1), rewrite("AlreadyCanonical", "en_US.UTF-8", 1),
        rewrite("NoDot", "en_USxUTF8", 1), rewrite("NoName", "null", 1),
        // The longest name rewritten: 1021 characters become 1022.
        rewrite("Longest", long_name(1021, ".utf8"), 1, long_name(1022, ".UTF-8")),
        rewrite("TooLong", long_name(1022, ".utf8"), 1, "en_US.ISO8859-1", CHARSET_LATIN1),
        rewrite("FarTooLong", long_name(100000, ".UTF8"), 1, "en_US.ISO8859-1", CHARSET_LATIN1)),
    [](const ::testing::TestParamInfo<Case> &info) { return std::string(info.param.label); });

}  // namespace
