// Decides the local encoding once per process from the process locale, LANG
// and the name tables, and caches it.
#include <langinfo.h>
#include <strings.h>

#include <clocale>
#include <cstdlib>
#include <cstring>

#include "locale/detection.h"

namespace textconv {

CharsetId currentLocalEncoding = 0;
uint8_t utf8LocaleRewrite = 0;

namespace {

// Compared without regard to case; replaced by "UTF-8" after the ".".
constexpr char kUtf8Suffix[] = ".UTF8";
constexpr uint32_t kUtf8SuffixLength = sizeof kUtf8Suffix - 1;
constexpr char kUtf8Canonical[] = "UTF-8";

// The id a table yields when nothing matches: the one its terminator holds.
CharsetId terminator_id(const StringIDEntry *table) {
    while (table->name) ++table;
    return table->id;
}

CharsetId fall_back_to_latin1() {
    apply_locale_name(kFallbackLocale);
    currentLocalEncoding = CHARSET_LATIN1;
    return CHARSET_LATIN1;
}

// The process runs in a UTF-8 locale named name. With the rewrite switched
// on, a name ending in ".UTF8" (any case) is applied again as "...UTF-8".
CharsetId settle_utf8_locale(const char *name) {
    if (!name || utf8LocaleRewrite == 0) return CHARSET_UTF8;
    const size_t length = std::strlen(name);
    if (length <= kUtf8SuffixLength) return CHARSET_UTF8;
    if (strcasecmp(name + length - kUtf8SuffixLength, kUtf8Suffix) != 0) return CHARSET_UTF8;
    if (length + 2 >= kLocaleNameRoom) return fall_back_to_latin1();

    // Everything up to and including the ".", then "UTF-8" and its NUL:
    // length + 2 bytes at most, so below the room checked above.
    char rewritten[kLocaleNameRoom];
    const size_t keep = length - (kUtf8SuffixLength - 1);
    static_assert(sizeof kUtf8Canonical == kUtf8SuffixLength + 1);
    std::memcpy(rewritten, name, keep);
    std::memcpy(rewritten + keep, kUtf8Canonical, sizeof kUtf8Canonical);
    apply_locale_name(rewritten);
    return currentLocalEncoding;
}

}  // namespace
}  // namespace textconv

using namespace textconv;

extern "C" {

TEXTCONV_API CharsetId LocalEncoding(void) {
    if (currentLocalEncoding != 0) return currentLocalEncoding;

    std::setlocale(LC_ALL, "");
    // Glibc's storage: valid until the next setlocale, which comes only
    // after the name has been used or copied.
    const char *name = std::setlocale(LC_CTYPE, nullptr);
    const char *codeset = nl_langinfo(CODESET);
    CharsetId id = 0;
    if (codeset) {
        id = GetiStringID(codeset, charsets);
        currentLocalEncoding = id;
    }
    if (id == 0) {
        if (!name) {
            name = std::getenv("LANG");
            if (!name) return fall_back_to_latin1();
        }
        id = find_charset_from(name);
        currentLocalEncoding = id;
    }
    if (id != CHARSET_UTF8) return id;
    return settle_utf8_locale(name);
}

TEXTCONV_API CharsetId SetCurrentLocale(uint32_t rewrite) {
    utf8LocaleRewrite = static_cast<uint8_t>(rewrite & 0xFFu);
    return LocalEncoding();
}

TEXTCONV_API CharsetId find_charset_from(const char *name) {
    // No name names nothing: the default, without troubling the host.
    if (!name) return terminator_id(languages);

    if (const char *charsetPart = get_charset_from_locale(name)) {
        const CharsetId id = GetiStringID(charsetPart, charsets);
        if (id != 0) return id;
    }
    const CharsetId id = GetiStringID(name, locales);
    if (id != 0) return id;

    char *language = get_language_from_locale(name);
    // Out of memory: the language cannot be looked up, so it matches no row.
    if (!language) return terminator_id(languages);
    const CharsetId languageId = GetiStringID(language, languages);
    std::free(language);
    return languageId;
}

TEXTCONV_API const char *get_charset_from_locale(const char *name) {
    if (!name) return nullptr;
    const char *dot = std::strrchr(name, '.');
    return dot ? dot + 1 : nullptr;
}

TEXTCONV_API char *get_language_from_locale(const char *name) {
    if (!name) return nullptr;
    char *language = strdup(name);
    if (!language) return nullptr;
    if (char *underscore = std::strchr(language, '_')) *underscore = '\0';
    return language;
}

TEXTCONV_API void apply_locale_name(const char *name) {
    if (!name) return;
    setenv("LANG", name, 1);
    setenv("LC_ALL", name, 1);
    std::setlocale(LC_ALL, "");
}

}  // extern "C"
