// The exported name tables of the local-encoding detection. Each ends with a
// row whose name is null; its id is what a lookup yields when nothing matches.
#include "locale/detection.h"

extern "C" {

// Charset names as they follow the last "." of a locale name, or as the
// platform reports its codeset.
TEXTCONV_API extern constexpr StringIDEntry charsets[] = {
    {"IBM-eucJP", CHARSET_EUCJP},
    {"eucJP", CHARSET_EUCJP},
    {"PCK", CHARSET_SJIS},
    {"IBM-943", CHARSET_SJIS},
    {"IBM-932", CHARSET_SJIS},
    {"SJIS", CHARSET_SJIS},
    {"KOI8-R", CHARSET_KOI8R},
    {"KOI8R", CHARSET_KOI8R},
    {"UTF-8", CHARSET_UTF8},
    {"UTF8", CHARSET_UTF8},
    {"GB18030", CHARSET_GB18030},
    {"GBK", CHARSET_GBK},
    {"GB2312", CHARSET_GB2312},
    {"BIG5", CHARSET_BIG5},
    {"BIG5HKSCS", CHARSET_BIG5HKSCS},
    {"TIS620", CHARSET_ISO8859_11},
    {"ISO88596", CHARSET_ISO8859_6},
    {"ISO8859-6", CHARSET_ISO8859_6},
    {"ISO-8859-6", CHARSET_ISO8859_6},
    {"ISO88598", CHARSET_ISO8859_8},
    {"ISO8859-8", CHARSET_ISO8859_8},
    {"ISO-8859-8", CHARSET_ISO8859_8},
    {"ISO88592", CHARSET_ISO8859_2},
    {"ISO8859-2", CHARSET_ISO8859_2},
    {"ISO-8859-2", CHARSET_ISO8859_2},
    {"ISO885915", CHARSET_ISO8859_15},
    {"ISO8859-15", CHARSET_ISO8859_15},
    {"ISO-8859-15", CHARSET_ISO8859_15},
    {"EUC-KR", CHARSET_EUCKR},
    {"eucKR", CHARSET_EUCKR},
    {nullptr, CHARSET_NONE},
};

// Whole locale names. "ja_JP" and "Ja_JP" differ only in case and name
// different charsets; a case-insensitive host lookup never reaches the second.
TEXTCONV_API extern constexpr StringIDEntry locales[] = {
    {"ja", CHARSET_EUCJP},        {"japa", CHARSET_EUCJP},       {"ja_JP", CHARSET_EUCJP},
    {"Ja_JP", CHARSET_SJIS},      {"zh_CN", CHARSET_GBK},        {"zh_TW", CHARSET_BIG5},
    {"zh_HK", CHARSET_BIG5HKSCS}, {"th_TH", CHARSET_ISO8859_11}, {"ar_IN", CHARSET_UTF8},
    {"he_IL", CHARSET_ISO8859_8}, {"ko_KR", CHARSET_EUCKR},      {nullptr, CHARSET_NONE},
};

// Language codes. The terminator's id is the default of the whole detection.
TEXTCONV_API extern constexpr StringIDEntry languages[] = {
    {"ar", CHARSET_ISO8859_6},
    {nullptr, CHARSET_LATIN1},
};

}  // extern "C"

namespace textconv {
namespace {
constexpr int row_count(const StringIDEntry *table) {
    int n = 0;
    while (table[n].name) ++n;
    return n;
}
constexpr bool ids_registered(const StringIDEntry *table) {
    for (; table->name; ++table)
        if (table->id <= CHARSET_NONE || table->id >= CHARSET_COUNT) return false;
    return true;
}
static_assert(row_count(charsets) == 30 && row_count(locales) == 11 && row_count(languages) == 1);
static_assert(ids_registered(charsets) && ids_registered(locales) && ids_registered(languages));
static_assert(languages[row_count(languages)].id == kDefaultLocalEncoding);
}  // namespace
}  // namespace textconv
