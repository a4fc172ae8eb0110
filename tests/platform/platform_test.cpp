// The platform the library runs on: the exported records' layout (the device
// is 32-bit ARM, the development machine x86-64), UTF-16 in host order, and
// the iconv converters the registry names. On the cross build these run under
// qemu-user with the target's own C library and gconv modules.
#include <gtest/gtest.h>
#include <iconv.h>

#include <cstddef>
#include <cstring>
#include <string>

#include "test_support.h"
#include "textconv.h"

namespace {

constexpr bool kIs32Bit = sizeof(void *) == 4;

// Bytes of a UTF-16 buffer as they lie in memory.
std::string memory_bytes(const uint16_t *units, size_t count) {
    return std::string(reinterpret_cast<const char *>(units), count * 2);
}

}  // namespace

TEST(PlatformLayout, ExportedRecordsMatchTheTarget) {
#if defined(__arm__)
    static_assert(sizeof(void *) == 4 && sizeof(long) == 4, "armhf is ILP32");
#endif
    // Two 32-bit fields on the device, a pointer padded to 8 bytes on x86-64.
    EXPECT_EQ(sizeof(CharsetConversionEntry), kIs32Bit ? 8u : 16u);
    EXPECT_EQ(offsetof(CharsetConversionEntry, iconvName), kIs32Bit ? 4u : 8u);
    EXPECT_EQ(sizeof(StringIDEntry), kIs32Bit ? 8u : 16u);
    EXPECT_EQ(offsetof(StringIDEntry, id), kIs32Bit ? 4u : 8u);
    EXPECT_EQ(sizeof(JisCode), 2u);
    EXPECT_EQ(sizeof(CharsetId), 4u);
    EXPECT_EQ(sizeof(MS_Sun_extension_table), 94u * 2u);
    // The target is little endian: UTF-16 "host order" means LE everywhere.
    const uint16_t probe = 0x0102;
    EXPECT_EQ(memory_bytes(&probe, 1), std::string("\x02\x01", 2));
}

TEST(PlatformIconv, EveryRegisteredCharsetOpensBothWays) {
    // "UTF16-LE" and "UTF16-BE" are not glibc names: those two rows take the
    // missing-converter path by design and are checked elsewhere.
    for (int id = 1; id < CHARSET_COUNT; ++id) {
        const char *name = charsetConversion[id].iconvName;
        ASSERT_NE(name, nullptr) << id;
        if (id == CHARSET_UTF16LE || id == CHARSET_UTF16BE) continue;
        SCOPED_TRACE(name);
        iconv_t from = iconv_open(name, "UTF-16");
        iconv_t to = iconv_open("UTF-16", name);
        EXPECT_NE(from, reinterpret_cast<iconv_t>(-1));
        EXPECT_NE(to, reinterpret_cast<iconv_t>(-1));
        if (from != reinterpret_cast<iconv_t>(-1)) iconv_close(from);
        if (to != reinterpret_cast<iconv_t>(-1)) iconv_close(to);
    }
}

TEST(PlatformIconv, Utf16IsHostOrderWithAMarkOnOutput) {
    // The registry relies on this: "UTF-16" as target writes a byte-order mark
    // and host-order units; "UTF-16LE" as source reads unmarked LE units.
    iconv_t out = iconv_open("UTF-16", "ISO-8859-1");
    ASSERT_NE(out, reinterpret_cast<iconv_t>(-1));
    char in[] = "A\xE9";
    char buf[16];
    char *ip = in, *op = buf;
    size_t il = 2, ol = sizeof buf;
    ASSERT_NE(iconv(out, &ip, &il, &op, &ol), static_cast<size_t>(-1));
    EXPECT_EQ(std::string(buf, op - buf), std::string("\xFF\xFE"
                                                      "A\0\xE9\0",
                                                      6));
    iconv_close(out);

    iconv_t back = iconv_open("ISO-8859-1", "UTF-16LE");
    ASSERT_NE(back, reinterpret_cast<iconv_t>(-1));
    char units[] = "\xE9\0B\0";
    ip = units, op = buf, il = 4, ol = sizeof buf;
    ASSERT_NE(iconv(back, &ip, &il, &op, &ol), static_cast<size_t>(-1));
    EXPECT_EQ(std::string(buf, op - buf),
              "\xE9"
              "B");
    iconv_close(back);
}

TEST(PlatformLibrary, Utf16OutputIsLittleEndianInMemory) {
    // Through the library's own core and through its iconv engine: the same
    // text must lie in memory as LE units, with no byte-order mark left.
    uint16_t units[8] = {};
    uint32_t length = sizeof units;
    ASSERT_EQ(StringFromUTF8ToUnicode("A\xC3\xA9\xE2\x82\xAC", units, &length), 1);
    ASSERT_EQ(length, 8u);
    EXPECT_EQ(testsupport::hex(memory_bytes(units, 4)),
              testsupport::hex(std::string("A\0\xE9\0\xAC\x20\0\0", 8)));

    uint16_t viaIconv[8] = {};
    const char *source = "A\xE9";
    uint16_t *destination = viaIconv;
    length = sizeof viaIconv;
    ASSERT_EQ(StringFromCharsetToUnicode(CHARSET_LATIN1, &source, &destination, &length), 1);
    ASSERT_EQ(length, 6u);
    EXPECT_EQ(testsupport::hex(memory_bytes(viaIconv, 3)), testsupport::hex(std::string("A\0\xE9\0\0\0", 6)));
}

TEST(PlatformLibrary, WindowsUnicodeRoundTripsAsLittleEndianBytes) {
    // host_stringFromWindowsUnicode reads LE bytes from the wire; the two
    // helpers must agree on the device. Needs the local encoding: take it as
    // it comes (C.UTF-8 or whatever the run sets), with ASCII text only.
    const char wire[] = "h\0i\0\0\0";
    char local[8] = {};
    int32_t inLength = 6;
    host_stringFromWindowsUnicode(wire, local, &inLength);
    EXPECT_STREQ(local, "hi");
    EXPECT_EQ(inLength, 3);

    uint16_t units[4] = {0xAAAA, 0xAAAA, 0xAAAA, 0xAAAA};
    uint32_t outLength = 0;
    host_stringToWindowsUnicode("hi", units, &outLength);
    EXPECT_EQ(outLength, 6u);
    EXPECT_EQ(memory_bytes(units, 3), std::string(wire, 6));
}
