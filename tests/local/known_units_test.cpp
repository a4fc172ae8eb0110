// The vector kernel for known units against the table it reads: every unit
// it takes is one the table knows, with the table's byte; it stops within a
// block of the first unit outside its domain; nothing past the output changes.
#include "local/known_units.h"

#include <gtest/gtest.h>

#include <random>
#include <string>
#include <vector>

#include "local/unit_table.h"
#include "unicode/utf_internal.h"

namespace {

using textconv::UnitByteTable;

TEST(KnownUnits, KernelTakesExactlyWhatTheTableKnows) {
    const std::string path = textconv::active_path();
    const bool kernelActive = path == "avx2" || path == "neon";
    std::mt19937 rng(5);
    static UnitByteTable table;  // 6 KiB: not on the stack
    const struct {
        CharsetId charset;
        uint16_t page;
    } charsets[] = {{CHARSET_LATIN1, 0x80},
                    {CHARSET_KOI8R, 0x400},
                    {CHARSET_ISO8859_8, 0x580},
                    {CHARSET_ISO8859_6, 0x600},
                    {CHARSET_ISO8859_11, 0xE00}};
    for (const auto &c : charsets) {
        table.claim(CHARSET_NONE);
        table.claim(c.charset);
        auto pick = [&] {  // ASCII, the page, its edges, or elsewhere
            switch (rng() % 8) {
                case 0:
                    return static_cast<uint16_t>(c.page - 1 - rng() % 4);
                case 1:
                    return static_cast<uint16_t>(c.page + 0x80 + rng() % 4);
                case 2:
                    return static_cast<uint16_t>(rng());
                case 3:
                case 4:
                    return static_cast<uint16_t>(1 + rng() % 0x7F);
                default:
                    return static_cast<uint16_t>(c.page + rng() % 0x80);
            }
        };
        for (int round = 0; round < 3000; ++round) {
            // Learn a few units: a byte (ASCII mostly itself), or none.
            for (int k = 0; k < 3; ++k) {
                const uint16_t unit = pick();
                const int byte = rng() % 6 == 0             ? UnitByteTable::kNoByte
                                 : unit < 0x80 && rng() % 8 ? unit
                                                            : static_cast<int>(rng() % 256);
                table.record(unit, byte);
            }
            std::vector<uint16_t> units(rng() % 100);
            for (uint16_t &u : units) u = pick();
            std::vector<uint8_t> out(units.size() + 16, 0xA5);
            const size_t taken = textconv::copy_known_units(units.data(), units.size(), out.data(),
                                                            table.flat_table(), table.ascii_rows(), c.page);
            if (!kernelActive) {
                ASSERT_EQ(taken, 0u);  // the unit-by-unit loop does it all
                continue;
            }
            ASSERT_LE(taken, units.size());
            for (size_t j = 0; j < taken; ++j) {
                const int byte = table.find(units[j]);
                ASSERT_TRUE(byte >= 0 && byte < 256) << "unit " << units[j] << " at " << j;
                ASSERT_EQ(out[j], byte) << "unit " << units[j] << " at " << j;
            }
            // The kernel's own domain: ASCII that gives itself, the page's units with a byte.
            auto takes = [&](uint16_t u) {
                const int byte = table.find(u);
                return u < 0x80 ? byte == u
                                : static_cast<uint16_t>(u - c.page) < 0x80 && byte > 0 && byte < 256;
            };
            bool unknownNear = units.size() - taken < 32;
            for (size_t j = taken; j < units.size() && j < taken + 32; ++j) unknownNear |= !takes(units[j]);
            ASSERT_TRUE(unknownNear) << "stopped at " << taken << " of " << units.size();
            for (size_t j = units.size(); j < out.size(); ++j) ASSERT_EQ(out[j], 0xA5);
        }
    }
}

}  // namespace
