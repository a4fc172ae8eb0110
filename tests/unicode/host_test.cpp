// StringListFromUTF8toUTF16 under a host allocator that is watched: the size
// asked for must hold the whole output, and a null block must fail cleanly.
#include <gtest/gtest.h>

#include <cstdlib>
#include <cstring>
#include <string>

#include "textconv.h"

namespace {
bool failNext = false;
uint32_t lastSize = 0;
int liveBlocks = 0;
constexpr size_t kGuard = 16;
}  // namespace

extern "C" {
// Each block carries a guard area right after the size asked for.
void *HostMalloc(uint32_t size, uint32_t flags) {
    EXPECT_EQ(flags, 1u);
    lastSize = size;
    if (failNext) return nullptr;
    auto *p = static_cast<unsigned char *>(std::malloc(size + kGuard + sizeof(uint32_t)));
    std::memcpy(p, &size, sizeof size);
    std::memset(p + sizeof size + size, 0xA5, kGuard);
    ++liveBlocks;
    return p + sizeof size;
}
void HostFree(void *block) {
    auto *p = static_cast<unsigned char *>(block) - sizeof(uint32_t);
    uint32_t size;
    std::memcpy(&size, p, sizeof size);
    for (size_t i = 0; i < kGuard; ++i)
        EXPECT_EQ(p[sizeof size + size + i], 0xA5) << "written past the block";
    --liveBlocks;
    std::free(p);
}
int Mem_alloc(uint32_t, uint32_t, void **) { return 1; }
void Mem_free(uint32_t, void *) {}
int UIYesNoDisplay(uint32_t, uint32_t, uint32_t, const char *, const char *) { return 1; }
int32_t GetiStringID(const char *, const StringIDEntry *table) {
    while (table->name) ++table;
    return table->id;
}
void *memmove_soc(void *d, const void *s, uint32_t n) { return std::memmove(d, s, n); }
}

// A null block fails and changes nothing; a block holds the worst cases (all
// stray bytes, a last string without its NUL, single-byte strings) and is
// released when the conversion fails.
TEST(StringListFromUTF8toUTF16, HostBlocks) {
    using namespace std::string_literals;
    for (std::string in : {"ab\0c\0"s, ""s}) {
        failNext = true;
        char *list = in.data();
        uint32_t len = static_cast<uint32_t>(in.size());
        EXPECT_EQ(StringListFromUTF8toUTF16(&list, &len), 0);
        EXPECT_TRUE(list == in.data() && len == in.size());
    }
    failNext = false;
    for (std::string in :
         {"\x80\x80\x80"s, "abc"s, "a\0b\0c"s, "a\0b\0c\0"s, "\xF0\x9F\x98\x80"s, "\xC3\xA9\xE3"s}) {
        char *list = in.data();
        uint32_t len = static_cast<uint32_t>(in.size());
        const int ok = StringListFromUTF8toUTF16(&list, &len);
        EXPECT_EQ(ok, in.back() != '\xE3');
        if (!ok) continue;
        EXPECT_LE(len, lastSize);
        EXPECT_EQ(reinterpret_cast<const uint16_t *>(list)[len / 2 - 1], 0) << "last terminator missing";
        HostFree(list);
    }
    EXPECT_EQ(liveBlocks, 0);
}
