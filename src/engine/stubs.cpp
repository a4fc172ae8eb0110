// Placeholder definitions: replaced as this family is implemented.
#include "textconv.h"

extern "C" {

TEXTCONV_API int StringFromUnicodeToCharset([[maybe_unused]] CharsetId charset, [[maybe_unused]] const uint16_t **source, [[maybe_unused]] char **destination, [[maybe_unused]] uint32_t *length) { return 0; }
TEXTCONV_API int StringFromCharsetToUnicode([[maybe_unused]] CharsetId charset, [[maybe_unused]] const char **source, [[maybe_unused]] uint16_t **destination, [[maybe_unused]] uint32_t *length) { return 0; }
TEXTCONV_API int FromUnicodeToCharset([[maybe_unused]] CharsetId charset, [[maybe_unused]] uint32_t unit, [[maybe_unused]] char **destination) { return 0; }
TEXTCONV_API int FromCharsetToUnicode([[maybe_unused]] CharsetId charset, [[maybe_unused]] const char **source, [[maybe_unused]] uint16_t *destination, [[maybe_unused]] uint32_t *length) { return 0; }
TEXTCONV_API int FromUnicodeToKOI8R([[maybe_unused]] uint32_t unit, [[maybe_unused]] char **destination) { return 0; }
TEXTCONV_API int FromKOI8RToUnicode([[maybe_unused]] const char **source, [[maybe_unused]] uint16_t *destination) { return 0; }
TEXTCONV_API int StringFromServerCPToCharset([[maybe_unused]] CharsetId charset, [[maybe_unused]] int32_t codePage, [[maybe_unused]] const char *source, [[maybe_unused]] char *destination, [[maybe_unused]] uint32_t *length) { return 0; }
TEXTCONV_API int StringFromServerCPToLocal([[maybe_unused]] int32_t codePage, [[maybe_unused]] const char *source, [[maybe_unused]] char *destination, [[maybe_unused]] uint32_t *length) { return 0; }

}  // extern "C"
