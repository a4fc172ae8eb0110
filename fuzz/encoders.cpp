// The direct UTF-8 encoders: code points of any 32-bit value, KOI8-R bytes
// and Latin-1 strings. Each output must stay within the room the contract
// gives the caller and decode back to its input; glibc iconv is the oracle
// for KOI8-R and Latin-1.
#include "fuzz_support.h"

namespace {

// Decodes one sequence of 1..6 bytes with the original 31-bit rules.
uint32_t decode_long_form(const char *s, size_t n) {
    static const uint8_t kMarkMask[7] = {0, 0x7F, 0x1F, 0x0F, 0x07, 0x03, 0x01};
    uint32_t v = static_cast<uint8_t>(s[0]) & kMarkMask[n];
    for (size_t k = 1; k < n; ++k) v = v << 6 | (static_cast<uint8_t>(s[k]) & 0x3F);
    return v;
}

void code_point(uint32_t value) {
    fuzz::Guarded target(6);
    uint8_t count = 0xEE;
    int ok = FromUCS4toUTF8(value, target.data(), &count);
    FUZZ_CHECK(target.intact());
    if (value >= 0x80000000u) {
        FUZZ_CHECK(ok == 0 && count == 0xEE && target.untouched_from(0));
        return;
    }
    size_t n = value < 0x80        ? 1
               : value < 0x800     ? 2
               : value < 0x10000   ? 3
               : value < 0x200000  ? 4
               : value < 0x4000000 ? 5
                                   : 6;
    FUZZ_CHECK(ok == 1 && count == n && target.untouched_from(n));
    FUZZ_CHECK(decode_long_form(target.data(), n) == value);
    // Shortest form, right tag bits.
    static const uint8_t kMark[7] = {0, 0, 0xC0, 0xE0, 0xF0, 0xF8, 0xFC};
    if (n > 1) FUZZ_CHECK((static_cast<uint8_t>(target.data()[0]) & ~(0xFF >> (n + 1))) == kMark[n]);
    for (size_t k = 1; k < n; ++k) FUZZ_CHECK((static_cast<uint8_t>(target.data()[k]) & 0xC0) == 0x80);
    // Real characters agree with glibc.
    if (value <= 0x10FFFF && (value < 0xD800 || value > 0xDFFF)) {
        uint32_t le = value;
        std::optional<std::string> expected =
            fuzz::iconv_convert("UTF-8", "UTF-32LE", std::string(reinterpret_cast<const char *>(&le), 4));
        FUZZ_CHECK(expected && *expected == target.bytes(n));
    }
}

void koi8r(uint8_t byte) {
    char source[2] = {static_cast<char>(byte), '\x7F'};
    fuzz::Guarded target(3);
    uint8_t count = 0;
    FUZZ_CHECK(FromKOI8RtoUTF8(source, target.data(), &count) == 1);
    FUZZ_CHECK(target.intact() && count >= 1 && count <= 3 && target.untouched_from(count));
    std::optional<std::string> expected = fuzz::iconv_convert("UTF-8", "KOI8-R", std::string(1, source[0]));
    FUZZ_CHECK(expected && *expected == target.bytes(count));
}

void latin1(const std::string &raw) {
    std::string source = fuzz::without_nul(raw);
    size_t room = 2 * source.size() + 1;  // the contract's worst case
    fuzz::Guarded target(room);
    uint32_t length = 0xDEADBEEF;
    FUZZ_CHECK(StringFromLatin1ToUTF8(source.c_str(), target.data(), &length) == 1);
    FUZZ_CHECK(target.intact() && length <= room);
    std::optional<std::string> expected = fuzz::iconv_convert("UTF-8", "ISO-8859-1", source);
    FUZZ_CHECK(expected && length == expected->size() + 1);
    FUZZ_CHECK(target.bytes(length) == *expected + '\0');
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
    fuzz::Reader in(data, size);
    uint8_t op = in.byte();
    if (op % 3 == 0) {
        while (!in.empty()) code_point(in.u32() >> (in.byte() % 32));
    } else if (op % 3 == 1) {
        while (!in.empty()) koi8r(in.byte());
    } else {
        latin1(in.rest());
    }
    return 0;
}
