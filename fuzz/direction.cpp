// Direction escaping with varied rooms L. Against a model of the escape walk
// (UTF-8 text): the exact output, or the fallback copy when the text or its
// escaped form does not fit. For every charset: nothing past L, a terminated
// result on success, and "%"-escapes that unescape to the text walked.
#include "direction/classes.h"
#include "fuzz_support.h"

namespace {

using textconv::direction::unit_class;

// The escaped text of units (no terminator) with the budget L.
std::u16string escape(const std::u16string &units, uint32_t limit) {
    std::u16string out, pending;
    uint8_t current = DIRECTION_NEUTRAL;
    uint32_t budget = 0;
    for (size_t i = 0; i < units.size() && budget < limit; ++i) {
        char16_t u = units[i];
        budget += u == u'%' ? 2 : 1;
        uint8_t cls = unit_class(u);
        if (cls == DIRECTION_NEUTRAL) {
            pending += u == u'%' ? u"%%" : std::u16string(1, u);
            continue;
        }
        uint32_t run = static_cast<uint32_t>(pending.size());
        if (cls == current) {
            out += pending;
            budget += run + 1;
        } else if (cls == DIRECTION_LTR) {
            out += u"%l" + pending;
            budget += run + 3;
        } else {
            out += pending + u"%r";
            budget += run + 3;
        }
        out += u;
        pending.clear();
        current = cls;
    }
    return out + pending;
}

// Removes the escapes: "%l" and "%r" vanish, "%%" is one "%".
std::optional<std::string> unescape(const std::string &s) {
    std::string out;
    for (size_t i = 0; i < s.size(); ++i) {
        if (s[i] != '%') {
            out += s[i];
            continue;
        }
        if (i + 1 == s.size()) return std::nullopt;
        char next = s[++i];
        if (next == '%')
            out += '%';
        else if (next != 'l' && next != 'r')
            return std::nullopt;
    }
    return out;
}

void utf8_model(fuzz::Reader &in) {
    std::string source = fuzz::valid_utf8(in, 80);
    uint32_t limit = in.byte() % 4 == 0 ? in.u16() % 1024 : in.byte();
    std::u16string units = fuzz::units_of(*fuzz::iconv_convert("UTF-16LE", "UTF-8", source));
    fuzz::Guarded target(limit);
    uint32_t length = limit;
    FUZZ_CHECK(
        StringFromCharsetToDirectionEscapedString(CHARSET_UTF8, target.data(), source.c_str(), &length) == 1);
    FUZZ_CHECK(target.intact());

    std::optional<std::string> expected;
    if ((units.size() + 1) * 2 <= 2ull * limit) {
        // The walk may stop inside a pair: its lone half becomes "?".
        std::u16string escaped = escape(units, limit);
        if (!escaped.empty() && escaped.back() >= 0xD800 && escaped.back() <= 0xDBFF) escaped.back() = u'?';
        expected = fuzz::iconv_convert("UTF-8", "UTF-16LE", fuzz::bytes_of(escaped));
        FUZZ_CHECK(expected.has_value());
        *expected += '\0';
        if (expected->size() > limit) expected.reset();
    }
    if (!expected) {
        // The fallback: strncpy of the source, length kept.
        std::string copy(limit, '\0');
        std::memcpy(copy.data(), source.data(), std::min<size_t>(limit, source.size()));
        FUZZ_CHECK(length == limit && target.bytes(limit) == copy);
        return;
    }
    FUZZ_CHECK(length == expected->size() && target.bytes(length) == *expected);
    std::optional<std::string> plain = unescape(expected->substr(0, expected->size() - 1));
    FUZZ_CHECK(plain.has_value());
    if (!plain->empty() && plain->back() == '?' &&
        (source.size() < plain->size() || source[plain->size() - 1] != '?'))
        plain->pop_back();
    FUZZ_CHECK(source.compare(0, plain->size(), *plain) == 0);
}

void any_charset(fuzz::Reader &in) {
    static const CharsetId kCharsets[] = {
        CHARSET_UTF8,  CHARSET_LATIN1, CHARSET_ISO8859_8, CHARSET_ISO8859_6, CHARSET_CP1256,  CHARSET_SJIS,
        CHARSET_EUCJP, CHARSET_UTF16,  CHARSET_UTF16LE,   CHARSET_NONE,      CHARSET_GB18030, CHARSET_BIG5};
    CharsetId id = kCharsets[in.byte() % (sizeof kCharsets / sizeof kCharsets[0])];
    uint32_t limit = in.byte() % 4 == 0 ? in.u16() % 1024 : in.byte();
    std::string source = in.bytes(255);
    bool units = id == CHARSET_UTF16 || id == CHARSET_UTF16LE || id == CHARSET_UTF16BE;
    if (units) {
        std::u16string u = fuzz::units_of(source);
        for (char16_t &c : u)
            if (c == 0) c = 0x20;
        source = fuzz::bytes_of(u + u'\0');
    } else {
        source = fuzz::without_nul(source) + '\0';
    }
    fuzz::Guarded target(limit);
    uint32_t length = limit;
    FUZZ_CHECK(StringFromCharsetToDirectionEscapedString(id, target.data(), source.data(), &length) == 1);
    FUZZ_CHECK(target.intact());
    FUZZ_CHECK(length <= limit);
    if (length == limit && !units) {
        std::string copy(limit, '\0');
        std::memcpy(copy.data(), source.data(), std::min<size_t>(limit, strlen(source.data())));
        if (target.bytes(limit) == copy) return;  // the fallback copy
    }
    if (length < limit || !units) {
        FUZZ_CHECK(length >= 1);
        if (!units) {
            std::string out = target.bytes(length);
            FUZZ_CHECK(out.back() == '\0');
        }
    }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
    fuzz::Reader in(data, size);
    if (in.byte() % 2)
        utf8_model(in);
    else
        any_charset(in);
    return 0;
}
