// The local layer on real text: StringsEquivalent on two equal UTF-8 strings
// against ICU turning one of them into UTF-16, and StringFromUTF8ToLocal into
// the process's local charset (Latin-1 unless LANG names another) against
// glibc iconv and ICU (with "?" as its substitute, as the library writes). Throughput counts the bytes of one
// UTF-8 input.
#include <iconv.h>
#include <unicode/ucnv.h>
#include <unicode/ustring.h>

#include <cstring>
#include <string>
#include <vector>

#include "bench_support.h"
#include "textconv.h"

namespace {

using benchsupport::register_per_corpus;

void equivalent_textconv(benchmark::State &state, const std::string &text) {
    const std::string copy = text;  // a second buffer: no shortcut on equal pointers
    for (auto _ : state) {
        int r = StringsEquivalent(text.c_str(), CHARSET_UTF8, copy.c_str(), CHARSET_UTF8, 0);
        if (r != 1) state.SkipWithError("not equivalent");
        benchmark::DoNotOptimize(r);
    }
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations() * text.size()));
}

// The text cut down to what the local charset holds (glibc drops the rest),
// back in UTF-8: input that both sides convert without substitutes.
std::string fitting_utf8(const std::string &text) {
    const char *charset = charsetConversion[LocalEncoding()].iconvName;
    std::string local(text.size() + 16, '\0');
    std::string back(text.size() * 4 + 16, '\0');
    iconv_t in = iconv_open((std::string(charset) + "//IGNORE").c_str(), "UTF-8");
    iconv_t out = iconv_open("UTF-8", charset);
    if (in == reinterpret_cast<iconv_t>(-1) || out == reinterpret_cast<iconv_t>(-1)) return "";
    char *ip = const_cast<char *>(text.data());
    size_t il = text.size();
    char *op = local.data();
    size_t ol = local.size();
    iconv(in, &ip, &il, &op, &ol);  // -1 with EILSEQ after dropping characters
    local.resize(local.size() - ol);
    ip = local.data();
    il = local.size();
    op = back.data();
    ol = back.size();
    iconv(out, &ip, &il, &op, &ol);
    back.resize(back.size() - ol);
    iconv_close(in);
    iconv_close(out);
    return back;
}

void utf8_to_local_textconv(benchmark::State &state, const std::string &corpus) {
    const std::string text = fitting_utf8(corpus);
    std::vector<char> out(4 * text.size() + 8);
    for (auto _ : state) {
        uint32_t length = 0;
        int r = StringFromUTF8ToLocal(text.c_str(), out.data(), &length);
        if (r != 1) state.SkipWithError("a character did not convert");
        benchmark::DoNotOptimize(length);
        benchmark::ClobberMemory();
    }
    state.SetLabel(charsetConversion[LocalEncoding()].iconvName);
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations() * text.size()));
}

void utf8_to_local_iconv(benchmark::State &state, const std::string &corpus) {
    const std::string text = fitting_utf8(corpus);
    iconv_t cd = iconv_open(charsetConversion[LocalEncoding()].iconvName, "UTF-8");
    std::vector<char> out(4 * text.size() + 8);
    for (auto _ : state) {
        iconv(cd, nullptr, nullptr, nullptr, nullptr);
        char *ip = const_cast<char *>(text.data());
        size_t il = text.size();
        char *op = out.data();
        size_t ol = out.size();
        if (iconv(cd, &ip, &il, &op, &ol) == static_cast<size_t>(-1)) state.SkipWithError("iconv failed");
        benchmark::DoNotOptimize(op);
        benchmark::ClobberMemory();
    }
    iconv_close(cd);
    state.SetLabel(charsetConversion[LocalEncoding()].iconvName);
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations() * text.size()));
}

// The least work any UTF-8 decoder does on the same text: ICU's u_strFromUTF8.
void utf8_to_local_icu_utf16(benchmark::State &state, const std::string &corpus) {
    const std::string text = fitting_utf8(corpus);
    benchsupport::icu_from_utf8(state, text);
}

void utf8_to_local_icu(benchmark::State &state, const std::string &corpus) {
    const std::string text = fitting_utf8(corpus);
    UErrorCode err = U_ZERO_ERROR;
    UConverter *source = ucnv_open("UTF-8", &err);
    UConverter *target = ucnv_open(charsetConversion[LocalEncoding()].iconvName, &err);
    if (U_SUCCESS(err)) ucnv_setSubstChars(target, "?", 1, &err);
    if (U_FAILURE(err)) {
        state.SkipWithError("ICU cannot open the local charset");
        return;
    }
    std::vector<char> out(4 * text.size() + 8);
    UChar pivot[1024];
    for (auto _ : state) {
        UChar *pivotSource = pivot, *pivotTarget = pivot;
        char *op = out.data();
        const char *ip = text.data();
        err = U_ZERO_ERROR;
        ucnv_convertEx(target, source, &op, out.data() + out.size(), &ip, text.data() + text.size(), pivot,
                       &pivotSource, &pivotTarget, pivot + 1024, true, true, &err);
        if (U_FAILURE(err)) state.SkipWithError("ICU failed");
        benchmark::DoNotOptimize(op);
        benchmark::ClobberMemory();
    }
    ucnv_close(source);
    ucnv_close(target);
    state.SetLabel(charsetConversion[LocalEncoding()].iconvName);
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations() * text.size()));
}

[[maybe_unused]] const bool registered = [] {
    register_per_corpus("Equivalent/textconv", ".utf8.txt", equivalent_textconv);
    register_per_corpus("Equivalent/icu", ".utf8.txt", benchsupport::icu_from_utf8);
    register_per_corpus("UTF8toLocal/textconv", ".utf8.txt", utf8_to_local_textconv);
    register_per_corpus("UTF8toLocal/iconv", ".utf8.txt", utf8_to_local_iconv);
    register_per_corpus("UTF8toLocal/icu", ".utf8.txt", utf8_to_local_icu);
    register_per_corpus("UTF8toLocal/icu-utf16", ".utf8.txt", utf8_to_local_icu_utf16);
    return true;
}();

}  // namespace
