/* Compiled with -std=c99 -pedantic-errors: the header must stay valid C99. */
#include "textconv.h"

int header_c99_uses(void) {
    JisCode code = {{1, 1}};
    StringIDEntry row = {0, CHARSET_LATIN1};
    return code.byte[0] + row.id + (int)sizeof(CharsetConversionEntry) + MB_KIND_SJIS + JIS_FORM_X0212 +
           DIRECTION_NEUTRAL + TEXTCONV_UTF_TARGET_FULL + CHARSET_COUNT;
}
