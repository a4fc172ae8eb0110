// Placeholder definitions: replaced as this family is implemented.
#include "textconv.h"

extern "C" {

TEXTCONV_API int FromSJisToJis([[maybe_unused]] const char *sjis, [[maybe_unused]] uint8_t *kind, [[maybe_unused]] JisCode *jis, [[maybe_unused]] uint8_t *consumed) { return 0; }
TEXTCONV_API int FromJisToSJis([[maybe_unused]] uint32_t kind, [[maybe_unused]] const JisCode *jis, [[maybe_unused]] char *sjis, [[maybe_unused]] uint8_t *length) { return 0; }
TEXTCONV_API int StringFromSJISToEUCJP([[maybe_unused]] const char *sjis, [[maybe_unused]] char *euc, [[maybe_unused]] uint32_t *length) { return 0; }
TEXTCONV_API int StringToCurrentEncoding([[maybe_unused]] const char *sjis, [[maybe_unused]] char **result) { return 0; }
TEXTCONV_API int ConvertFromJISToUnicode([[maybe_unused]] const uint8_t *given, [[maybe_unused]] uint16_t *unit, [[maybe_unused]] uint32_t form) { return 0; }
TEXTCONV_API int FromMultiByteToUnicode([[maybe_unused]] uint32_t kind, [[maybe_unused]] const uint8_t *code, [[maybe_unused]] uint16_t *unit) { return 0; }
TEXTCONV_API int FromEUCJPToUnicode([[maybe_unused]] const char **cursor, [[maybe_unused]] uint16_t *unit) { return 0; }
TEXTCONV_API int ConvertFromUnicodeToEUCJP([[maybe_unused]] uint16_t unit, [[maybe_unused]] char *euc) { return 0; }
TEXTCONV_API int FromUnicodeToMultiByte([[maybe_unused]] uint16_t unit, [[maybe_unused]] uint32_t request, [[maybe_unused]] uint8_t *kind, [[maybe_unused]] uint8_t *code, [[maybe_unused]] uint8_t *length) { return 0; }
TEXTCONV_API int FromUnicodeToEUCJP([[maybe_unused]] uint16_t unit, [[maybe_unused]] char **cursor) { return 0; }
TEXTCONV_API uint32_t FromEUCJPtoUTF8([[maybe_unused]] const char *euc, [[maybe_unused]] char *utf8, [[maybe_unused]] uint8_t *count) { return 0; }
TEXTCONV_API int StringFromEUCJPToUTF8([[maybe_unused]] const char *euc, [[maybe_unused]] char *utf8, [[maybe_unused]] uint32_t *length) { return 0; }
TEXTCONV_API int StringFromSJISToUTF8([[maybe_unused]] const char *sjis, [[maybe_unused]] char *utf8, [[maybe_unused]] uint32_t *length) { return 0; }
TEXTCONV_API int StringFromEUCJPToSJIS([[maybe_unused]] const char *euc, [[maybe_unused]] char *sjis, [[maybe_unused]] int32_t *length) { return 0; }
TEXTCONV_API extern const uint16_t MS_Sun_extension_table[94] = {};

}  // extern "C"
