// Placeholder definitions: replaced as this family is implemented.
#include "textconv.h"

extern "C" {

TEXTCONV_API int StringFromUnicodeToLocal([[maybe_unused]] const uint16_t *source, [[maybe_unused]] char *target, [[maybe_unused]] uint32_t *length) { return 0; }
TEXTCONV_API int StringFromLocalToUnicode([[maybe_unused]] const char *source, [[maybe_unused]] uint16_t *target, [[maybe_unused]] uint32_t *length) { return 0; }
TEXTCONV_API int FromUnicodeToLocal([[maybe_unused]] uint32_t unit, [[maybe_unused]] char **cursor) { return 0; }
TEXTCONV_API int FromLocalToUnicode([[maybe_unused]] const char **cursor, [[maybe_unused]] uint16_t *target, [[maybe_unused]] uint32_t *count) { return 0; }
TEXTCONV_API int StringFromUTF8ToLocal([[maybe_unused]] const char *source, [[maybe_unused]] char *target, [[maybe_unused]] uint32_t *length) { return 0; }
TEXTCONV_API int StringFromLocalToUTF8([[maybe_unused]] const char *source, [[maybe_unused]] char *target, [[maybe_unused]] uint32_t *length) { return 0; }
TEXTCONV_API void StringListFromUnicodeToLocal([[maybe_unused]] uint16_t **list, [[maybe_unused]] uint32_t *length) { }
TEXTCONV_API void host_stringFromWindowsUnicode([[maybe_unused]] const char *source, [[maybe_unused]] char *target, [[maybe_unused]] int32_t *length) { }
TEXTCONV_API void host_stringToWindowsUnicode([[maybe_unused]] const char *source, [[maybe_unused]] uint16_t *target, [[maybe_unused]] uint32_t *length) { }
TEXTCONV_API int StringsEquivalent([[maybe_unused]] const char *first, [[maybe_unused]] int32_t firstEncoding, [[maybe_unused]] const char *second, [[maybe_unused]] int32_t secondEncoding, [[maybe_unused]] uint8_t ignoreCase) { return 0; }

}  // extern "C"
