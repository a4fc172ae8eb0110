// Internal view of the charset engine: the iconv-based conversions between a
// registered charset and UTF-16, callable without the exported wrappers.
#pragma once

#include <stdint.h>

#include "textconv.h"

namespace textconv::engine {

// Set once, by the first conversion to UTF-16 whose converter writes a
// byte-order mark that twice leaves no room for the terminator; never
// cleared. While set, every conversion to UTF-16 keeps the source's last
// byte away from the converter and stores the terminating unit itself.
extern uint32_t terminatorOutsideConverter;

// True for the charsets whose text is made of 16-bit units (UTF-16 and its
// two byte orders): their strings end with a 0 unit, and a rejected
// sequence is skipped one unit at a time.
constexpr bool is_unit_charset(CharsetId charset) {
    return charset == CHARSET_UTF16 || charset == CHARSET_UTF16LE || charset == CHARSET_UTF16BE;
}

// The same contracts as the exported functions of the same names.
int string_from_unicode_to_charset(CharsetId charset, const uint16_t **source, char **destination,
                                   uint32_t *length);
int string_from_charset_to_unicode(CharsetId charset, const char **source, uint16_t **destination,
                                   uint32_t *length);

// The charset in which a server code page is read; CHARSET_NONE for a code
// page the library does not know.
CharsetId server_code_page_charset(int32_t codePage);

}  // namespace textconv::engine
