// A platform under the test's control: iconv_open and iconv interposed over
// glibc's, and the host services, watched.
#pragma once

#include <iconv.h>

#include <set>
#include <string>
#include <vector>

namespace shim {

struct IconvCall {
    iconv_t cd;
    size_t inBytes;
};
extern std::set<std::string> missingNames;  // names iconv_open refuses
// Converters to "UTF-16" put FF FE in front of the output of every call that
// writes or runs out of room (glibc marks only a converter's first output).
extern bool markEveryCall, mallocFails;
extern std::vector<std::string> opened, prompts;  // "to<-from" per iconv_open; "from->to"
extern std::vector<IconvCall> calls;              // every iconv call with an input
extern int promptAnswer, mallocs, frees;

}  // namespace shim
