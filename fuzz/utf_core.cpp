// The UTF-8/UTF-16 core on arbitrary bytes and units with varied capacities.
// A plain model of the decoding rules is the oracle for the counted
// workhorses; the string, character and list wrappers must agree with them,
// never write past the room, and round-trip valid text exactly.
#include "fuzz_support.h"

namespace {

// Decoding rules: a lead byte announces 0..5 trailing bytes (0x80..0xBF count
// as one-byte sequences); a sequence broken by a byte that is not 10xxxxxx,
// or whose value is overlong, a surrogate or beyond 31 bits, gives U+FFFD and
// decoding resumes right after the lead byte; values past U+10FFFF give one
// U+FFFD for the whole sequence. Returns the units of the whole input, or
// nullopt when an unbroken sequence runs past the end.
std::optional<std::u16string> model_decode(const std::string &in) {
    static const uint32_t kMin[6] = {0, 0x80, 0x800, 0x10000, 0x200000, 0x4000000};
    static const uint32_t kMax[6] = {0x7F, 0x7FF, 0xFFFF, 0x1FFFFF, 0x3FFFFFF, 0x7FFFFFFF};
    std::u16string out;
    size_t p = 0;
    while (p < in.size()) {
        uint8_t lead = in[p];
        size_t t = lead < 0xC0   ? 0
                   : lead < 0xE0 ? 1
                   : lead < 0xF0 ? 2
                   : lead < 0xF8 ? 3
                   : lead < 0xFC ? 4
                                 : 5;
        bool broken = false;
        for (size_t k = 1; k <= t && p + k < in.size(); ++k)
            if ((static_cast<uint8_t>(in[p + k]) & 0xC0) != 0x80) broken = true;
        if (!broken && p + t >= in.size()) return std::nullopt;
        uint32_t v = lead & (0x7F >> t);
        if (t == 0 && lead >= 0x80) v = 0x80000000;  // a stray trailing byte
        for (size_t k = 1; k <= t && !broken; ++k) v = v << 6 | (in[p + k] & 0x3F);
        if (broken || v < kMin[t] || v > kMax[t] || (v >= 0xD800 && v <= 0xDFFF)) {
            out += u'\xFFFD';
            p += 1;
            continue;
        }
        p += t + 1;
        if (v <= 0xFFFF) {
            out += static_cast<char16_t>(v);
        } else if (v <= 0x10FFFF) {
            out += static_cast<char16_t>(0xD800 + ((v - 0x10000) >> 10));
            out += static_cast<char16_t>(0xDC00 + ((v - 0x10000) & 0x3FF));
        } else {
            out += u'\xFFFD';
        }
    }
    return out;
}

// Encoding rules: pairs become 4 bytes, every lone surrogate its own 3 bytes.
std::string model_encode(const std::u16string &in) {
    std::string out;
    for (size_t i = 0; i < in.size(); ++i) {
        uint32_t u = in[i];
        if (u >= 0xD800 && u <= 0xDBFF && i + 1 < in.size() && in[i + 1] >= 0xDC00 && in[i + 1] <= 0xDFFF)
            u = ((u - 0xD800) << 10) + (in[++i] - 0xDC00) + 0x10000;
        if (u < 0x80) {
            out += static_cast<char>(u);
        } else if (u < 0x800) {
            out += static_cast<char>(0xC0 | u >> 6);
            out += static_cast<char>(0x80 | (u & 0x3F));
        } else if (u < 0x10000) {
            out += static_cast<char>(0xE0 | u >> 12);
            out += static_cast<char>(0x80 | (u >> 6 & 0x3F));
            out += static_cast<char>(0x80 | (u & 0x3F));
        } else {
            out += static_cast<char>(0xF0 | u >> 18);
            out += static_cast<char>(0x80 | (u >> 12 & 0x3F));
            out += static_cast<char>(0x80 | (u >> 6 & 0x3F));
            out += static_cast<char>(0x80 | (u & 0x3F));
        }
    }
    return out;
}

// Bytes of the unit sequence's longest prefix that fits in room bytes, when
// units are written whole and a pair only as a pair.
size_t fitting_prefix_units(const std::u16string &units, uint32_t room) {
    size_t n = 0;
    while (n < units.size()) {
        size_t step = units[n] >= 0xD800 && units[n] <= 0xDBFF && n + 1 < units.size() ? 2 : 1;
        if ((n + step) * 2 > room) break;
        n += step;
    }
    return n;
}

void counted_decoder(fuzz::Reader &in) {
    std::string source = in.bytes(512);
    std::optional<std::u16string> expected = model_decode(source);
    uint32_t room = fuzz::pick_room(in, expected ? expected->size() * 2 : source.size() * 2);
    fuzz::Guarded target(room);
    uint32_t written = 0xDEADBEEF;
    uint32_t r = ConvertUTF8toUTF16(source.data(), static_cast<uint32_t>(source.size()), target.units(), room,
                                    &written);
    FUZZ_CHECK(target.intact());
    if (!expected) {
        // Incomplete input: reported unless the target filled up first.
        FUZZ_CHECK(r == TEXTCONV_UTF_SOURCE_INCOMPLETE || r == TEXTCONV_UTF_TARGET_FULL);
        FUZZ_CHECK(written == 0xDEADBEEF);
        return;
    }
    if (expected->size() * 2 <= room) {
        FUZZ_CHECK(r == TEXTCONV_UTF_DONE);
        FUZZ_CHECK(written == expected->size() * 2);
        FUZZ_CHECK(target.bytes(written) == fuzz::bytes_of(*expected));
    } else {
        FUZZ_CHECK(r == TEXTCONV_UTF_TARGET_FULL);
        FUZZ_CHECK(written == 0xDEADBEEF);
        // What fitted is already there and right.
        size_t n = fitting_prefix_units(*expected, room);
        FUZZ_CHECK(target.bytes(n * 2) == fuzz::bytes_of(expected->substr(0, n)));
    }
}

void counted_encoder(fuzz::Reader &in) {
    std::u16string source = fuzz::units_of(in.bytes(512));
    std::string expected = model_encode(source);
    uint32_t room = fuzz::pick_room(in, expected.size());
    fuzz::Guarded target(room);
    uint32_t written = 0xDEADBEEF;
    uint32_t r = ConvertUTF16toUTF8(reinterpret_cast<const uint16_t *>(source.data()),
                                    static_cast<uint32_t>(source.size() * 2), target.data(), room, &written);
    FUZZ_CHECK(target.intact());
    if (expected.size() <= room) {
        FUZZ_CHECK(r == TEXTCONV_UTF_DONE);
        FUZZ_CHECK(written == expected.size());
        FUZZ_CHECK(target.bytes(written) == expected);
    } else {
        FUZZ_CHECK(r == TEXTCONV_UTF_TARGET_FULL);
        FUZZ_CHECK(written == 0xDEADBEEF);
    }
}

void string_wrappers(fuzz::Reader &in) {
    // Arbitrary bytes as a C string, to UTF-16 with a varied room.
    std::string source = fuzz::without_nul(in.bytes(512));
    // A sequence cut short by the terminator is incomplete, never completed
    // by the NUL.
    std::optional<std::u16string> expected = model_decode(source);
    if (expected) *expected += u'\0';
    uint32_t room = fuzz::pick_room(in, expected ? expected->size() * 2 : 0);
    fuzz::Guarded units(room);
    uint32_t length = room;
    int ok = StringFromUTF8ToUnicode(source.c_str(), units.units(), &length);
    FUZZ_CHECK(units.intact());
    FUZZ_CHECK(ok == 0 || ok == 1);
    if (ok) {
        FUZZ_CHECK(expected && expected->size() * 2 == length && length <= room);
        FUZZ_CHECK(units.bytes(length) == fuzz::bytes_of(*expected));
        FUZZ_CHECK(length >= 2);
    } else {
        FUZZ_CHECK(length == 0);
        FUZZ_CHECK(!expected || expected->size() * 2 > room);
    }

    // Arbitrary units to UTF-8, then back when they came from valid text.
    std::u16string wide = fuzz::units_of(in.bytes(512));
    for (char16_t &u : wide)
        if (u == 0) u = 1;
    std::string encoded = model_encode(wide) + '\0';
    wide += u'\0';
    room = fuzz::pick_room(in, encoded.size());
    fuzz::Guarded narrow(room);
    length = room;
    ok = StringFromUnicodeToUTF8(reinterpret_cast<const uint16_t *>(wide.data()), narrow.data(), &length);
    FUZZ_CHECK(narrow.intact());
    if (encoded.size() <= room) {
        FUZZ_CHECK(ok == 1 && length == encoded.size());
        FUZZ_CHECK(narrow.bytes(length) == encoded);
    } else {
        FUZZ_CHECK(ok == 0 && length == 0);
    }
}

void round_trip(fuzz::Reader &in) {
    // Valid UTF-8 -> UTF-16 -> UTF-8 gives the text back, with exact rooms.
    std::string text = fuzz::valid_utf8(in, 200);
    std::optional<std::string> oracle = fuzz::iconv_convert("UTF-16LE", "UTF-8", text);
    FUZZ_CHECK(oracle.has_value());
    std::optional<std::u16string> units = fuzz::units_of(*oracle);
    uint32_t room = static_cast<uint32_t>(units->size() * 2 + 2);
    fuzz::Guarded wide(room);
    uint32_t length = room;
    FUZZ_CHECK(StringFromUTF8ToUnicode(text.c_str(), wide.units(), &length) == 1);
    FUZZ_CHECK(wide.intact() && length == room);
    FUZZ_CHECK(wide.bytes(length) == fuzz::bytes_of(*units + u'\0'));
    fuzz::Guarded narrow(text.size() + 1);
    length = static_cast<uint32_t>(text.size() + 1);
    FUZZ_CHECK(StringFromUnicodeToUTF8(wide.units(), narrow.data(), &length) == 1);
    FUZZ_CHECK(narrow.intact() && length == text.size() + 1);
    FUZZ_CHECK(std::string(narrow.data()) == text);
}

void single_characters(fuzz::Reader &in) {
    // One character from up to 6 arbitrary bytes followed by a NUL.
    std::string bytes = in.bytes(6) + std::string(7, '\0');
    const char *cursor = bytes.data();
    fuzz::Guarded target(4);
    uint32_t written = 0xDEADBEEF;
    int ok = FromUTF8ToUnicode(&cursor, target.units(), &written);
    FUZZ_CHECK(target.intact());
    uint8_t lead = bytes[0];
    size_t n = lead < 0xC0 ? 1 : lead < 0xE0 ? 2 : lead < 0xF0 ? 3 : lead < 0xF8 ? 4 : lead < 0xFC ? 5 : 6;
    size_t advance = cursor - bytes.data();
    FUZZ_CHECK(advance >= 1);
    FUZZ_CHECK(advance <= n);
    // Never past a NUL inside the sequence.
    FUZZ_CHECK(bytes.substr(1, advance > 0 ? advance - 1 : 0).find('\0') == std::string::npos);
    if (ok) {
        FUZZ_CHECK(written == 2 || written == 4);
        if (advance == n) {
            std::optional<std::u16string> expected = model_decode(bytes.substr(0, n));
            FUZZ_CHECK(expected && expected->size() * 2 == written);
            FUZZ_CHECK(target.bytes(written) == fuzz::bytes_of(*expected));
        } else {
            // A broken sequence: one U+FFFD for the lead byte alone.
            FUZZ_CHECK(advance == 1 && written == 2 && target.units()[0] == 0xFFFD);
        }
    } else {
        FUZZ_CHECK(written == 0xDEADBEEF);
        bool stoppedOnNul = advance < n && bytes[advance] == 0;
        std::optional<std::u16string> expected = model_decode(bytes.substr(0, n));
        FUZZ_CHECK(stoppedOnNul || (advance == n && expected && expected->size() > 2));
    }

    uint32_t unit = in.u32();
    fuzz::Guarded utf8(3);
    char *out = utf8.data();
    FUZZ_CHECK(FromUnicodeToUTF8(unit, &out) == 1);
    FUZZ_CHECK(utf8.intact());
    std::string expect = model_encode(std::u16string(1, static_cast<char16_t>(unit & 0xFFFF)));
    FUZZ_CHECK(utf8.bytes(out - utf8.data()) == expect);
}

void lists(fuzz::Reader &in) {
    // A list of strings back to back; the last may lack its NUL.
    std::string list = in.bytes(255);
    uint32_t length = static_cast<uint32_t>(list.size());
    // The caller's block comes from the host, like every list it hands over.
    char *block = static_cast<char *>(HostMalloc(length ? length : 1, 1));
    std::memcpy(block, list.data(), list.size());
    char *handle = block;
    int ok = StringListFromUTF8toUTF16(&handle, &length);
    FUZZ_CHECK(std::memcmp(block, list.data(), list.size()) == 0);  // input untouched
    std::u16string expected;
    bool complete = true;
    for (size_t i = 0; i < list.size();) {
        size_t end = list.find('\0', i);
        if (end == std::string::npos) end = list.size();
        std::optional<std::u16string> s = model_decode(list.substr(i, end - i));
        if (!s) {
            complete = false;
            break;
        }
        expected += *s + u'\0';
        i = end + 1;
    }
    if (ok) {
        FUZZ_CHECK(complete && handle != block);
        FUZZ_CHECK(length == expected.size() * 2);
        FUZZ_CHECK(std::string(handle, length) == fuzz::bytes_of(expected));
        HostFree(handle);
    } else {
        FUZZ_CHECK(handle == block && length == list.size());
        // Decoding never grows a string past two bytes per byte, so only an
        // incomplete sequence may fail.
        FUZZ_CHECK(!complete);
    }
    HostFree(block);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
    fuzz::Reader in(data, size);
    switch (in.byte() % 7) {
        case 0:
            counted_decoder(in);
            break;
        case 1:
            counted_encoder(in);
            break;
        case 2:
            string_wrappers(in);
            break;
        case 3:
            round_trip(in);
            break;
        case 4:
            single_characters(in);
            break;
        case 5:
            lists(in);
            break;
        default:
            counted_decoder(in);
            counted_encoder(in);
            break;
    }
    return 0;
}
