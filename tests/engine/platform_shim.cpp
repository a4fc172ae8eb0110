#include "platform_shim.h"

#include <dlfcn.h>

#include <cerrno>
#include <cstdlib>
#include <cstring>

#include "textconv.h"

namespace shim {
std::set<std::string> missingNames;
bool markEveryCall = false, mallocFails = false;
std::vector<std::string> opened, prompts;
std::vector<IconvCall> calls;
int promptAnswer = 1, mallocs = 0, frees = 0;
static std::set<iconv_t> marking;
}  // namespace shim

using namespace shim;

extern "C" {

iconv_t iconv_open(const char *to, const char *from) {
    static auto real =
        reinterpret_cast<iconv_t (*)(const char *, const char *)>(dlsym(RTLD_NEXT, "iconv_open"));
    opened.push_back(std::string(to) + "<-" + from);
    if (missingNames.count(to) || missingNames.count(from)) return errno = EINVAL, iconv_t(-1);
    // The marks are the shim's alone: the real converter writes none.
    const bool mark = markEveryCall && std::strcmp(to, "UTF-16") == 0;
    iconv_t cd = real(mark ? "UTF-16LE" : to, from);
    if (mark) marking.insert(cd);
    return cd;
}

size_t iconv(iconv_t cd, char **in, size_t *inLeft, char **out, size_t *outLeft) {
    static auto real = reinterpret_cast<size_t (*)(iconv_t, char **, size_t *, char **, size_t *)>(
        dlsym(RTLD_NEXT, "iconv"));
    if (!in || !out) return real(cd, in, inLeft, out, outLeft);
    calls.push_back({cd, *inLeft});
    if (!marking.count(cd)) return real(cd, in, inLeft, out, outLeft);
    if (*outLeft < 2) return errno = E2BIG, size_t(-1);
    char *start = *out;
    *out += 2;
    *outLeft -= 2;
    const size_t result = real(cd, in, inLeft, out, outLeft);
    const int error = errno;
    if (*out == start + 2 && !(result == size_t(-1) && error == E2BIG)) {
        *out = start;  // nothing to put a mark in front of
        *outLeft += 2;
    } else {
        std::memcpy(start, "\xFF\xFE", 2);
    }
    errno = error;
    return result;
}

void *HostMalloc(uint32_t size, uint32_t) { return mallocFails ? nullptr : (++mallocs, std::malloc(size)); }
void HostFree(void *p) { ++frees, std::free(p); }
int Mem_alloc(uint32_t, uint32_t size, void **block) { return (*block = std::malloc(size)) ? 0 : 1; }
void Mem_free(uint32_t, void *block) { std::free(block); }
int UIYesNoDisplay(uint32_t, uint32_t, uint32_t, const char *from, const char *to) {
    prompts.push_back(std::string(from) + "->" + to);
    return promptAnswer;
}
int32_t GetiStringID(const char *key, const StringIDEntry *table) {
    while (table->name && !(key && std::strcmp(key, table->name) == 0)) ++table;
    return table->id;
}
void *memmove_soc(void *d, const void *s, uint32_t n) { return std::memmove(d, s, n); }
}
