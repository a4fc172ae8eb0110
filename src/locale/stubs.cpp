// Placeholder definitions: replaced as this family is implemented.
#include "textconv.h"

extern "C" {

TEXTCONV_API CharsetId LocalEncoding([[maybe_unused]] void) { return 0; }
TEXTCONV_API CharsetId SetCurrentLocale([[maybe_unused]] uint32_t rewrite) { return 0; }
TEXTCONV_API CharsetId find_charset_from([[maybe_unused]] const char *name) { return 0; }
TEXTCONV_API const char * get_charset_from_locale([[maybe_unused]] const char *name) { return nullptr; }
TEXTCONV_API char * get_language_from_locale([[maybe_unused]] const char *name) { return nullptr; }
TEXTCONV_API void apply_locale_name([[maybe_unused]] const char *name) { }
TEXTCONV_API extern const StringIDEntry charsets[] = {{nullptr, 0}};
TEXTCONV_API extern const StringIDEntry locales[] = {{nullptr, 0}};
TEXTCONV_API extern const StringIDEntry languages[] = {{nullptr, 1}};

}  // extern "C"
