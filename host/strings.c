/* Reference host: exact, case-sensitive name lookup and memmove. */
#include <string.h>

#include "textconv.h"

int32_t GetiStringID(const char *key, const StringIDEntry *table) {
    const StringIDEntry *row = table;
    for (; row->name; ++row)
        if (key && strcmp(row->name, key) == 0) return row->id;
    return row->id;
}

void *memmove_soc(void *dest, const void *src, uint32_t byteCount) { return memmove(dest, src, byteCount); }
