// The Japanese string transcoders against glibc iconv doing the same
// conversion in one call on a converter kept open, over the Japanese corpora.
// Shift-JIS input has its control characters (newlines, tabs) replaced by
// spaces, since they are invalid Shift-JIS for the library; EUC-JP input has
// its JIS X 0212 characters replaced by spaces, which Shift-JIS cannot hold
// and on which iconv would stop. Both sides convert exactly the same bytes;
// throughput counts source bytes. Each side runs once before it is timed.
#include <iconv.h>

#include <string>

#include "bench_support.h"
#include "textconv.h"

namespace {

std::string sjis_without_controls(std::string text) {
    for (char &c : text)
        if (static_cast<unsigned char>(c) < 0x20 || c == 0x7F) c = ' ';
    return text;
}

std::string eucjp_without_0212(const std::string &text) {
    std::string out;
    for (size_t at = 0; at < text.size(); ++at) {
        if (text[at] != '\x8F') {
            out += text[at];
        } else {
            out += ' ';
            at += 2;
        }
    }
    return out;
}

void textconv_side(benchmark::State &state, const std::string &in, size_t room,
                   int (*run)(const std::string &, std::string &)) {
    std::string out(room, '\0');
    if (!run(in, out)) state.SkipWithError("conversion failed");
    for (auto _ : state) benchmark::DoNotOptimize(run(in, out));
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations() * in.size()));
}

void iconv_side(benchmark::State &state, const std::string &in, size_t room, const char *to,
                const char *from) {
    iconv_t cd = iconv_open(to, from);
    std::string out(room, '\0');
    auto run = [&] {
        iconv(cd, nullptr, nullptr, nullptr, nullptr);
        char *ip = const_cast<char *>(in.data()), *op = out.data();
        size_t il = in.size(), ol = out.size();
        return iconv(cd, &ip, &il, &op, &ol);
    };
    if (run() == static_cast<size_t>(-1)) state.SkipWithError("iconv failed");
    for (auto _ : state) benchmark::DoNotOptimize(run());
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations() * in.size()));
    iconv_close(cd);
}

int sjis_to_utf8(const std::string &in, std::string &out) {
    uint32_t length;
    return StringFromSJISToUTF8(in.c_str(), out.data(), &length);
}
int eucjp_to_utf8(const std::string &in, std::string &out) {
    uint32_t length;
    return StringFromEUCJPToUTF8(in.c_str(), out.data(), &length);
}
int eucjp_to_sjis(const std::string &in, std::string &out) {
    int32_t length = static_cast<int32_t>(out.size() - 1);
    StringFromEUCJPToSJIS(in.c_str(), out.data(), &length);
    return length > 0;
}

[[maybe_unused]] const bool registered = [] {
    using benchsupport::register_per_corpus;
    register_per_corpus("japanese/StringFromSJISToUTF8", ".sjis.txt",
                        [](benchmark::State &s, const std::string &t) {
                            textconv_side(s, sjis_without_controls(t), 3 * t.size() + 1, sjis_to_utf8);
                        });
    register_per_corpus("japanese/iconv_SJIS_to_UTF-8", ".sjis.txt",
                        [](benchmark::State &s, const std::string &t) {
                            iconv_side(s, sjis_without_controls(t), 3 * t.size() + 1, "UTF-8", "SJIS");
                        });
    register_per_corpus("japanese/StringFromEUCJPToUTF8", ".eucjp.txt",
                        [](benchmark::State &s, const std::string &t) {
                            textconv_side(s, eucjp_without_0212(t), 3 * t.size() / 2 + 1, eucjp_to_utf8);
                        });
    register_per_corpus("japanese/iconv_EUC-JP_to_UTF-8", ".eucjp.txt",
                        [](benchmark::State &s, const std::string &t) {
                            iconv_side(s, eucjp_without_0212(t), 3 * t.size() / 2 + 1, "UTF-8", "EUC-JP");
                        });
    register_per_corpus("japanese/StringFromEUCJPToSJIS", ".eucjp.txt",
                        [](benchmark::State &s, const std::string &t) {
                            textconv_side(s, eucjp_without_0212(t), t.size() + 1, eucjp_to_sjis);
                        });
    register_per_corpus("japanese/iconv_EUC-JP_to_SJIS", ".eucjp.txt",
                        [](benchmark::State &s, const std::string &t) {
                            iconv_side(s, eucjp_without_0212(t), t.size() + 1, "SJIS", "EUC-JP");
                        });
    return true;
}();

}  // namespace
