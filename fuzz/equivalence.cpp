// StringsEquivalent: symmetric, reflexive on decodable text, never stricter
// with case folding on, and, for valid text, exactly "the same units, units up
// to 0xFF folded through the locale's upper-case table". Across encodings a
// text equals its local form whenever the local charset holds it.
#include <ctype.h>

#include "fuzz_support.h"

namespace {

CharsetId local = CHARSET_NONE;

std::optional<std::u16string> utf16_of(const std::string &utf8) {
    std::optional<std::string> bytes = fuzz::iconv_convert("UTF-16LE", "UTF-8", utf8);
    if (!bytes) return std::nullopt;
    return fuzz::units_of(*bytes);
}

bool model(const std::u16string &a, const std::u16string &b, bool ignoreCase) {
    if (a.size() != b.size()) return false;
    const int32_t *upper = *__ctype_toupper_loc();
    for (size_t i = 0; i < a.size(); ++i) {
        if (a[i] == b[i]) continue;
        if (!ignoreCase || a[i] > 0xFF || b[i] > 0xFF || upper[a[i]] != upper[b[i]]) return false;
    }
    return true;
}

int equivalent(const std::string &a, int32_t ea, const std::string &b, int32_t eb, uint8_t ic) {
    int r = StringsEquivalent(a.c_str(), ea, b.c_str(), eb, ic);
    FUZZ_CHECK(r == 0 || r == 1);
    FUZZ_CHECK(StringsEquivalent(b.c_str(), eb, a.c_str(), ea, ic) == r);
    return r;
}

// A changed copy of text: case swapped, cut, or one character replaced.
std::string variant(const std::string &text, fuzz::Reader &in) {
    std::string s = text;
    switch (in.byte() % 4) {
        case 0:
            for (char &c : s)
                if ((in.byte() & 1) && c >= 'a' && c <= 'z') c = static_cast<char>(c - 32);
            break;
        case 1:
            for (char &c : s)
                if ((in.byte() & 1) && c >= 'A' && c <= 'Z') c = static_cast<char>(c + 32);
            break;
        case 2: {
            // Cut at a character boundary.
            size_t cut = s.empty() ? 0 : in.byte() % s.size();
            while (cut > 0 && (static_cast<uint8_t>(s[cut]) & 0xC0) == 0x80) --cut;
            s.resize(cut);
            break;
        }
        default:
            s = fuzz::valid_utf8(in, 40);
            break;
    }
    return s;
}

}  // namespace

extern "C" int LLVMFuzzerInitialize(int *, char ***) {
    local = fuzz::adopt_fuzz_locale();
    return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
    fuzz::Reader in(data, size);
    uint8_t op = in.byte();
    uint8_t ic = in.byte() & 1 ? in.byte() | 1 : 0;
    if (op % 3 == 0) {
        // Arbitrary bytes under any selectors.
        std::string a = fuzz::without_nul(in.bytes(100));
        std::string b = fuzz::without_nul(in.bytes(100));
        int32_t ea = in.byte() % 2 ? CHARSET_UTF8 : static_cast<int32_t>(in.u32());
        int32_t eb = in.byte() % 2 ? CHARSET_UTF8 : static_cast<int32_t>(in.u32());
        int r = equivalent(a, ea, b, eb, 0);
        if (r) FUZZ_CHECK(equivalent(a, ea, b, eb, 1) == 1);
        equivalent(a, ea, a, ea, ic);
        return 0;
    }
    std::string a = fuzz::valid_utf8(in, 40);
    std::string b = variant(a, in);
    std::optional<std::u16string> ua = utf16_of(a), ub = utf16_of(b);
    FUZZ_CHECK(ua && ub);
    FUZZ_CHECK(equivalent(a, CHARSET_UTF8, a, CHARSET_UTF8, ic) == 1);
    FUZZ_CHECK(equivalent(a, CHARSET_UTF8, b, CHARSET_UTF8, ic) == model(*ua, *ub, ic != 0));
    if (op % 3 == 2 && local != CHARSET_UTF16) {
        // The same text held in the local encoding, on either side.
        std::optional<std::string> la = fuzz::iconv_convert(charsetConversion[local].iconvName, "UTF-8", a);
        std::optional<std::string> lb = fuzz::iconv_convert(charsetConversion[local].iconvName, "UTF-8", b);
        bool bmp = a.find_first_of("\xF0\xF1\xF2\xF3\xF4") == std::string::npos &&
                   b.find_first_of("\xF0\xF1\xF2\xF3\xF4") == std::string::npos;
        // Only text the local charset holds both ways (glibc writes a few
        // characters one way: U+00A5 as 0x5C in EUC-JP, "~" as 0x7E that
        // Shift-JIS reads as U+203E).
        const char *name = charsetConversion[local].iconvName;
        bool both = la && lb && fuzz::iconv_convert("UTF-8", name, *la) == a &&
                    fuzz::iconv_convert("UTF-8", name, *lb) == b;
        if (both && bmp && la->find('\0') == std::string::npos && lb->find('\0') == std::string::npos) {
            fuzz::trace("a", a);
            fuzz::trace("b", b);
            fuzz::trace("local a", *la);
            int32_t localSelector = static_cast<int32_t>(in.byte() % 2 ? CHARSET_NONE : local + 100);
            FUZZ_CHECK(equivalent(a, CHARSET_UTF8, *la, localSelector, ic) == 1);
            FUZZ_CHECK(equivalent(*la, localSelector, *lb, localSelector, ic) == model(*ua, *ub, ic != 0));
        }
    }
    return 0;
}
