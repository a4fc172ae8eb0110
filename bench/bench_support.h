// Helpers shared by the benchmarks: corpus loading and registration.
#pragma once

#include <benchmark/benchmark.h>
#include <dirent.h>
#include <sys/stat.h>
#include <unicode/ustring.h>

#include <algorithm>
#include <cstdlib>
#include <fstream>
#include <functional>
#include <map>
#include <sstream>
#include <string>
#include <vector>

namespace benchsupport {

// ICU's u_strFromUTF8 of text into a buffer allocated once: the baseline
// UTF-8 decoder.
inline void icu_from_utf8(benchmark::State &state, const std::string &text) {
    std::vector<UChar> out(text.size() + 8);
    for (auto _ : state) {
        int32_t n = 0;
        UErrorCode err = U_ZERO_ERROR;
        u_strFromUTF8(out.data(), static_cast<int32_t>(out.size()), &n, text.data(),
                      static_cast<int32_t>(text.size()), &err);
        if (U_FAILURE(err)) state.SkipWithError("ICU failed");
        benchmark::DoNotOptimize(n);
        benchmark::ClobberMemory();
    }
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations() * text.size()));
}

// The folder of real text: $TEXTCONV_CORPORA, else the one compiled in; ""
// when it is not there (the benchmarks that need it then skip).
inline std::string corpora_dir() {
    const char *env = std::getenv("TEXTCONV_CORPORA");
    std::string dir = env && *env ? env : TEXTCONV_CORPORA_DIR;
    struct stat st {};
    if (stat(dir.c_str(), &st) != 0 || !S_ISDIR(st.st_mode)) return "";
    return dir;
}

// Every corpus file name ending in suffix, sorted.
inline std::vector<std::string> corpus_files(const std::string &suffix) {
    std::vector<std::string> names;
    std::string dir = corpora_dir();
    if (dir.empty()) return names;
    if (DIR *d = opendir(dir.c_str())) {
        while (dirent *e = readdir(d)) {
            std::string n = e->d_name;
            if (n.size() > suffix.size() && n.compare(n.size() - suffix.size(), suffix.size(), suffix) == 0)
                names.push_back(n);
        }
        closedir(d);
    }
    std::sort(names.begin(), names.end());
    return names;
}

// The bytes of a corpus file, read once and kept; empty when missing.
inline const std::string &corpus(const std::string &name) {
    static std::map<std::string, std::string> cache;
    auto it = cache.find(name);
    if (it != cache.end()) return it->second;
    std::string text;
    std::string dir = corpora_dir();
    if (!dir.empty()) {
        std::ifstream in(dir + "/" + name, std::ios::binary);
        std::ostringstream ss;
        ss << in.rdbuf();
        text = ss.str();
    }
    return cache.emplace(name, std::move(text)).first->second;
}

// Name of a corpus without its suffixes ("russian-lipsum.utf8.txt" ->
// "russian-lipsum").
inline std::string short_name(const std::string &file) { return file.substr(0, file.find('.')); }

// Registers fn once per corpus file ending in suffix, as "<prefix>/<corpus>".
// fn receives the corpus bytes and reports bytes processed itself. With no
// corpora a single placeholder that skips is registered, so the run says why.
inline void register_per_corpus(const std::string &prefix, const std::string &suffix,
                                std::function<void(benchmark::State &, const std::string &)> fn) {
    auto names = corpus_files(suffix);
    if (names.empty()) {
        benchmark::RegisterBenchmark((prefix + "/no-corpora").c_str(),
                                     [](benchmark::State &s) { s.SkipWithError("corpora not available"); });
        return;
    }
    for (const auto &name : names) {
        benchmark::RegisterBenchmark((prefix + "/" + short_name(name)).c_str(),
                                     [fn, name](benchmark::State &s) { fn(s, corpus(name)); });
    }
}

}  // namespace benchsupport
