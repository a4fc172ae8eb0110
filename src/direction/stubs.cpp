// Placeholder definitions: replaced as this family is implemented.
#include "textconv.h"

extern "C" {

TEXTCONV_API int StringFromCharsetToDirectionEscapedString([[maybe_unused]] CharsetId charset, [[maybe_unused]] char *target, [[maybe_unused]] const char *source, [[maybe_unused]] uint32_t *length) { return 0; }
TEXTCONV_API int StringFromLocalToDirectionEscapedString([[maybe_unused]] char *target, [[maybe_unused]] const char *source, [[maybe_unused]] uint32_t *length) { return 0; }

}  // extern "C"
