// The exported charset registry and identification data.
#include "textconv.h"

extern "C" {

TEXTCONV_API extern const CharsetConversionEntry charsetConversion[CHARSET_COUNT] = {
    {0, nullptr},         {3, "ISO-8859-1"}, {7, "EUC-JP"},      {3, "SJIS"},       {3, "UTF-8"},
    {3, "UTF-16"},        {3, "UTF16-LE"},   {3, "UTF16-BE"},    {3, "KOI8-R"},     {3, "GB18030"},
    {3, "GB2312"},        {3, "GBK"},        {3, "BIG5"},        {3, "BIG5HKSCS"},  {3, "ISO-8859-11"},
    {3, "ISO-8859-6"},    {3, "ISO-8859-8"}, {3, "ISO-8859-2"},  {3, "ISO-8859-15"}, {3, "EUC-KR"},
    {3, "CP1250"},        {3, "CP1251"},     {3, "CP1256"},
};

TEXTCONV_API extern const char *const version_info = "@(#)2012-07-20 13:02:10 BST";

TEXTCONV_API extern const uint32_t conversions_availability = 2;
}
