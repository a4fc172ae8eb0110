// Locale and charset names to CharsetIds through the exported tables, with
// the reference host's exact, case-sensitive lookup.
#include <gtest/gtest.h>

#include <cstdlib>
#include <cstring>
#include <string>

#include "charset_agreement.h"
#include "test_support.h"
#include "textconv.h"

// Where glibc knows a charset name of the table, its converter decodes every
// short sequence as the registry's converter for the row's id does.
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
        EXPECT_TRUE(agreement->differing.empty()) << agreement->differing.size() << " differ, first "
                                                  << testsupport::hex(agreement->differing.front());
    }
    EXPECT_GE(checked, 20);
}

TEST(FindCharsetFrom, EveryRowOfTheTables) {
    // The charset part (after the last ".") decides first, whatever precedes
    // it; without a "." the same word is neither a locale nor a language.
    for (const StringIDEntry *row = charsets; row->name; ++row) {
        for (const char *prefix : {"xx_XX.", "fr_FR.", "ar_EG.", "ja_JP.old.", "."})
            EXPECT_EQ(find_charset_from((prefix + std::string(row->name)).c_str()), row->id)
                << prefix << row->name;
        EXPECT_EQ(find_charset_from(row->name), CHARSET_LATIN1) << row->name;
        EXPECT_LT(row->id, CHARSET_COUNT);
    }
    // Whole locale names next, exact matches only: with a charset part found
    // in no table the language decides.
    for (const StringIDEntry *row = locales; row->name; ++row) {
        EXPECT_EQ(find_charset_from(row->name), row->id) << row->name;
        const CharsetId byLanguage =
            std::strncmp(row->name, "ar_", 3) == 0 ? CHARSET_ISO8859_6 : CHARSET_LATIN1;
        EXPECT_EQ(find_charset_from((row->name + std::string(".bogus")).c_str()), byLanguage) << row->name;
    }
}

TEST(FindCharsetFrom, Cases) {
    const std::pair<const char *, CharsetId> cases[] = {{"Ja_JP", CHARSET_SJIS},
                                                        {"JA_JP", CHARSET_LATIN1},
                                                        {"ja_JP.sjis", CHARSET_LATIN1},
                                                        {"zh_TW.Big5", CHARSET_LATIN1},
                                                        {"ar", CHARSET_ISO8859_6},
                                                        {"ar_IN", CHARSET_UTF8},
                                                        {"ar_SA.ISO-8859-1", CHARSET_ISO8859_6},
                                                        {"ar.bogus_x", CHARSET_LATIN1},
                                                        {"arabic", CHARSET_LATIN1},
                                                        {"POSIX", CHARSET_LATIN1},
                                                        {"C", CHARSET_LATIN1},
                                                        {"", CHARSET_LATIN1},
                                                        {".", CHARSET_LATIN1},
                                                        {"ja_JP.", CHARSET_LATIN1},
                                                        {"_ar", CHARSET_LATIN1},
                                                        {"a.UTF8.b", CHARSET_LATIN1},
                                                        {"b.x.UTF8", CHARSET_UTF8},
                                                        {"en_US.utf8", CHARSET_LATIN1}};
    for (const auto &[name, id] : cases) EXPECT_EQ(find_charset_from(name), id) << '"' << name << '"';
}

TEST(LocaleNameParts, CharsetPartAndLanguage) {
    // The charset part points into the name (-1: no "."); the language is a
    // fresh copy cut at the first "_".
    const struct {
        const char *name;
        int dot;
        const char *language;
    } cases[] = {{"en_US.UTF-8", 6, "en"}, {"a.b.c", 4, "a.b.c"}, {"abc.", 4, "abc."}, {".", 1, "."},
                 {"abc", -1, "abc"},       {"", -1, ""},          {"a_b_c", -1, "a"},  {"_x", -1, ""},
                 {"en.x_y", 3, "en.x"}};
    for (const auto &c : cases) {
        EXPECT_EQ(get_charset_from_locale(c.name), c.dot < 0 ? nullptr : c.name + c.dot) << c.name;
        char *language = get_language_from_locale(c.name);
        ASSERT_NE(language, nullptr) << c.name;
        EXPECT_STREQ(language, c.language) << c.name;
        EXPECT_NE(static_cast<const char *>(language), c.name);
        std::free(language);
    }
    EXPECT_EQ(get_charset_from_locale(nullptr), nullptr);
    EXPECT_EQ(get_language_from_locale(nullptr), nullptr);
}
