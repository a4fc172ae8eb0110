// The Japanese functions: Shift-JIS and JIS codes must round-trip, the string
// transcoders must stay within the room their contracts give and terminate
// their output, and EUC-JP characters must come back as the units they were
// made from.
#include "fuzz_support.h"

namespace {

void sjis_jis(fuzz::Reader &in) {
    // One Shift-JIS character from two arbitrary bytes, then back.
    char sjis[3] = {static_cast<char>(in.byte()), static_cast<char>(in.byte()), 0};
    uint8_t kind = 0xEE, consumed = 0xEE;
    JisCode jis{{0xEE, 0xEE}};
    if (FromSJisToJis(sjis, &kind, &jis, &consumed)) {
        FUZZ_CHECK((kind == MB_KIND_SINGLE || kind == MB_KIND_JISX0208) && consumed == kind);
        char again[2] = {0, 0};
        uint8_t length = 0;
        FUZZ_CHECK(FromJisToSJis(kind, &jis, again, &length) == 1);
        FUZZ_CHECK(length == consumed && std::memcmp(again, sjis, length) == 0);
    } else {
        FUZZ_CHECK(kind == 0xEE && consumed == 0xEE && jis.byte[0] == 0xEE && jis.byte[1] == 0xEE);
    }

    // Any JIS code that encodes must decode to itself.
    uint32_t anyKind = in.byte() % 8;
    JisCode code{{in.byte(), in.byte()}};
    char out[3] = {'\x55', '\x55', '\x55'};
    uint8_t length = 0xEE;
    if (FromJisToSJis(anyKind, &code, out, &length)) {
        FUZZ_CHECK((anyKind == MB_KIND_SINGLE || anyKind == MB_KIND_JISX0208) && length == anyKind &&
                   out[2] == '\x55');
        out[length] = 0;
        uint8_t k = 0, c = 0;
        JisCode back{};
        FUZZ_CHECK(FromSJisToJis(out, &k, &back, &c) == 1);
        FUZZ_CHECK(k == anyKind && c == length && back.byte[0] == code.byte[0]);
        if (k == MB_KIND_JISX0208) FUZZ_CHECK(back.byte[1] == code.byte[1]);
    } else {
        FUZZ_CHECK(length == 0xEE && out[0] == '\x55');
    }
}

// Shift-JIS text made of valid characters only, from the fuzzer's bytes.
std::string valid_sjis(fuzz::Reader &in, size_t maxCharacters) {
    std::string s;
    for (size_t i = 0; i < maxCharacters && !in.empty(); ++i) {
        uint8_t pick = in.byte();
        JisCode code{};
        uint32_t kind = MB_KIND_JISX0208;
        if (pick < 64) {
            kind = MB_KIND_SINGLE;
            code.byte[0] = pick < 32 ? static_cast<uint8_t>(0x20 + in.byte() % 0x5F)
                                     : static_cast<uint8_t>(0xA1 + in.byte() % 63);
        } else {
            code.byte[0] = static_cast<uint8_t>(1 + in.byte() % 94);
            code.byte[1] = static_cast<uint8_t>(1 + in.byte() % 94);
        }
        char bytes[2];
        uint8_t length = 0;
        if (FromJisToSJis(kind, &code, bytes, &length)) s.append(bytes, length);
    }
    return s;
}

void sjis_euc_strings(fuzz::Reader &in) {
    bool valid = in.byte() & 1;
    std::string sjis = valid ? valid_sjis(in, 120) : fuzz::without_nul(in.bytes(240));
    uint32_t room = 1 + fuzz::pick_room(in, 2 * sjis.size());
    fuzz::Guarded euc(room);
    uint32_t length = room;
    int ok = StringFromSJISToEUCJP(sjis.c_str(), euc.data(), &length);
    FUZZ_CHECK(euc.intact() && length >= 1 && length <= room);
    std::string eucText = euc.bytes(length);
    FUZZ_CHECK(eucText.back() == '\0' && eucText.find('\0') == length - 1);
    if (valid) FUZZ_CHECK(ok == 1);
    bool whole = ok && room >= 2 * sjis.size() + 1;

    // Back: the length counts the bytes before the terminator.
    int32_t before = static_cast<int32_t>(fuzz::pick_room(in, 2 * eucText.size()));
    if (whole && (in.byte() & 1)) before = static_cast<int32_t>(sjis.size());
    fuzz::Guarded back(static_cast<size_t>(before) + 1);
    int32_t backLength = before;
    int backOk = StringFromEUCJPToSJIS(eucText.c_str(), back.data(), &backLength);
    FUZZ_CHECK(back.intact() && backLength >= 1 && backLength <= before + 1);
    std::string sjisAgain = back.bytes(backLength);
    FUZZ_CHECK(sjisAgain.back() == '\0');
    // Every Shift-JIS character maps into EUC-JP and back, unless the EUC-JP
    // converter lacks a cell (then a space, reported).
    if (whole && backOk && before >= static_cast<int32_t>(sjis.size())) {
        // The same characters; a row-13 duplicate of a JIS X 0208 character
        // (NEC 0x879A is U+2235, like 0x81E6) may come back as the standard
        // code, so compare what Windows code page 932 reads in both.
        std::string again(back.data());
        std::optional<std::string> want = fuzz::iconv_convert("UTF-16LE", "CP932", sjis);
        std::optional<std::string> got = fuzz::iconv_convert("UTF-16LE", "CP932", again);
        if (want && got)
            FUZZ_CHECK(*want == *got);
        else
            FUZZ_CHECK(again == sjis);
    }
}

void utf8_transcoders(fuzz::Reader &in) {
    std::string source = fuzz::without_nul(in.bytes(240));
    size_t n = source.size();
    fuzz::Guarded fromEuc(3 * n / 2 + 1);  // the contract's worst case
    uint32_t length = 0xDEADBEEF;
    int ok = StringFromEUCJPToUTF8(source.c_str(), fromEuc.data(), &length);
    FUZZ_CHECK(fromEuc.intact());
    if (ok) {
        FUZZ_CHECK(length >= 1 && length <= fromEuc.room());
        std::string out = fromEuc.bytes(length);
        FUZZ_CHECK(out.back() == '\0' && out.find('\0') == length - 1);
        FUZZ_CHECK(fuzz::iconv_convert("UTF-16LE", "UTF-8", out).has_value());
    } else {
        FUZZ_CHECK(length == 0xDEADBEEF);
    }

    fuzz::Guarded fromSjis(3 * n + 1);
    length = 0xDEADBEEF;
    ok = StringFromSJISToUTF8(source.c_str(), fromSjis.data(), &length);
    FUZZ_CHECK(fromSjis.intact() && length >= 1 && length <= fromSjis.room());
    if (ok) {
        std::string out = fromSjis.bytes(length);
        FUZZ_CHECK(out.back() == '\0' && out.find('\0') == length - 1);
        FUZZ_CHECK(fuzz::iconv_convert("UTF-16LE", "UTF-8", out).has_value());
    }

    char *converted = nullptr;
    if (StringToCurrentEncoding(source.c_str(), &converted)) {
        FUZZ_CHECK(converted != nullptr && converted != source.c_str());
        Mem_free(1, converted);
    } else {
        FUZZ_CHECK(converted == source.c_str());
    }
}

void characters(fuzz::Reader &in) {
    // EUC-JP bytes one character at a time: never past the NUL.
    std::string euc = fuzz::without_nul(in.bytes(3)) + std::string(4, '\0');
    const char *cursor = euc.data();
    uint16_t unit = 0xAAAA;
    if (FromEUCJPToUnicode(&cursor, &unit)) {
        size_t advance = cursor - euc.data();
        FUZZ_CHECK(advance >= 1 && advance <= 3);
        // The terminator is a character of its own (unit 0), never part of one.
        if (euc[0] == 0)
            FUZZ_CHECK(advance == 1 && unit == 0);
        else
            FUZZ_CHECK(euc.substr(0, advance).find('\0') == std::string::npos);
    } else {
        FUZZ_CHECK(cursor == euc.data());
    }
    fuzz::Guarded utf8(3);
    uint8_t count = 0xEE;
    uint32_t taken = FromEUCJPtoUTF8(euc.data(), utf8.data(), &count);
    FUZZ_CHECK(utf8.intact() && taken <= 3);
    if (taken) {
        FUZZ_CHECK(count >= 1 && count <= 3);
        FUZZ_CHECK(euc.substr(0, taken).find('\0') == std::string::npos || (euc[0] == 0 && taken == 1));
    } else {
        FUZZ_CHECK(count == 0xEE && utf8.untouched_from(0));
    }

    // A unit through EUC-JP and back is the same unit.
    uint16_t u = in.u16();
    fuzz::Guarded out(3);
    char *at = out.data();
    if (FromUnicodeToEUCJP(u, &at)) {
        size_t n = at - out.data();
        FUZZ_CHECK(out.intact() && n >= 1 && n <= 3);
        std::string bytes = out.bytes(n) + std::string(4, '\0');
        const char *read = bytes.data();
        uint16_t back = 0;
        // glibc's EUC-JP writes U+00A5 and U+203E one way, as the ASCII
        // bytes 0x5C and 0x7E (JIS-Roman); those come back as ASCII.
        bool asciiFallback = n == 1 && u >= 0x80;
        if (u != 0 && !asciiFallback) {
            FUZZ_CHECK(FromEUCJPToUnicode(&read, &back) == 1);
            FUZZ_CHECK(back == u && read == bytes.data() + n);
        }
    } else {
        FUZZ_CHECK(at == out.data() && out.untouched_from(0));
    }

    // A unit through a JIS code or Shift-JIS and back.
    uint32_t request = 1 + in.byte() % 5;
    uint8_t kind = 0xEE, length = 0xEE;
    uint8_t code[2] = {0xEE, 0xEE};
    if (FromUnicodeToMultiByte(u, request, &kind, code, &length)) {
        FUZZ_CHECK(length == 1 || length == 2);
        if (kind != MB_KIND_ASCII && !(length == 1 && code[0] < 0x80 && u >= 0x80)) {
            uint8_t bytes[3] = {code[0], length == 2 ? code[1] : uint8_t{0}, 0};
            uint16_t back = 0xAAAA;
            FUZZ_CHECK(FromMultiByteToUnicode(kind, bytes, &back) == 1 && back == u);
        }
    } else {
        FUZZ_CHECK(kind == 0xEE && length == 0xEE && code[0] == 0xEE && code[1] == 0xEE);
    }

    uint8_t given[2] = {in.byte(), in.byte()};
    uint16_t jisUnit = 0xAAAA;
    if (!ConvertFromJISToUnicode(given, &jisUnit, in.byte() % 4)) FUZZ_CHECK(jisUnit == 0xFFFF);
    FUZZ_CHECK(jisUnit != 0xAAAA);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
    fuzz::Reader in(data, size);
    switch (in.byte() % 4) {
        case 0:
            while (!in.empty()) sjis_jis(in);
            break;
        case 1:
            sjis_euc_strings(in);
            break;
        case 2:
            utf8_transcoders(in);
            break;
        default:
            while (!in.empty()) characters(in);
            break;
    }
    return 0;
}
