// Converter caches and the open-on-first-use procedure.
#include "registry.h"

#include <stdlib.h>

namespace textconv {

namespace {

// iconv reads unmarked "UTF-16" input in big-endian order on some platforms;
// the library's UTF-16 is host order, so the decoding side names it exactly.
// The encoding side keeps "UTF-16": its output is host order, possibly after
// a byte-order mark, which the conversion functions remove.
constexpr const char *kHostOrderUnicode =
#if __BYTE_ORDER__ == __ORDER_BIG_ENDIAN__
    "UTF-16BE";
#else
    "UTF-16LE";
#endif

struct CellsInitialiser {
    CellsInitialiser() {
        for (int i = 0; i < CHARSET_COUNT; ++i) {
            fromUnicodeConverters[i] = i == CHARSET_NONE ? failed_cell() : unopened_cell();
            toUnicodeConverters[i] = i == CHARSET_NONE ? failed_cell() : unopened_cell();
        }
    }
};

}  // namespace

ConverterCell fromUnicodeConverters[CHARSET_COUNT];
ConverterCell toUnicodeConverters[CHARSET_COUNT];
ConverterCell eucjpToUnicodeConverter = unopened_cell();
ConverterCell unicodeToEucjpConverter = unopened_cell();
ConverterCell unicodeToKoi8rConverter = unopened_cell();
ConverterCell koi8rToUnicodeConverter = unopened_cell();

// Runs at load, before any exported function can be called.
static CellsInitialiser cellsInitialiser;

iconv_t acquire_converter(ConverterCell *cell, const char *charsetName, Pivot pivot) {
    if (*cell == failed_cell()) return nullptr;
    if (*cell != unopened_cell()) return *cell;

    const bool fromUnicode = pivot == Pivot::Source;
    // CHARSET_NONE never gets here: its cells start failed.
    *cell = fromUnicode ? iconv_open(charsetName, kHostOrderUnicode) : iconv_open(kUnicodeName, charsetName);
    if (*cell != failed_cell()) return *cell;

    const char *from = fromUnicode ? kUnicodeName : charsetName;
    const char *to = fromUnicode ? charsetName : kUnicodeName;
    if (UIYesNoDisplay(3, 0, 0, from, to) == 0) exit(1);
    return nullptr;
}

const char *printable_charset_name(CharsetId charset) {
    const char *name = charsetConversion[charset].iconvName;
    return name ? name : "(none)";
}

}  // namespace textconv
