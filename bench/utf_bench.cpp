// UTF-8 <-> UTF-16 and Latin-1 -> UTF-8 on real text: the library against
// glibc iconv and ICU. Throughput counts input bytes.
#include <iconv.h>
#include <unicode/ucnv.h>
#include <unicode/ustring.h>

#include <algorithm>
#include <cstring>
#include <string>
#include <vector>

#include "bench_support.h"
#include "textconv.h"

namespace {

using benchsupport::register_per_corpus;

// Host-order UTF-16 of a UTF-8 text (through ICU, which is not measured here).
std::u16string to_utf16(const std::string &utf8) {
    std::u16string out(utf8.size() + 1, u'\0');
    int32_t n = 0;
    UErrorCode err = U_ZERO_ERROR;
    u_strFromUTF8(reinterpret_cast<UChar *>(out.data()), static_cast<int32_t>(out.size()), &n, utf8.data(),
                  static_cast<int32_t>(utf8.size()), &err);
    out.resize(U_SUCCESS(err) ? n : 0);
    return out;
}

// One glibc converter per direction, opened once and reset per run.
void iconv_run(benchmark::State &state, const char *to, const char *from, const char *in, size_t inLen,
               size_t outRoom) {
    iconv_t cd = iconv_open(to, from);
    if (cd == reinterpret_cast<iconv_t>(-1)) {
        state.SkipWithError("iconv_open failed");
        return;
    }
    std::vector<char> out(outRoom);
    for (auto _ : state) {
        iconv(cd, nullptr, nullptr, nullptr, nullptr);
        char *ip = const_cast<char *>(in);
        size_t il = inLen;
        char *op = out.data();
        size_t ol = out.size();
        if (iconv(cd, &ip, &il, &op, &ol) == static_cast<size_t>(-1)) state.SkipWithError("iconv failed");
        benchmark::DoNotOptimize(op);
    }
    iconv_close(cd);
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations() * inLen));
}

void utf8_to_utf16_textconv(benchmark::State &state, const std::string &text) {
    std::vector<uint16_t> out(text.size() + 8);
    for (auto _ : state) {
        uint32_t written = 0;
        uint32_t r = ConvertUTF8toUTF16(text.data(), static_cast<uint32_t>(text.size()), out.data(),
                                        static_cast<uint32_t>(out.size() * 2), &written);
        if (r != TEXTCONV_UTF_DONE) state.SkipWithError("conversion failed");
        benchmark::DoNotOptimize(written);
        benchmark::ClobberMemory();
    }
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations() * text.size()));
}

void utf8_to_utf16_iconv(benchmark::State &state, const std::string &text) {
    iconv_run(state, "UTF-16LE", "UTF-8", text.data(), text.size(), text.size() * 2 + 16);
}

void utf16_to_utf8_textconv(benchmark::State &state, const std::string &text) {
    const std::u16string units = to_utf16(text);
    std::vector<char> out(text.size() + 8);
    for (auto _ : state) {
        uint32_t written = 0;
        uint32_t r = ConvertUTF16toUTF8(reinterpret_cast<const uint16_t *>(units.data()),
                                        static_cast<uint32_t>(units.size() * 2), out.data(),
                                        static_cast<uint32_t>(out.size()), &written);
        if (r != TEXTCONV_UTF_DONE) state.SkipWithError("conversion failed");
        benchmark::DoNotOptimize(written);
        benchmark::ClobberMemory();
    }
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations() * units.size() * 2));
}

void utf16_to_utf8_icu(benchmark::State &state, const std::string &text) {
    const std::u16string units = to_utf16(text);
    std::vector<char> out(text.size() + 8);
    for (auto _ : state) {
        int32_t n = 0;
        UErrorCode err = U_ZERO_ERROR;
        u_strToUTF8(out.data(), static_cast<int32_t>(out.size()), &n,
                    reinterpret_cast<const UChar *>(units.data()), static_cast<int32_t>(units.size()), &err);
        if (U_FAILURE(err)) state.SkipWithError("ICU failed");
        benchmark::DoNotOptimize(n);
        benchmark::ClobberMemory();
    }
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations() * units.size() * 2));
}

void utf16_to_utf8_iconv(benchmark::State &state, const std::string &text) {
    const std::u16string units = to_utf16(text);
    iconv_run(state, "UTF-8", "UTF-16LE", reinterpret_cast<const char *>(units.data()), units.size() * 2,
              text.size() + 16);
}

void latin1_textconv(benchmark::State &state, const std::string &text) {
    std::vector<char> out(text.size() * 2 + 1);
    for (auto _ : state) {
        uint32_t len = 0;
        StringFromLatin1ToUTF8(text.c_str(), out.data(), &len);
        benchmark::DoNotOptimize(len);
        benchmark::ClobberMemory();
    }
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations() * text.size()));
}

