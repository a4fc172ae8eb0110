// Placeholder definitions: replaced as this family is implemented.
#include "textconv.h"

extern "C" {

TEXTCONV_API uint32_t ConvertUTF8toUTF16([[maybe_unused]] const char *source, [[maybe_unused]] uint32_t sourceLength, [[maybe_unused]] uint16_t *target, [[maybe_unused]] uint32_t targetCapacity, [[maybe_unused]] uint32_t *written) { return 0; }
TEXTCONV_API uint32_t ConvertUTF16toUTF8([[maybe_unused]] const uint16_t *source, [[maybe_unused]] uint32_t sourceLength, [[maybe_unused]] char *target, [[maybe_unused]] uint32_t targetCapacity, [[maybe_unused]] uint32_t *written) { return 0; }
TEXTCONV_API int StringFromUTF8ToUnicode([[maybe_unused]] const char *source, [[maybe_unused]] uint16_t *target, [[maybe_unused]] uint32_t *length) { return 0; }
TEXTCONV_API int StringFromUnicodeToUTF8([[maybe_unused]] const uint16_t *source, [[maybe_unused]] char *target, [[maybe_unused]] uint32_t *length) { return 0; }
TEXTCONV_API int FromUTF8ToUnicode([[maybe_unused]] const char **cursor, [[maybe_unused]] uint16_t *target, [[maybe_unused]] uint32_t *written) { return 0; }
TEXTCONV_API int FromUnicodeToUTF8([[maybe_unused]] uint32_t unit, [[maybe_unused]] char **cursor) { return 0; }
TEXTCONV_API int StringListFromUTF8toUTF16([[maybe_unused]] char **list, [[maybe_unused]] uint32_t *length) { return 0; }
TEXTCONV_API int FromUCS4toUTF8([[maybe_unused]] uint32_t value, [[maybe_unused]] char *target, [[maybe_unused]] uint8_t *count) { return 0; }
TEXTCONV_API int FromKOI8RtoUTF8([[maybe_unused]] const char *source, [[maybe_unused]] char *target, [[maybe_unused]] uint8_t *count) { return 0; }
TEXTCONV_API int StringFromLatin1ToUTF8([[maybe_unused]] const char *source, [[maybe_unused]] char *target, [[maybe_unused]] uint32_t *length) { return 0; }

}  // extern "C"
