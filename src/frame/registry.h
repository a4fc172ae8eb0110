// Internal view of the charset registry and the cached converters.
#pragma once

#include <iconv.h>

#include "textconv.h"

namespace textconv {

// A cached converter cell: an open descriptor, or one of the sentinels.
using ConverterCell = iconv_t;

inline ConverterCell unopened_cell() { return reinterpret_cast<iconv_t>(static_cast<intptr_t>(CONVERTER_UNOPENED)); }
inline ConverterCell failed_cell() { return reinterpret_cast<iconv_t>(static_cast<intptr_t>(CONVERTER_FAILED)); }

// Which side of a converter is the library's UTF-16 form.
enum class Pivot { Source, Target };

// The name shown to the user and printed for the library's UTF-16 form.
inline constexpr const char kUnicodeName[] = "UTF-16";

// The converter caches, process-wide, never closed.
extern ConverterCell fromUnicodeConverters[CHARSET_COUNT];
extern ConverterCell toUnicodeConverters[CHARSET_COUNT];
extern ConverterCell eucjpToUnicodeConverter;
extern ConverterCell unicodeToEucjpConverter;
extern ConverterCell unicodeToKoi8rConverter;
extern ConverterCell koi8rToUnicodeConverter;

// Opens *cell on first use. charsetName is the non-UTF-16 side of the
// conversion; pivot tells which side is UTF-16. Returns the open descriptor,
// or nullptr when none is available: the cell already failed, or opening just
// failed and the user accepted to go on (a refusal ends the process with
// exit(1)). The user is asked once per cell. Callers print their own message.
iconv_t acquire_converter(ConverterCell *cell, const char *charsetName, Pivot pivot);

// The registry's iconv name for printing: never null.
const char *printable_charset_name(CharsetId charset);

}  // namespace textconv