void latin1_icu(benchmark::State &state, const std::string &text) {
    UErrorCode err = U_ZERO_ERROR;
    UConverter *latin1 = ucnv_open("ISO-8859-1", &err);
    UConverter *utf8 = ucnv_open("UTF-8", &err);
    if (U_FAILURE(err)) {
        state.SkipWithError("ucnv_open failed");
        return;
    }
    std::vector<char> out(text.size() * 2 + 1);
    UChar pivot[1024];
    for (auto _ : state) {
        char *target = out.data();
        const char *source = text.data();
        UChar *pivotSource = pivot, *pivotTarget = pivot;
        err = U_ZERO_ERROR;
        ucnv_convertEx(utf8, latin1, &target, out.data() + out.size(), &source, text.data() + text.size(),
                       pivot, &pivotSource, &pivotTarget, pivot + 1024, true, true, &err);
        if (U_FAILURE(err)) state.SkipWithError("ICU failed");
        benchmark::DoNotOptimize(target);
        benchmark::ClobberMemory();
    }
    ucnv_close(latin1);
    ucnv_close(utf8);
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations() * text.size()));
}

void latin1_iconv(benchmark::State &state, const std::string &text) {
    iconv_run(state, "UTF-8", "ISO-8859-1", text.data(), text.size(), text.size() * 2 + 16);
}

// The string and list forms and the local layer's Latin-1 path, built on
// the same code; ICU's u_strFromUTF8 on the same text is the baseline.
void utf8_string_textconv(benchmark::State &state, const std::string &text) {
    std::vector<uint16_t> out(text.size() + 8);
    for (auto _ : state) {
        uint32_t length = static_cast<uint32_t>(out.size() * 2);
        if (!StringFromUTF8ToUnicode(text.c_str(), out.data(), &length))
            state.SkipWithError("conversion failed");
        benchmark::DoNotOptimize(length);
        benchmark::ClobberMemory();
    }
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations() * text.size()));
}

// The text's lines as a list of strings (each newline a NUL); the list
// function returns a new block from the host each time, released here.
void utf8_list_textconv(benchmark::State &state, const std::string &text) {
    std::string list = text;
    std::replace(list.begin(), list.end(), '\n', '\0');
    for (auto _ : state) {
        char *block = list.data();
        uint32_t length = static_cast<uint32_t>(list.size());
        if (!StringListFromUTF8toUTF16(&block, &length)) state.SkipWithError("conversion failed");
        benchmark::DoNotOptimize(length);
        HostFree(block);
    }
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations() * text.size()));
}

void latin1_local_textconv(benchmark::State &state, const std::string &text) {
    if (LocalEncoding() != CHARSET_LATIN1) {
        state.SkipWithError("the local encoding is not Latin-1 (set LANG)");
        return;
    }
    std::vector<char> out(text.size() * 2 + 1);
    for (auto _ : state) {
        uint32_t len = static_cast<uint32_t>(out.size());
        StringFromLocalToUTF8(text.c_str(), out.data(), &len);
        benchmark::DoNotOptimize(len);
        benchmark::ClobberMemory();
    }
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations() * text.size()));
}

[[maybe_unused]] const bool registered = [] {
    register_per_corpus("UTF8toUTF16/textconv", ".utf8.txt", utf8_to_utf16_textconv);
    register_per_corpus("UTF8toUTF16/icu", ".utf8.txt", benchsupport::icu_from_utf8);
    register_per_corpus("UTF8toUTF16/iconv", ".utf8.txt", utf8_to_utf16_iconv);
    register_per_corpus("UTF8toUTF16/string", ".utf8.txt", utf8_string_textconv);
    register_per_corpus("UTF8toUTF16/list", ".utf8.txt", utf8_list_textconv);
    register_per_corpus("UTF16toUTF8/textconv", ".utf8.txt", utf16_to_utf8_textconv);
    register_per_corpus("UTF16toUTF8/icu", ".utf8.txt", utf16_to_utf8_icu);
    register_per_corpus("UTF16toUTF8/iconv", ".utf8.txt", utf16_to_utf8_iconv);
    register_per_corpus("Latin1toUTF8/textconv", ".latin1.txt", latin1_textconv);
    register_per_corpus("Latin1toUTF8/icu", ".latin1.txt", latin1_icu);
    register_per_corpus("Latin1toUTF8/iconv", ".latin1.txt", latin1_iconv);
    register_per_corpus("Latin1toUTF8/local", ".latin1.txt", latin1_local_textconv);
    return true;
}();

}  // namespace
