// Locale and charset names to CharsetIds through the exported tables, with
// the reference host's exact, case-sensitive lookup.
#include <gtest/gtest.h>

#include <cstdlib>
#include <cstring>
#include <set>
#include <string>

#include "charset_agreement.h"
#include "textconv.h"

namespace {

int rows(const StringIDEntry *table) {
    int n = 0;
    while (table[n].name) ++n;
    return n;
}

std::string show(const std::string &bytes) {
    std::string s;
    char buf[4];
    for (unsigned char c : bytes) snprintf(buf, sizeof buf, "%02X", c), s += buf;
    return s;
}

}  // namespace

TEST(NameTables, ShapeAndDefaults) {
    EXPECT_EQ(rows(charsets), 30);
    EXPECT_EQ(rows(locales), 11);
    EXPECT_EQ(rows(languages), 1);
    EXPECT_EQ(charsets[rows(charsets)].id, CHARSET_NONE);
    EXPECT_EQ(locales[rows(locales)].id, CHARSET_NONE);
    EXPECT_EQ(languages[rows(languages)].id, CHARSET_LATIN1);
    for (const StringIDEntry *table : {charsets, locales, languages}) {
        std::set<std::string> seen;
        for (const StringIDEntry *row = table; row->name; ++row) {
            EXPECT_TRUE(seen.insert(row->name).second) << "duplicate " << row->name;
            EXPECT_GT(row->id, CHARSET_NONE) << row->name;
            EXPECT_LT(row->id, CHARSET_COUNT) << row->name;
        }
    }
}

// Where glibc knows a charset name of the table, its converter decodes every
// short sequence as the registry's converter for the row's id does: the table
// sends each name to the right charset.
TEST(NameTables, CharsetNamesAgreeWithRegistryConverters) {
    int checked = 0;
    for (const StringIDEntry *row = charsets; row->name; ++row) {
        // IBM's Shift-JIS variants differ from SJIS in control codes and vendor
        // extensions; the registry has no closer charset for them.
        if (std::strncmp(row->name, "IBM-", 4) == 0) continue;
        const char *registryName = charsetConversion[row->id].iconvName;
        auto agreement = localetest::compare_decoders(row->name, registryName);
        if (!agreement) continue;  // a name of another platform (PCK, KOI8R...)
        SCOPED_TRACE(std::string(row->name) + " vs " + registryName);
        ++checked;
        EXPECT_GT(agreement->compared, 200u);
        EXPECT_TRUE(agreement->differing.empty())
            << agreement->differing.size() << " differ, first " << show(agreement->differing.front());
    }
    EXPECT_GE(checked, 20);
}

// The charset part (after the last ".") decides first, whatever precedes it.
TEST(FindCharsetFrom, EveryCharsetRowAfterTheLastDot) {
    for (const StringIDEntry *row = charsets; row->name; ++row) {
        for (const char *prefix : {"xx_XX.", "fr_FR.", "ar_EG.", "ja_JP.old.", "."}) {
            std::string name = std::string(prefix) + row->name;
            EXPECT_EQ(find_charset_from(name.c_str()), row->id) << name;
        }
        // Without a "." the same word is neither a locale nor a language.
        EXPECT_EQ(find_charset_from(row->name), CHARSET_LATIN1) << row->name;
    }
}

// Whole names decide next; only an exact match counts.
TEST(FindCharsetFrom, EveryLocaleRowAsAWholeName) {
    for (const StringIDEntry *row = locales; row->name; ++row) {
        EXPECT_EQ(find_charset_from(row->name), row->id) << row->name;
        // A charset part found in no table leaves the whole name, which no
        // longer matches: the language decides.
        std::string dotted = std::string(row->name) + ".bogus";
        const CharsetId byLanguage =
            std::strncmp(row->name, "ar_", 3) == 0 ? CHARSET_ISO8859_6 : CHARSET_LATIN1;
        EXPECT_EQ(find_charset_from(dotted.c_str()), byLanguage) << dotted;
    }
}

TEST(FindCharsetFrom, Cases) {
    const struct {
        const char *name;
        CharsetId id;
    } cases[] = {
        {"ja_JP.SJIS", CHARSET_SJIS},
        {"ja_JP.eucJP", CHARSET_EUCJP},
        {"ja_JP", CHARSET_EUCJP},
        {"Ja_JP", CHARSET_SJIS},
        {"JA_JP", CHARSET_LATIN1},
        {"ja_JP.sjis", CHARSET_LATIN1},
        {"zh_TW", CHARSET_BIG5},
        {"zh_TW.Big5", CHARSET_LATIN1},
        {"zh_CN.GB18030", CHARSET_GB18030},
        {"ar_EG", CHARSET_ISO8859_6},
        {"ar", CHARSET_ISO8859_6},
        {"ar_IN", CHARSET_UTF8},
        {"ar_SA.ISO-8859-1", CHARSET_ISO8859_6},
        {"ar_EG.UTF-8", CHARSET_UTF8},
        {"ar.bogus_x", CHARSET_LATIN1},
        {"arabic", CHARSET_LATIN1},
        {"fr_FR", CHARSET_LATIN1},
        {"POSIX", CHARSET_LATIN1},
        {"C", CHARSET_LATIN1},
        {"", CHARSET_LATIN1},
        {".", CHARSET_LATIN1},
        {"ja_JP.", CHARSET_LATIN1},
        {"_ar", CHARSET_LATIN1},
        {"a.UTF8.b", CHARSET_LATIN1},
        {"b.x.UTF8", CHARSET_UTF8},
        {"en_US.utf8", CHARSET_LATIN1},
    };
    for (const auto &c : cases) EXPECT_EQ(find_charset_from(c.name), c.id) << '"' << c.name << '"';
}

TEST(LocaleNameParts, CharsetPartPointsIntoTheName) {
    const struct {
        const char *name;
        int offset;  // -1: no "."
    } cases[] = {{"en_US.UTF-8", 6}, {"a.b.c", 4}, {"abc.", 4}, {".", 1}, {"abc", -1}, {"", -1}};
    for (const auto &c : cases) {
        const char *part = get_charset_from_locale(c.name);
        if (c.offset < 0)
            EXPECT_EQ(part, nullptr) << c.name;
        else
            EXPECT_EQ(part, c.name + c.offset) << c.name;
    }
    EXPECT_EQ(get_charset_from_locale(nullptr), nullptr);
}

TEST(LocaleNameParts, LanguageIsAFreshCopyCutAtTheFirstUnderscore) {
    const struct {
        const char *name;
        const char *language;
    } cases[] = {{"ar_EG.UTF-8", "ar"}, {"ar", "ar"}, {"a_b_c", "a"}, {"_x", ""}, {"", ""},
                 {"en.x_y", "en.x"}};
    for (const auto &c : cases) {
        char *language = get_language_from_locale(c.name);
        ASSERT_NE(language, nullptr) << c.name;
        EXPECT_STREQ(language, c.language) << c.name;
        EXPECT_NE(static_cast<const char *>(language), c.name);
        std::free(language);
    }
    EXPECT_EQ(get_language_from_locale(nullptr), nullptr);
}
