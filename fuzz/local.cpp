// The local-encoding layer under the local encoding the run chooses: set
// TEXTCONV_FUZZ_LOCALE (with LOCPATH pointing at generated locales) to run it
// as a Japanese, Russian or Latin-1 device; the default is the process's own.
// Strings and lists must stay within the sizes the contracts give the
// caller, come out terminated, and agree with glibc iconv for convertible text.
#include <algorithm>

#include "fuzz_support.h"

namespace {

CharsetId local = CHARSET_NONE;

const char *local_name() { return local == CHARSET_UTF16 ? "UTF-16LE" : charsetConversion[local].iconvName; }
bool byte_local() { return local != CHARSET_UTF16 && local != CHARSET_UTF16LE && local != CHARSET_UTF16BE; }

size_t decoded_units(const std::string &utf8) {
    std::vector<uint16_t> scratch(utf8.size() + 1);
    uint32_t written = 0;
    if (ConvertUTF8toUTF16(utf8.data(), static_cast<uint32_t>(utf8.size()), scratch.data(),
                           static_cast<uint32_t>(scratch.size() * 2), &written) != TEXTCONV_UTF_DONE)
        return utf8.size();
    return written / 2;
}

void utf8_to_local(fuzz::Reader &in) {
    bool valid = in.byte() & 1;
    std::string source = valid ? fuzz::valid_utf8(in, 120) : fuzz::without_nul(in.bytes(300));
    // The contract's worst case: the text as it is on a UTF-8 device, else 4
    // bytes a unit.
    size_t room = (local == CHARSET_UTF8 ? source.size() : 4 * decoded_units(source)) + 1;
    fuzz::Guarded target(room);
    uint32_t length = 0xDEADBEEF;
    int ok = StringFromUTF8ToLocal(source.c_str(), target.data(), &length);
    FUZZ_CHECK(target.intact());
    if (length == 0xDEADBEEF) {
        FUZZ_CHECK(ok == 0 && !valid);
        return;
    }
    FUZZ_CHECK(length >= 1 && length <= room);
    std::string out = target.bytes(length);
    if (byte_local()) FUZZ_CHECK(out.back() == '\0' && out.find('\0') == length - 1);
    if (!valid || !byte_local()) return;
    std::optional<std::string> expected = fuzz::iconv_convert(local_name(), "UTF-8", source);
    if (expected) FUZZ_CHECK(ok == 1 && out == *expected + '\0');
}

void local_to_utf8(fuzz::Reader &in) {
    std::string source = fuzz::without_nul(in.bytes(300));
    size_t n = source.size();
    // The fast paths take no capacity: the caller gives their worst case.
    size_t room;
    switch (local) {
        case CHARSET_LATIN1:
            room = 2 * n + 1;
            break;
        case CHARSET_EUCJP:
            room = 3 * n / 2 + 1;
            break;
        case CHARSET_UTF8:
            room = n + 1;
            break;
        case CHARSET_KOI8R:
            room = 3 * n + 1;
            break;
        default:
            room = fuzz::pick_room(in, 3 * n + 1);
            break;
    }
    fuzz::Guarded target(room);
    uint32_t length = static_cast<uint32_t>(room);
    int ok = StringFromLocalToUTF8(source.c_str(), target.data(), &length);
    FUZZ_CHECK(target.intact());
    if (!ok) {
        FUZZ_CHECK(local == CHARSET_EUCJP);
        return;
    }
    FUZZ_CHECK(length <= room);
    if (length == 0) {
        FUZZ_CHECK(room == 0 || target.data()[0] == '\0');
        return;
    }
    std::string out = target.bytes(length);
    FUZZ_CHECK(out.back() == '\0' && out.find('\0') == length - 1);
    if (local == CHARSET_UTF8) return;  // passed through as it is
    std::optional<std::string> expected = fuzz::iconv_convert("UTF-8", local_name(), source);
    if (expected && length > 1) FUZZ_CHECK(out == *expected + '\0');
}

void unicode_local(fuzz::Reader &in) {
    std::u16string text = fuzz::units_of(in.bytes(300));
    for (char16_t &u : text)
        if (u == 0) u = 0x41;
    std::u16string source = text + u'\0';
    uint32_t room = fuzz::pick_room(in, 4 * source.size());
    fuzz::Guarded target(room);
    uint32_t length = room;
    if (StringFromUnicodeToLocal(reinterpret_cast<const uint16_t *>(source.data()), target.data(), &length)) {
        FUZZ_CHECK(length <= room && length >= 1);
        if (byte_local()) FUZZ_CHECK(target.data()[length - 1] == '\0');
    }
    FUZZ_CHECK(target.intact());

    std::string bytes = fuzz::without_nul(in.bytes(300));
    room = fuzz::pick_room(in, 2 * bytes.size() + 2);
    fuzz::Guarded units(room);
    length = room;
    if (StringFromLocalToUnicode(bytes.c_str(), units.units(), &length)) {
        FUZZ_CHECK(length <= room && length >= 2 && length % 2 == 0);
        std::u16string out = fuzz::units_of(units.bytes(length));
        FUZZ_CHECK(out.back() == 0 && out.find(u'\0') == out.size() - 1);
    }
    FUZZ_CHECK(units.intact());

    // One unit out and back.
    uint16_t unit = in.u16();
    fuzz::Guarded one(4);
    char *cursor = one.data();
    if (FromUnicodeToLocal(unit, &cursor)) {
        size_t n = cursor - one.data();
        FUZZ_CHECK(one.intact() && n <= 4);
        std::string bytesOut = one.bytes(n) + std::string(5, '\0');
        const char *read = bytesOut.data();
        uint16_t back[2] = {0, 0};
        uint32_t count = 0;
        fuzz::trace("unit", &unit, 2);
        fuzz::trace("local", one.bytes(n));
        // Characters the local charset holds both ways come back (glibc
        // writes a few one way only, e.g. "~" as Shift-JIS 0x7E = U+203E).
        std::u16string one16(1, static_cast<char16_t>(unit));
        std::optional<std::string> local16 =
            fuzz::iconv_convert(local_name(), "UTF-16LE", fuzz::bytes_of(one16));
        bool bothWays =
            local16 && fuzz::iconv_convert("UTF-16LE", local_name(), *local16) == fuzz::bytes_of(one16);
        if (n > 0 && unit != 0 && unit != 0xFEFF && byte_local() && bothWays)
            FUZZ_CHECK(FromLocalToUnicode(&read, back, &count) == 1 && count == 2 &&
                       read == bytesOut.data() + n && (back[0] == unit || back[0] == 0xFFFD));
    } else {
        FUZZ_CHECK(cursor == one.data() && one.untouched_from(0));
    }
}

void lists_and_host_strings(fuzz::Reader &in) {
    // A list of UTF-16 strings in a host block; the last one may lack its 0.
    std::u16string list = fuzz::units_of(in.bytes(300));
    uint32_t length = static_cast<uint32_t>(list.size() * 2);
    size_t strings = 0;
    for (size_t i = 0; i < list.size(); ++i)
        if (list[i] == 0 || i + 1 == list.size()) ++strings;
    auto *block = static_cast<uint16_t *>(HostMalloc(length ? length : 2, 1));
    std::memcpy(block, list.data(), length);
    uint16_t *handle = block;
    StringListFromUnicodeToLocal(&handle, &length);
    if (handle != block) {
        // Each string terminated, one closing NUL after them.
        const char *out = reinterpret_cast<const char *>(handle);
        if (byte_local()) {
            FUZZ_CHECK(length >= 1 && out[length - 1] == '\0');
            size_t nuls = 0;
            for (uint32_t i = 0; i < length; ++i) nuls += out[i] == '\0';
            FUZZ_CHECK(nuls == strings + 1);
        }
        HostFree(handle);
    } else {
        HostFree(block);
    }

    // Windows Unicode from the wire: no capacity, 4 bytes a unit at most.
    std::string wire = in.bytes(300);
    fuzz::Guarded target(2 * wire.size() + 1);
    int32_t wireLength = static_cast<int32_t>(wire.size());
    host_stringFromWindowsUnicode(wire.data(), target.data(), &wireLength);
    FUZZ_CHECK(target.intact());
    FUZZ_CHECK(wireLength >= 1 && static_cast<size_t>(wireLength) <= target.room());
    FUZZ_CHECK(target.data()[wireLength - 1] == '\0');

    std::string text = fuzz::without_nul(in.bytes(300));
    fuzz::Guarded units(2 * text.size() + 2);
    uint32_t unitLength = 0xDEADBEEF;
    host_stringToWindowsUnicode(text.c_str(), units.units(), &unitLength);
    FUZZ_CHECK(units.intact());
    FUZZ_CHECK(unitLength >= 2 && unitLength % 2 == 0 && unitLength <= units.room());
    std::u16string out = fuzz::units_of(units.bytes(unitLength));
    FUZZ_CHECK(out.back() == 0 && out.find(u'\0') == out.size() - 1);
}

}  // namespace

extern "C" int LLVMFuzzerInitialize(int *, char ***) {
    local = fuzz::adopt_fuzz_locale();
    FUZZ_CHECK(local > CHARSET_NONE && local < CHARSET_COUNT);
    std::fprintf(stderr, "local encoding: %d (%s)\n", local, charsetConversion[local].iconvName);
    return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
    fuzz::Reader in(data, size);
    switch (in.byte() % 4) {
        case 0:
            utf8_to_local(in);
            break;
        case 1:
            local_to_utf8(in);
            break;
        case 2:
            unicode_local(in);
            break;
        default:
            lists_and_host_strings(in);
            break;
    }
    return 0;
}
