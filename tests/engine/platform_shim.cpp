#include "platform_shim.h"

#include <dlfcn.h>

#include <cerrno>
#include <cstdlib>
#include <cstring>

#include "textconv.h"

namespace shim {
std::set<std::string> missingNames;
bool markEveryCall = false;
std::vector<std::string> opened;
std::vector<IconvCall> calls;
std::vector<std::string> prompts;
int promptAnswer = 1;
bool mallocFails = false;
int mallocs = 0, frees = 0;

namespace {
std::set<iconv_t> marking;
}
}  // namespace shim

using namespace shim;

extern "C" {

iconv_t iconv_open(const char *to, const char *from) {
    using Fn = iconv_t (*)(const char *, const char *);
    static Fn real = reinterpret_cast<Fn>(dlsym(RTLD_NEXT, "iconv_open"));
    opened.push_back(std::string(to) + "<-" + from);
    if (missingNames.count(to) || missingNames.count(from)) {
        errno = EINVAL;
        return reinterpret_cast<iconv_t>(-1);
    }
    const bool mark = markEveryCall && std::strcmp(to, "UTF-16") == 0;
    // The marks are the shim's alone: the real converter writes none.
    iconv_t cd = real(mark ? "UTF-16LE" : to, from);
    if (mark) marking.insert(cd);
    return cd;
}

size_t iconv(iconv_t cd, char **in, size_t *inLeft, char **out, size_t *outLeft) {
    using Fn = size_t (*)(iconv_t, char **, size_t *, char **, size_t *);
    static Fn real = reinterpret_cast<Fn>(dlsym(RTLD_NEXT, "iconv"));
    if (!in || !out) return real(cd, in, inLeft, out, outLeft);
    calls.push_back({cd, *inLeft, *outLeft});
    if (!marking.count(cd)) return real(cd, in, inLeft, out, outLeft);
    if (*outLeft < 2) {
        errno = E2BIG;
        return static_cast<size_t>(-1);
    }
    char *start = *out;
    *out += 2;
    *outLeft -= 2;
    const size_t result = real(cd, in, inLeft, out, outLeft);
    const int error = errno;
    if (*out == start + 2 && !(result == static_cast<size_t>(-1) && error == E2BIG)) {
        *out = start;  // nothing to put a mark in front of
        *outLeft += 2;
    } else {
        start[0] = '\xFF';
        start[1] = '\xFE';
    }
    errno = error;
    return result;
}

void *HostMalloc(uint32_t size, uint32_t) {
    if (mallocFails) return nullptr;
    ++mallocs;
    return std::malloc(size);
}
void HostFree(void *p) {
    ++frees;
    std::free(p);
}
int Mem_alloc(uint32_t, uint32_t size, void **block) { return (*block = std::malloc(size)) ? 0 : 1; }
void Mem_free(uint32_t, void *block) { std::free(block); }
int UIYesNoDisplay(uint32_t, uint32_t, uint32_t, const char *from, const char *to) {
    prompts.push_back(std::string(from) + "->" + to);
    return promptAnswer;
}
int32_t GetiStringID(const char *key, const StringIDEntry *table) {
    for (; table->name; ++table)
        if (key && std::strcmp(key, table->name) == 0) break;
    return table->id;
}
void *memmove_soc(void *d, const void *s, uint32_t n) { return std::memmove(d, s, n); }
}
