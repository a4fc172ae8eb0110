// Internal view of the local-encoding detection.
#pragma once

#include <cstdint>

#include "textconv.h"

namespace textconv {

// The cached local CharsetId; 0 until the first detection decides it.
extern CharsetId currentLocalEncoding;
// Non-zero: a locale name ending in ".UTF8" is rewritten to end in "UTF-8".
// Written only by SetCurrentLocale.
extern uint8_t utf8LocaleRewrite;

// The locale applied when nothing names one, or when a ".UTF8" name is too
// long to rewrite.
inline constexpr char kFallbackLocale[] = "en_US.ISO8859-1";
// What a name found in no table yields: the languages terminator's id.
inline constexpr CharsetId kDefaultLocalEncoding = CHARSET_LATIN1;
// Room for a rewritten locale name, its NUL included.
inline constexpr uint32_t kLocaleNameRoom = 1024;

}  // namespace textconv
