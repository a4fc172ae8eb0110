// Vector conversion of runs of units that a single-byte charset's table
// already knows: ASCII and the charset's page of letters.
#pragma once

#include <cstddef>
#include <cstdint>

namespace textconv {

// Writes to d the bytes of the units at the start of `units` (n of them)
// that the table knows (see UnitByteTable: `flat` for ASCII units and the
// 128 units from pageBase, `asciiRows` for ASCII units that give themselves),
// and returns how many; it may stop short of the first unit that is not. It
// works on blocks of 32 units (8 with NEON) while a whole block remains and
// may store a block whole, so up to 31 bytes past the returned count may
// change, all within the n bytes that the n units give. Returns 0 where no
// vector kernel is in use (TEXTCONV_FORCE_SCALAR=1, or a CPU without AVX2 or
// NEON): the caller's unit-by-unit loop is the reference.
size_t copy_known_units(const uint16_t *units, size_t n, uint8_t *d, const uint8_t flat[256],
                        const uint8_t asciiRows[16], uint16_t pageBase);

}  // namespace textconv
