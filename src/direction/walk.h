// The direction-escaping walk over UTF-16 text, apart from any conversion.
#pragma once

#include <cstdint>

namespace textconv::direction {

// Escapes the 0-terminated UTF-16 text into out: "%l" where a left-to-right
// run starts, "%r" where a right-to-left run starts, "%" doubled. The walk
// spends a budget of limit units: each unit taken counts 1 ("%" 2), each unit
// written counts 1; it stops once the budget reaches limit or at the 0 unit,
// and drops the rest. text is read at most limit units far; out needs room
// for limit + 4 units. Returns the units written, the final 0 included.
uint32_t escape_walk(const uint16_t *text, uint32_t limit, uint16_t *out);

}  // namespace textconv::direction
