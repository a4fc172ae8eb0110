/* Reference host: memory services over malloc and free. */
#include <stdlib.h>

#include "textconv.h"

void *HostMalloc(uint32_t size, uint32_t flags) {
    (void)flags;
    return malloc(size ? size : 1);
}

void HostFree(void *block) { free(block); }

int Mem_alloc(uint32_t pool, uint32_t size, void **block) {
    (void)pool;
    void *p = malloc(size ? size : 1);
    if (!p) return 1;
    *block = p;
    return 0;
}

void Mem_free(uint32_t pool, void *block) {
    (void)pool;
    free(block);
}

