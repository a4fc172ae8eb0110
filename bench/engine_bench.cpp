// The charset engine's string functions against one direct iconv call on a
// converter opened the same way, over real text cut to about 1 KiB, 16 KiB
// and the whole file. The difference is the engine's own cost: measuring
// the source and handling the byte-order mark. Throughput counts the bytes
// of the charset text.
#include <iconv.h>

#include <string>
#include <vector>

#include "bench_support.h"
#include "textconv.h"

namespace {

struct Kind {
    const char *suffix;
    CharsetId charset;
    const char *name;
};
constexpr Kind kKinds[] = {{".utf8.txt", CHARSET_UTF8, "UTF-8"},
                           {".sjis.txt", CHARSET_SJIS, "SJIS"},
                           {".eucjp.txt", CHARSET_EUCJP, "EUC-JP"},
                           {".koi8r.txt", CHARSET_KOI8R, "KOI8-R"},
                           {".latin1.txt", CHARSET_LATIN1, "ISO-8859-1"}};
// UTF-16 units kept from the start of each text; 0 keeps all of it.
constexpr size_t kSizes[] = {1024, 16384, 0};

// One text in both forms, each with its terminator.
struct Sample {
    std::string bytes;
    std::u16string units;
};

std::string convert(const char *to, const char *from, const char *in, size_t size) {
    iconv_t cd = iconv_open(to, from);
    std::string out(size * 4 + 8, '\0');
    char *ip = const_cast<char *>(in), *op = out.data();
    size_t il = size, ol = out.size();
    iconv(cd, &ip, &il, &op, &ol);
    iconv_close(cd);
    out.resize(out.size() - ol);
    return out;
}

Sample make_sample(const Kind &kind, const std::string &text, size_t units) {
    std::string wide = convert("UTF-16LE", kind.name, text.data(), text.size());
    size_t keep = wide.size() / 2;
    if (units && units < keep) {
        keep = units;
        const auto last = static_cast<unsigned char>(wide[2 * keep - 1]);
        if (last >= 0xD8 && last <= 0xDB) --keep;  // not between the halves of a pair
    }
    Sample s;
    s.units.assign(reinterpret_cast<const char16_t *>(wide.data()), keep);
    s.bytes = convert(kind.name, "UTF-16LE", wide.data(), 2 * keep);
    s.units += u'\0';
    s.bytes += '\0';
    return s;
}

iconv_t open_or_skip(benchmark::State &state, const char *to, const char *from) {
    iconv_t cd = iconv_open(to, from);
    if (cd == reinterpret_cast<iconv_t>(-1)) state.SkipWithError("iconv_open failed");
    return cd;
}

// Both sides run one call first: a converter to UTF-16 marks its first
// output, which is not what the loop measures.
void to_unicode_textconv(benchmark::State &state, const Kind &kind, const Sample &s) {
    std::vector<uint16_t> out(s.units.size() + 8);
    auto run = [&] {
        const char *in = s.bytes.data();
        uint16_t *dst = out.data();
        uint32_t length = static_cast<uint32_t>(out.size() * 2);
        if (!StringFromCharsetToUnicode(kind.charset, &in, &dst, &length)) state.SkipWithError("failed");
        benchmark::DoNotOptimize(length);
    };
    run();
    for (auto _ : state) run();
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations() * s.bytes.size()));
}

void to_unicode_iconv(benchmark::State &state, const Kind &kind, const Sample &s) {
    iconv_t cd = open_or_skip(state, "UTF-16", kind.name);
    if (cd == reinterpret_cast<iconv_t>(-1)) return;
    std::vector<uint16_t> out(s.units.size() + 8);
    auto run = [&] {
        char *in = const_cast<char *>(s.bytes.data()), *op = reinterpret_cast<char *>(out.data());
        size_t il = s.bytes.size(), ol = out.size() * 2;
        if (iconv(cd, &in, &il, &op, &ol) == static_cast<size_t>(-1)) state.SkipWithError("failed");
        benchmark::DoNotOptimize(ol);
    };
    run();
    for (auto _ : state) run();
    iconv_close(cd);
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations() * s.bytes.size()));
}

void from_unicode_textconv(benchmark::State &state, const Kind &kind, const Sample &s) {
    std::vector<char> out(s.bytes.size() + 8);
    auto run = [&] {
        const uint16_t *in = reinterpret_cast<const uint16_t *>(s.units.data());
        char *dst = out.data();
        uint32_t length = static_cast<uint32_t>(out.size());
        if (!StringFromUnicodeToCharset(kind.charset, &in, &dst, &length)) state.SkipWithError("failed");
        benchmark::DoNotOptimize(length);
    };
    run();
    for (auto _ : state) run();
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations() * s.bytes.size()));
}

void from_unicode_iconv(benchmark::State &state, const Kind &kind, const Sample &s) {
    iconv_t cd = open_or_skip(state, kind.name, "UTF-16LE");
    if (cd == reinterpret_cast<iconv_t>(-1)) return;
    std::vector<char> out(s.bytes.size() + 8);
    auto run = [&] {
        char *in = reinterpret_cast<char *>(const_cast<char16_t *>(s.units.data())), *op = out.data();
        size_t il = s.units.size() * 2, ol = out.size();
        if (iconv(cd, &in, &il, &op, &ol) == static_cast<size_t>(-1)) state.SkipWithError("failed");
        benchmark::DoNotOptimize(ol);
    };
    run();
    for (auto _ : state) run();
    iconv_close(cd);
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations() * s.bytes.size()));
}

using Fn = void (*)(benchmark::State &, const Kind &, const Sample &);

[[maybe_unused]] const bool registered = [] {
    const std::pair<const char *, Fn> runs[] = {{"ToUnicode/textconv", to_unicode_textconv},
                                                {"ToUnicode/iconv", to_unicode_iconv},
                                                {"FromUnicode/textconv", from_unicode_textconv},
                                                {"FromUnicode/iconv", from_unicode_iconv}};
    for (const Kind &kind : kKinds) {
        for (const std::string &file : benchsupport::corpus_files(kind.suffix)) {
            for (size_t size : kSizes) {
                const std::string label = kind.name + std::string("/") + benchsupport::short_name(file) +
                                          "/" + (size ? std::to_string(size) + "u" : std::string("all"));
                for (const auto &[what, fn] : runs) {
                    benchmark::RegisterBenchmark(("Engine/" + std::string(what) + "/" + label).c_str(),
                                                 [&kind, file, size, fn = fn](benchmark::State &state) {
                                                     fn(state, kind,
                                                        make_sample(kind, benchsupport::corpus(file), size));
                                                 });
                }
            }
        }
    }
    return true;
}();

}  // namespace
