// The locale-name helpers on arbitrary names: the charset part, the language
// part and the table search must agree with each other and with the host's
// lookup, whatever the bytes, and the language copy must be a clean heap
// string the caller can free.
#include "fuzz_support.h"

namespace {

void names(const std::string &raw) {
    std::string name = fuzz::without_nul(raw);
    const char *c = name.c_str();

    const char *charsetPart = get_charset_from_locale(c);
    size_t dot = name.rfind('.');
    if (dot == std::string::npos) {
        FUZZ_CHECK(charsetPart == nullptr);
    } else {
        FUZZ_CHECK(charsetPart == c + dot + 1);
    }

    char *language = get_language_from_locale(c);
    FUZZ_CHECK(language != nullptr);
    FUZZ_CHECK(std::string(language) == name.substr(0, name.find('_')));
    std::free(language);

    // The search order: charset part, whole name, language; the languages
    // table's end row gives the default.
    CharsetId expected = 0;
    if (charsetPart) expected = GetiStringID(charsetPart, charsets);
    if (expected == 0) expected = GetiStringID(c, locales);
    if (expected == 0) expected = GetiStringID(name.substr(0, name.find('_')).c_str(), languages);
    CharsetId id = find_charset_from(c);
    FUZZ_CHECK(id == expected);
    FUZZ_CHECK(id >= 0 && id < CHARSET_COUNT);
    FUZZ_CHECK(std::string(c) == name);  // the name is not changed
}

}  // namespace

extern "C" int LLVMFuzzerInitialize(int *, char ***) {
    CharsetId local = LocalEncoding();
    FUZZ_CHECK(local > 0 && local < CHARSET_COUNT);
    FUZZ_CHECK(LocalEncoding() == local && SetCurrentLocale(1) == local);
    return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
    fuzz::Reader in(data, size);
    uint8_t op = in.byte();
    std::string name = in.rest();
    names(name);
    // Table names with fuzzed decorations reach the rows, not only the ends.
    const StringIDEntry *tables[] = {charsets, locales, languages};
    const StringIDEntry *table = tables[op % 3];
    size_t rows = 0;
    while (table[rows].name) ++rows;
    if (rows) {
        const char *row = table[(op / 3) % rows].name;
        names(std::string(row) + name.substr(0, 8));
        names(name.substr(0, 8) + "." + row);
        names(std::string(row));
    }
    return 0;
}
