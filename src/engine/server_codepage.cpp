// Text from a server in a Windows code page, to a registered charset or to
// the local encoding, through UTF-16 in a scratch buffer from the host. Text
// that cannot be converted is copied unchanged, cut to the room.
#include <string.h>

#include "engine/code_page_table.h"
#include "engine/engine.h"

namespace textconv::engine {

CharsetId server_code_page_charset(int32_t codePage) {
    for (const CodePageEntry &entry : kServerCodePages)
        if (entry.codePage == codePage) return entry.charset;
    return CHARSET_NONE;
}

namespace {

// The source as it stands, cut to room - 1 bytes and terminated, the rest of
// the room filled with NUL bytes. Nothing is written when there is no room.
void bounded_copy(const char *source, char *destination, uint32_t *length) {
    const uint32_t room = *length;
    if (room == 0) return;
    strncpy(destination, source, room);
    destination[room - 1] = '\0';
    *length = static_cast<uint32_t>(strlen(destination)) + 1;
}

}  // namespace
}  // namespace textconv::engine

using namespace textconv::engine;

extern "C" {

TEXTCONV_API int StringFromServerCPToCharset(CharsetId charset, int32_t codePage, const char *source,
                                             char *destination, uint32_t *length) {
    const CharsetId sourceCharset = server_code_page_charset(codePage);
    const size_t sourceLength = strlen(source);
    // One unit per source byte and one for the terminator.
    if (sourceCharset == CHARSET_NONE || sourceLength >= UINT32_MAX / 2) {
        bounded_copy(source, destination, length);
        return 1;
    }
    const uint32_t scratchSize = static_cast<uint32_t>(sourceLength + 1) * 2;
    auto *scratch = static_cast<uint16_t *>(HostMalloc(scratchSize, 1));
    if (!scratch) {
        bounded_copy(source, destination, length);
        return 1;
    }

    const char *in = source;
    uint16_t *unicode = scratch;
    uint32_t unicodeLength = scratchSize;
    int converted = string_from_charset_to_unicode(sourceCharset, &in, &unicode, &unicodeLength);
    if (converted) {
        const uint16_t *text = scratch;
        char *out = destination;
        uint32_t outLength = *length;
        converted = string_from_unicode_to_charset(charset, &text, &out, &outLength);
        if (converted) *length = outLength;
    }
    HostFree(scratch);
    // From the start of the source, whatever part of it was converted.
    if (!converted) bounded_copy(source, destination, length);
    return 1;
}

TEXTCONV_API int StringFromServerCPToLocal(int32_t codePage, const char *source, char *destination,
                                           uint32_t *length) {
    return StringFromServerCPToCharset(LocalEncoding(), codePage, source, destination, length);
}

}  // extern "C"
