// The detection under real glibc locales (reached through LOCPATH), with the
// reference host's lookup. glibc reports codesets such as "EUC-JP" that the
// charsets table does not hold; for those the locale name and tables decide.
#include <gtest/gtest.h>
#include <langinfo.h>

#include <cctype>
#include <clocale>
#include <cstdlib>
#include <string>

#include "charset_agreement.h"
#include "textconv.h"

namespace {

struct RealCase {
    const char *lang;
    CharsetId id;
    bool sameCharset;              // glibc's converters for the codeset and the id decode alike
    const char *loaded = nullptr;  // the name glibc keeps, when not lang
};

void PrintTo(const RealCase &c, std::ostream *os) { *os << c.lang; }
// A locale whose codeset is the charset the id names.
RealCase Same(const char *lang, CharsetId id) { return {lang, id, true}; }

void start_with_lang(const char *lang) {
    unsetenv("LC_ALL");
    unsetenv("LC_CTYPE");
    setenv("LANG", lang, 1);
}

std::string env(const char *name) {
    const char *value = std::getenv(name);
    return value ? value : "null";
}

class RealLocale : public ::testing::TestWithParam<RealCase> {};

TEST_P(RealLocale, LocalEncoding) {
    const RealCase &c = GetParam();
    ASSERT_NE(std::getenv("LOCPATH"), nullptr) << "run through ctest: the locales come from a fixture";
    start_with_lang(c.lang);
    const CharsetId id = LocalEncoding();
    ASSERT_STREQ(std::setlocale(LC_CTYPE, nullptr), c.loaded ? c.loaded : c.lang) << "locale not built?";
    EXPECT_EQ(id, c.id) << "codeset " << nl_langinfo(CODESET);
    EXPECT_EQ(LocalEncoding(), id);
    EXPECT_EQ(env("LANG"), c.lang);
    EXPECT_EQ(env("LC_ALL"), "null");
    if (c.sameCharset) {
        auto agreement = localetest::compare_decoders(nl_langinfo(CODESET), charsetConversion[id].iconvName);
        ASSERT_TRUE(agreement.has_value());
        EXPECT_GT(agreement->compared, 100u);
        EXPECT_EQ(agreement->differing.size(), 0u);
    }
}

INSTANTIATE_TEST_SUITE_P(
    Locales, RealLocale,
    ::testing::Values(RealCase{"C", CHARSET_LATIN1, false}, RealCase{"POSIX", CHARSET_LATIN1, false, "C"},
                      Same("C.UTF-8", CHARSET_UTF8), Same("en_US.ISO-8859-1", CHARSET_LATIN1),
                      Same("en_US.ISO8859-1", CHARSET_LATIN1), Same("en_US", CHARSET_LATIN1),
                      Same("de_DE.ISO-8859-1", CHARSET_LATIN1), Same("fr_FR", CHARSET_LATIN1),
                      Same("en_US.UTF-8", CHARSET_UTF8), Same("en_US.utf8", CHARSET_UTF8),
                      Same("en_US.ISO-8859-15", CHARSET_ISO8859_15), Same("ja_JP.eucJP", CHARSET_EUCJP),
                      Same("ja_JP", CHARSET_EUCJP), Same("ja_JP.SJIS", CHARSET_SJIS),
                      Same("ja_JP.UTF-8", CHARSET_UTF8), Same("ru_RU.KOI8-R", CHARSET_KOI8R),
                      Same("ru_RU.koi8r", CHARSET_KOI8R), Same("he_IL", CHARSET_ISO8859_8),
                      Same("he_IL.ISO-8859-8", CHARSET_ISO8859_8), Same("zh_CN", CHARSET_GB2312),
                      Same("zh_CN.GBK", CHARSET_GBK), Same("zh_CN.GB18030", CHARSET_GB18030),
                      Same("zh_TW", CHARSET_BIG5), Same("zh_HK", CHARSET_BIG5HKSCS),
                      Same("ko_KR.eucKR", CHARSET_EUCKR), Same("th_TH", CHARSET_ISO8859_11),
                      Same("ar_EG", CHARSET_ISO8859_6), Same("ar_EG.UTF-8", CHARSET_UTF8),
                      Same("ar_IN", CHARSET_UTF8), Same("pl_PL", CHARSET_ISO8859_2),
                      // Charsets the registry lacks: the default.
                      RealCase{"tr_TR", CHARSET_LATIN1, false}, RealCase{"ru_RU", CHARSET_LATIN1, false}),
    [](const ::testing::TestParamInfo<RealCase> &info) {
        std::string s = info.param.lang;
        for (char &ch : s) ch = std::isalnum(static_cast<unsigned char>(ch)) ? ch : '_';
        return s;
    });

// A locale glibc cannot load leaves the process in "C": the default, and
// the environment as it was.
TEST(RealLocaleMissing, GivesTheDefault) {
    start_with_lang("xx_YY.UTF-8");
    EXPECT_EQ(LocalEncoding(), CHARSET_LATIN1);
    EXPECT_STREQ(std::setlocale(LC_CTYPE, nullptr), "C");
    EXPECT_EQ(env("LANG"), "xx_YY.UTF-8");
}

// With the switch on, a ".utf8" locale is applied again under its canonical
// name, which glibc loads as well.
TEST(RealLocaleRewrite, SwitchOn) {
    start_with_lang("en_US.utf8");
    EXPECT_EQ(SetCurrentLocale(1), CHARSET_UTF8);
    EXPECT_EQ(env("LANG"), "en_US.UTF-8");
    EXPECT_EQ(env("LC_ALL"), "en_US.UTF-8");
    EXPECT_STREQ(std::setlocale(LC_CTYPE, nullptr), "en_US.UTF-8");
    EXPECT_STREQ(std::setlocale(LC_MESSAGES, nullptr), "en_US.UTF-8");
    EXPECT_STREQ(nl_langinfo(CODESET), "UTF-8");
    EXPECT_EQ(LocalEncoding(), CHARSET_UTF8);
}

// Off, or set after the first detection: nothing is applied.
TEST(RealLocaleRewrite, SwitchOff) {
    start_with_lang("en_US.utf8");
    EXPECT_EQ(SetCurrentLocale(0), CHARSET_UTF8);
    EXPECT_EQ(env("LANG"), "en_US.utf8");
    EXPECT_EQ(env("LC_ALL"), "null");
    EXPECT_STREQ(std::setlocale(LC_CTYPE, nullptr), "en_US.utf8");
}

TEST(RealLocaleRewrite, SwitchTooLate) {
    start_with_lang("ar_EG.utf8");
    EXPECT_EQ(LocalEncoding(), CHARSET_UTF8);
    EXPECT_EQ(SetCurrentLocale(1), CHARSET_UTF8);
    EXPECT_EQ(env("LANG"), "ar_EG.utf8");
    EXPECT_EQ(env("LC_ALL"), "null");
}

}  // namespace
