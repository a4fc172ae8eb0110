// The Windows code pages that a server may name, and the charset in which
// the library reads each. 1252 is read as ISO-8859-1 (0x80..0x9F stay C1
// controls); 874, 949, 950 and 1255 are read as the ISO or national charset.
#pragma once

#include <stdint.h>

#include "textconv.h"

namespace textconv::engine {

struct CodePageEntry {
    int32_t codePage;
    CharsetId charset;
};

inline constexpr CodePageEntry kServerCodePages[] = {
    {874, CHARSET_ISO8859_11}, {932, CHARSET_SJIS},    {936, CHARSET_GBK},     {949, CHARSET_EUCKR},
    {950, CHARSET_BIG5},       {1250, CHARSET_CP1250}, {1251, CHARSET_CP1251}, {1252, CHARSET_LATIN1},
    {1255, CHARSET_ISO8859_8}, {1256, CHARSET_CP1256},
};

}  // namespace textconv::engine
