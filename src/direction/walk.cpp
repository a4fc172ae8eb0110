// The direction-escaping walk.
#include "direction/walk.h"

#include "direction/classes.h"

namespace textconv::direction {

uint32_t escape_walk(const uint16_t *text, uint32_t limit, uint16_t *out) {
    // 64 bits: a strong unit after a long neutral run adds the run to the
    // budget, which must not wrap for limits near 2^32.
    uint64_t budget = 0;
    uint8_t current = DIRECTION_NEUTRAL;
    uint32_t written = 0;
    // The pending run is the neutral units since the last strong one, kept
    // as a span of the text; its length counts each "%" twice.
    const uint16_t *pendingStart = text;
    uint64_t pending = 0;
    const uint16_t *p = text;

    auto put = [&](uint16_t unit) { out[written++] = unit; };
    auto flush = [&](const uint16_t *end) {
        for (const uint16_t *q = pendingStart; q < end; ++q) {
            put(*q);
            if (*q == u'%') put(u'%');
        }
    };

    while (budget < limit) {
        const uint16_t unit = *p;
        if (unit == 0) break;
        ++p;
        if (unit == u'%') {
            budget += 2;
            pending += 2;
            continue;
        }
        budget += 1;
        const uint8_t cls = unit_class(unit);
        if (cls == DIRECTION_NEUTRAL) {
            pending += 1;
            continue;
        }
        const bool turn = cls != current;
        if (turn && cls == DIRECTION_LTR) {
            // Neutral units after right-to-left text (or at the start) join
            // the left-to-right run.
            put(u'%');
            put(u'l');
            flush(p - 1);
        } else if (turn) {
            // Neutral units before a right-to-left run stay outside it.
            flush(p - 1);
            put(u'%');
            put(u'r');
        } else {
            flush(p - 1);
        }
        put(unit);
        budget += pending + (turn ? 3 : 1);
        pending = 0;
        pendingStart = p;
        current = cls;
    }
    // Trailing neutral units continue the last run, with no escape.
    flush(p);
    put(0);
    return written;
}

}  // namespace textconv::direction
