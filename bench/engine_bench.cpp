// The charset engine's string functions against one direct iconv call on a
// converter opened the same way, over real text cut to 1024 and 16384 UTF-16
// units (at least 1 KiB of charset text) and the whole file. The difference
// is the engine's own cost: measuring the source and handling the
// byte-order mark. Throughput counts the bytes of the charset text.
#include <iconv.h>

#include <algorithm>
#include <chrono>
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

// The library call and the direct iconv call, alternated in every iteration
// and timed apart, so that both meet the same machine load; the medians of
// the two give the overhead. The reported time is the library's.
template <class Library, class Direct>
void paired(benchmark::State &state, size_t bytes, Library library, Direct direct) {
    using Clock = std::chrono::steady_clock;
    // A converter to UTF-16 marks its first output: not what is measured.
    library();
    direct();
    std::vector<double> libraryNs, directNs;
    bool libraryFirst = true;
    for (auto _ : state) {
        const auto t0 = Clock::now();
        libraryFirst ? library() : direct();
        const auto t1 = Clock::now();
        libraryFirst ? direct() : library();
        const auto t2 = Clock::now();
        const double first = std::chrono::duration<double, std::nano>(t1 - t0).count();
        const double second = std::chrono::duration<double, std::nano>(t2 - t1).count();
        libraryNs.push_back(libraryFirst ? first : second);
        directNs.push_back(libraryFirst ? second : first);
        state.SetIterationTime(libraryNs.back() * 1e-9);
        libraryFirst = !libraryFirst;
    }
    auto median = [](std::vector<double> &v) {
        std::nth_element(v.begin(), v.begin() + v.size() / 2, v.end());
        return v[v.size() / 2];
    };
    const double lib = median(libraryNs), dir = median(directNs);
    state.counters["textconv_ns"] = lib;
    state.counters["iconv_ns"] = dir;
    state.counters["overhead_pct"] = (lib / dir - 1) * 100;
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations() * bytes));
}

// The converters are opened as the library opens its own: UTF-16 as a
// target by that name, as a source in host order.
void to_unicode(benchmark::State &state, const Kind &kind, const Sample &s) {
    iconv_t cd = iconv_open("UTF-16", kind.name);
    std::vector<uint16_t> out(s.units.size() + 8);
    paired(
        state, s.bytes.size(),
        [&] {
            const char *in = s.bytes.data();
            uint16_t *dst = out.data();
            uint32_t length = static_cast<uint32_t>(out.size() * 2);
            if (!StringFromCharsetToUnicode(kind.charset, &in, &dst, &length)) state.SkipWithError("failed");
            benchmark::DoNotOptimize(length);
        },
        [&] {
            char *in = const_cast<char *>(s.bytes.data()), *op = reinterpret_cast<char *>(out.data());
            size_t il = s.bytes.size(), ol = out.size() * 2;
            if (iconv(cd, &in, &il, &op, &ol) == static_cast<size_t>(-1)) state.SkipWithError("failed");
            benchmark::DoNotOptimize(ol);
        });
    iconv_close(cd);
}

void from_unicode(benchmark::State &state, const Kind &kind, const Sample &s) {
    iconv_t cd = iconv_open(kind.name, "UTF-16LE");
    std::vector<char> out(s.bytes.size() + 8);
    paired(
        state, s.bytes.size(),
        [&] {
            const uint16_t *in = reinterpret_cast<const uint16_t *>(s.units.data());
            char *dst = out.data();
            uint32_t length = static_cast<uint32_t>(out.size());
            if (!StringFromUnicodeToCharset(kind.charset, &in, &dst, &length)) state.SkipWithError("failed");
            benchmark::DoNotOptimize(length);
        },
        [&] {
            char *in = reinterpret_cast<char *>(const_cast<char16_t *>(s.units.data())), *op = out.data();
            size_t il = s.units.size() * 2, ol = out.size();
            if (iconv(cd, &in, &il, &op, &ol) == static_cast<size_t>(-1)) state.SkipWithError("failed");
            benchmark::DoNotOptimize(ol);
        });
    iconv_close(cd);
}

using Fn = void (*)(benchmark::State &, const Kind &, const Sample &);

[[maybe_unused]] const bool registered = [] {
    const std::pair<const char *, Fn> runs[] = {{"ToUnicode", to_unicode}, {"FromUnicode", from_unicode}};
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
                                                 })
                        ->UseManualTime();
                }
            }
        }
    }
    return true;
}();

}  // namespace
