// Direction-escaped strings: the source is converted to UTF-16, walked, and
// the escaped text converted back into the same charset.
#include <cstring>

#include "direction/walk.h"
#include "textconv.h"

namespace {

// Up to this room the two scratch arrays live on the stack (about 2 KiB);
// above it they come from the host, so that a large room cannot exhaust the
// stack.
constexpr uint32_t kStackRoom = 512;
constexpr uint32_t kSlack = 4;  // units beyond the room that each array holds

// The source unchanged, cut to the room: what the caller gets whenever a
// conversion fails. *length keeps its value.
void fallback_copy(char *target, const char *source, uint32_t room) { std::strncpy(target, source, room); }

}  // namespace

extern "C" {

TEXTCONV_API int StringFromCharsetToDirectionEscapedString(CharsetId charset, char *target,
                                                           const char *source, uint32_t *length) {
    const uint32_t room = *length;
    // Two arrays of room + 4 units: the converted text, then the escaped text.
    const uint64_t arrayUnits = static_cast<uint64_t>(room) + kSlack;
    uint16_t stackScratch[2 * (kStackRoom + kSlack)];
    uint16_t *scratch = stackScratch;
    if (room > kStackRoom) {
        const uint64_t bytes = 2 * arrayUnits * sizeof(uint16_t);
        scratch = bytes <= UINT32_MAX ? static_cast<uint16_t *>(HostMalloc(static_cast<uint32_t>(bytes), 1))
                                      : nullptr;
        if (!scratch) {
            fallback_copy(target, source, room);
            return 1;
        }
    }
    uint16_t *converted = scratch;
    uint16_t *escaped = scratch + arrayUnits;

    const char *from = source;
    uint16_t *into = converted;
    // The room offered in bytes; 2 * room fits since a large room took the
    // heap path above, whose size test bounds it.
    uint32_t convertedRoom = 2 * room;
    bool done = false;
    if (StringFromCharsetToUnicode(charset, &from, &into, &convertedRoom)) {
        textconv::direction::escape_walk(converted, room, escaped);
        const uint16_t *escapedText = escaped;
        char *out = target;
        uint32_t outLength = room;
        // A target too small for the escaped text fails cleanly here too.
        if (StringFromUnicodeToCharset(charset, &escapedText, &out, &outLength)) {
            *length = outLength;
            done = true;
        }
    }
    if (!done) fallback_copy(target, source, room);
    if (scratch != stackScratch) HostFree(scratch);
    return 1;
}

TEXTCONV_API int StringFromLocalToDirectionEscapedString(char *target, const char *source, uint32_t *length) {
    return StringFromCharsetToDirectionEscapedString(LocalEncoding(), target, source, length);
}

}  // extern "C"
