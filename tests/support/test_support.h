// Helpers shared by the tests.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace testsupport {

// The folder of real text, or "" when it is not there.
std::string corpora_dir();
// The bytes of a corpus file; nullopt when the corpora are not there (the
// caller then skips with GTEST_SKIP()).
std::optional<std::string> read_corpus(const std::string &name);
// Every corpus file name ending in suffix (e.g. ".utf8.txt").
std::vector<std::string> corpus_files(const std::string &suffix);

// glibc iconv as oracle. Converts bytes from one charset to another in one
// go; nullopt when iconv cannot open the pair or rejects the input.
std::optional<std::string> iconv_convert(const char *to, const char *from, const std::string &in);

// Host-order UTF-16 from and to byte strings, via glibc iconv ("UTF-16LE").
std::optional<std::u16string> iconv_to_utf16(const char *from, const std::string &in);
std::optional<std::string> iconv_from_utf16(const char *to, const std::u16string &in);

// Deterministic random valid UTF-8 text mixing ASCII, 2-, 3- and 4-byte
// characters (no surrogates, no NUL).
std::string random_utf8(uint32_t seed, size_t characters);

// Hex dump of a byte or unit sequence, for failure messages.
std::string hex(const std::string &bytes);
std::string hex(const std::u16string &units);

}  // namespace testsupport
