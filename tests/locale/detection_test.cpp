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
    bool fakeName = false;  // answer setlocale(LC_CTYPE, NULL) with `name`
    const char *name = nullptr;
    bool fakeCodeset = false;  // answer nl_langinfo(CODESET) with `codeset`
    const char *codeset = nullptr;
    bool failStrdup = false;
} platform;

std::vector<std::string> calls;

std::string shown(const char *s) { return s ? std::string(s) : std::string("null"); }

template <typename Fn>
Fn next(const char *symbol) {
    return reinterpret_cast<Fn>(dlsym(RTLD_NEXT, symbol));
}

const char *table_name(const StringIDEntry *table) {
    if (table == charsets) return "charsets";
    if (table == locales) return "locales";
    if (table == languages) return "languages";
    return "?";
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
    if (platform.failStrdup) return nullptr;
    static auto real = next<char *(*)(const char *)>("strdup");
    return real(s);
}

// The host's lookup: exact, case-sensitive.
int32_t GetiStringID(const char *key, const StringIDEntry *table) {
    calls.push_back("GetiStringID(" + shown(key) + "," + table_name(table) + ")");
    for (; table->name; ++table)
        if (key && std::strcmp(key, table->name) == 0) return table->id;
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

using Calls = std::vector<std::string>;

// The calls every detection begins with.
const Calls kQueries = {"setlocale(6,)", "setlocale(0,null)", "nl_langinfo(14)"};

Calls with(Calls head, const Calls &tail) {
    head.insert(head.end(), tail.begin(), tail.end());
    return head;
}

Calls apply(const std::string &name) {
    return {"setenv(LANG," + name + ",1)", "setenv(LC_ALL," + name + ",1)", "setlocale(6,)"};
}

// Each test starts from a clean environment with the platform simulated as
// it says; the library's state is fresh because every test is a process.
class Detection : public ::testing::Test {
  protected:
    void SetUp() override {
        unsetenv("LC_ALL");
        unsetenv("LC_CTYPE");
        unsetenv("LANG");
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

TEST_F(Detection, CodesetInTheTableDecidesWhateverTheName) {
    simulate("ko_KR.UTF-8", "eucJP");
    EXPECT_EQ(LocalEncoding(), CHARSET_EUCJP);
    EXPECT_EQ(calls, with(kQueries, {"GetiStringID(eucJP,charsets)"}));
}

TEST_F(Detection, NothingNamesALocale) {
    simulate(nullptr, nullptr);
    EXPECT_EQ(LocalEncoding(), CHARSET_LATIN1);
    EXPECT_EQ(calls, with(kQueries, with({"getenv(LANG)"}, apply("en_US.ISO8859-1"))));
    EXPECT_EQ(env("LANG"), "en_US.ISO8859-1");
    EXPECT_EQ(env("LC_ALL"), "en_US.ISO8859-1");
    calls.clear();
    EXPECT_EQ(LocalEncoding(), CHARSET_LATIN1);
    EXPECT_EQ(calls, Calls{});
}

TEST_F(Detection, NoLocaleNameFallsBackToLang) {
    setenv("LANG", "zh_TW", 1);
    calls.clear();
    simulate(nullptr, nullptr);
    EXPECT_EQ(LocalEncoding(), CHARSET_BIG5);
    EXPECT_EQ(calls, with(kQueries, {"getenv(LANG)", "GetiStringID(zh_TW,locales)"}));
    EXPECT_EQ(env("LC_ALL"), "null");
}

TEST_F(Detection, UnknownCodesetLeavesItToTheName) {
    simulate("ja_JP.SJIS", "SHIFT_JIS");
    EXPECT_EQ(LocalEncoding(), CHARSET_SJIS);
    EXPECT_EQ(calls, with(kQueries, {"GetiStringID(SHIFT_JIS,charsets)", "GetiStringID(SJIS,charsets)"}));
}

TEST_F(Detection, UnknownCodesetAndNameLeaveItToTheLanguage) {
    simulate("ar_EG", "ISO-8859-1");
    EXPECT_EQ(LocalEncoding(), CHARSET_ISO8859_6);
    EXPECT_EQ(calls, with(kQueries, {"GetiStringID(ISO-8859-1,charsets)", "GetiStringID(ar_EG,locales)",
                                     "strdup(ar_EG)", "GetiStringID(ar,languages)"}));
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

// The ".UTF8" rewrite, with the codeset reporting UTF-8.
struct RewriteCase {
    const char *label;
    std::string name;  // the locale name; "null" for none
    uint32_t rewrite;  // the switch, through SetCurrentLocale; ~0u: LocalEncoding alone
    CharsetId id;
    std::string applied;  // the name set in LANG and LC_ALL; "" when untouched
};

void PrintTo(const RewriteCase &c, std::ostream *os) { *os << c.label; }

std::string long_name(size_t length, const char *suffix) {
    return std::string(length - std::strlen(suffix), 'x') + suffix;
}

class Utf8Rewrite : public Detection, public ::testing::WithParamInterface<RewriteCase> {};

TEST_P(Utf8Rewrite, AppliesTheCanonicalName) {
    const RewriteCase &c = GetParam();
    setenv("LANG", "before", 1);
    calls.clear();
    simulate(c.name == "null" ? nullptr : c.name.c_str(), "UTF-8");
    const CharsetId id = c.rewrite == ~0u ? LocalEncoding() : SetCurrentLocale(c.rewrite);
    EXPECT_EQ(id, c.id);
    EXPECT_EQ(textconv::currentLocalEncoding, c.id);
    const Calls base = with(kQueries, {"GetiStringID(UTF-8,charsets)"});
    if (c.applied.empty()) {
        EXPECT_EQ(calls, base);
        EXPECT_EQ(env("LANG"), "before");
        EXPECT_EQ(env("LC_ALL"), "null");
    } else {
        EXPECT_EQ(calls, with(base, apply(c.applied)));
        EXPECT_EQ(env("LANG"), c.applied);
        EXPECT_EQ(env("LC_ALL"), c.applied);
    }
}

INSTANTIATE_TEST_SUITE_P(
    Cases, Utf8Rewrite,
    ::testing::Values(
        RewriteCase{"On", "en_US.utf8", 1, CHARSET_UTF8, "en_US.UTF-8"},
        RewriteCase{"AnyCase", "de_DE.uTf8", 1, CHARSET_UTF8, "de_DE.UTF-8"},
        RewriteCase{"AnyNonZeroLowByte", "en_US.UTF8", 0x1FF, CHARSET_UTF8, "en_US.UTF-8"},
        RewriteCase{"SixCharacters", "x.utf8", 1, CHARSET_UTF8, "x.UTF-8"},
        RewriteCase{"Off", "en_US.utf8", 0, CHARSET_UTF8, ""},
        RewriteCase{"OffByDefault", "en_US.utf8", ~0u, CHARSET_UTF8, ""},
        RewriteCase{"HighBytesOnly", "en_US.utf8", 0x100, CHARSET_UTF8, ""},
        RewriteCase{"FiveCharacters", ".UTF8", 1, CHARSET_UTF8, ""},
        RewriteCase{"AlreadyCanonical", "en_US.UTF-8", 1, CHARSET_UTF8, ""},
        RewriteCase{"NoDot", "en_USxUTF8", 1, CHARSET_UTF8, ""},
        RewriteCase{"NoName", "null", 1, CHARSET_UTF8, ""},
        // The longest name rewritten: 1021 characters become 1022.
        RewriteCase{"Longest", long_name(1021, ".utf8"), 1, CHARSET_UTF8, long_name(1022, ".UTF-8")},
        RewriteCase{"TooLong", long_name(1022, ".utf8"), 1, CHARSET_LATIN1, "en_US.ISO8859-1"},
        RewriteCase{"FarTooLong", long_name(100000, ".UTF8"), 1, CHARSET_LATIN1, "en_US.ISO8859-1"}),
    [](const ::testing::TestParamInfo<RewriteCase> &info) { return std::string(info.param.label); });

}  // namespace
