// A platform under the test's control: iconv_open and iconv interposed over
// glibc's, and the host services defined here, watched.
#pragma once

#include <iconv.h>

#include <set>
#include <string>
#include <vector>

namespace shim {

// Names iconv_open refuses, as if the platform lacked them.
extern std::set<std::string> missingNames;
// When set, every converter to "UTF-16" puts the mark FF FE in front of the
// output of each iconv call that writes or runs out of room (glibc marks
// only the first output of a converter's life).
extern bool markEveryCall;

struct IconvCall {
    iconv_t cd;
    size_t inBytes;
    size_t room;
};
extern std::vector<std::string> opened;  // "to<-from", every iconv_open
extern std::vector<IconvCall> calls;     // every iconv call with an input

// Host services.
extern std::vector<std::string> prompts;  // "from->to"
extern int promptAnswer;
extern bool mallocFails;
extern int mallocs, frees;

}  // namespace shim
