// The vector fast paths against the scalar reference: same result, written
// count and target bytes (also past the output), on random, damaged and
// cut-short input and on capacities ending inside a character.
#include <gtest/gtest.h>

#include <cstdlib>
#include <random>
#include <string>
#include <vector>

#include "test_support.h"
#include "textconv.h"
#include "unicode/utf_internal.h"

namespace {

using U8to16 = uint32_t (*)(const uint8_t *, uint32_t, uint16_t *, uint32_t, uint32_t *);
using U16to8 = uint32_t (*)(const uint16_t *, uint32_t, uint8_t *, uint32_t, uint32_t *);
using Latin1 = uint32_t (*)(const uint8_t *, uint32_t, uint8_t *);

struct Path {
    const char *name;
    U8to16 utf8_to_utf16;
    U16to8 utf16_to_utf8;
    Latin1 latin1_to_utf8;
};

// Every path this machine can run, the dispatched one included.
std::vector<Path> paths() {
    std::vector<Path> p = {
        {"dispatched", textconv::utf8_to_utf16, textconv::utf16_to_utf8, textconv::latin1_to_utf8}};
#if defined(__x86_64__)
    using namespace textconv::fast;
    p.push_back({"sse2", utf8_to_utf16_sse2, utf16_to_utf8_sse2, latin1_to_utf8_sse2});
    if (avx2_available()) p.push_back({"avx2", utf8_to_utf16_avx2, utf16_to_utf8_avx2, latin1_to_utf8_avx2});
#endif
#if defined(__arm__) && defined(__ARM_PCS_VFP)
    using namespace textconv::fast;
    if (neon_available()) p.push_back({"neon", utf8_to_utf16_neon, utf16_to_utf8_neon, latin1_to_utf8_neon});
#endif
    return p;
}

// Mostly one script per profile (ASCII, Cyrillic, CJK, mixed), boundary
// values of every length mixed in.
std::string random_text(std::mt19937 &rng, size_t chars, int profile) {
    static const uint32_t edges[] = {0x7F,   0x80,   0x7FF,  0x800,  0xFFF,   0x1000,
                                     0xD7FF, 0xE000, 0xFFFD, 0xFFFF, 0x10000, 0x10FFFF};
    std::string out;
    for (size_t i = 0; i < chars; ++i) {
        const uint32_t r = rng() % 100;
        const uint32_t cp = r < 3 ? edges[rng() % std::size(edges)]
                            : r < (profile == 0   ? 95u
                                   : profile == 3 ? 30u
                                                  : 15u)
                                ? 0x20 + rng() % 0x5F
                            : profile == 1 || (profile == 3 && r < 60) ? 0x400 + rng() % 0x60
                            : profile == 2 || (profile == 3 && r < 97) ? 0x4E00 + rng() % 0x5000
                                                                       : 0x1F600 + rng() % 0x40;
        char buf[8];
        uint8_t n = 0;
        FromUCS4toUTF8(cp, buf, &n);
        out.append(buf, n);
    }
    return out;
}

// Bytes that break the decoder's rules in every way it knows: replaced,
// inserted, deleted bytes, encoded surrogates and overlong forms.
void damage(std::mt19937 &rng, std::string &s, int hits) {
    static const uint8_t bad[] = {0x00, 0x41, 0x80, 0x9F, 0xA0, 0xBF, 0xC0, 0xC1, 0xC2, 0xDF, 0xE0,
                                  0xED, 0xEF, 0xF0, 0xF4, 0xF5, 0xF7, 0xF8, 0xFB, 0xFC, 0xFE, 0xFF};
    for (int i = 0; i < hits && !s.empty(); ++i) {
        const size_t at = rng() % s.size();
        const char b = static_cast<char>(bad[rng() % std::size(bad)]);
        // clang-format off
        switch (rng() % 4) {
            case 0: s[at] = b; break;
            case 1: s.insert(at, 1, b); break;
            case 2: s.erase(at, 1); break;
            default: s.insert(at, rng() % 2 ? "\xED\xA0\x80" : "\xE0\x80\xAF");
        }
        // clang-format on
    }
}

// Runs the fast and the scalar conversion into guarded targets, and the fast
// one again on input and target of exactly the given sizes (for sanitizers).
template <typename In, typename Out>
void compare(const char *name, uint32_t (*fast)(const In *, uint32_t, Out *, uint32_t, uint32_t *),
             uint32_t (*scalar)(const In *, uint32_t, Out *, uint32_t, uint32_t *), const std::vector<In> &in,
             uint32_t cap) {
    const size_t units = cap / sizeof(Out) + 64;
    std::vector<Out> want(units, Out(0xA5A5)), got(want), exactOut((cap + sizeof(Out) - 1) / sizeof(Out));
    uint32_t wantWritten = 0xDEAD, gotWritten = 0xDEAD, unused;
    const auto len = static_cast<uint32_t>(in.size() * sizeof(In));
    const uint32_t wantResult = scalar(in.data(), len, want.data(), cap, &wantWritten);
    ASSERT_EQ(fast(in.data(), len, got.data(), cap, &gotWritten), wantResult) << name << " cap " << cap;
    ASSERT_EQ(fast(in.data(), len, exactOut.data(), cap, &unused), wantResult) << name << " cap " << cap;
    ASSERT_EQ(gotWritten, wantWritten) << name << " cap " << cap;
    ASSERT_TRUE(want == got) << name << " target differs, cap " << cap;
}
void compare8(const Path &path, const std::string &s, uint32_t cap) {
    compare(path.name, path.utf8_to_utf16, textconv::utf8_to_utf16_scalar,
            std::vector<uint8_t>(s.begin(), s.end()), cap);
}
void compare16(const Path &path, const std::u16string &s, uint32_t cap) {
    compare(path.name, path.utf16_to_utf8, textconv::utf16_to_utf8_scalar,
            std::vector<uint16_t>(s.begin(), s.end()), cap);
}

// Every capacity for short output, else the full size and a spread of cuts.
std::vector<uint32_t> capacities(std::mt19937 &rng, uint32_t full) {
    std::vector<uint32_t> caps = {full, full + 1, full + 64};
    for (uint32_t c = full > 200 ? full - 50 : 0; c < full; ++c) caps.push_back(c);
    for (int i = 0; full > 200 && i < 24; ++i) caps.push_back(rng() % full);
    return caps;
}

TEST(FastPaths, Utf8ToUtf16MatchesScalarOnRandomDamagedAndCutInput) {
    std::mt19937 rng(12345);
    for (const Path &path : paths()) {
        for (int round = 0; round < 400; ++round) {
            std::string s = random_text(rng, rng() % 300, round % 4);
            if (round % 3) damage(rng, s, 1 + static_cast<int>(rng() % 6));
            if (round % 5 == 0 && !s.empty()) s.resize(rng() % s.size());
            for (uint32_t cap : capacities(rng, static_cast<uint32_t>(2 * s.size())))
                ASSERT_NO_FATAL_FAILURE(compare8(path, s, cap));
        }
        for (int profile = 0; profile < 4; ++profile) {  // every cut of one string
            std::string s = random_text(rng, 60, profile);
            damage(rng, s, profile);
            for (size_t n = 0; n <= s.size(); ++n)
                ASSERT_NO_FATAL_FAILURE(compare8(path, s.substr(0, n), static_cast<uint32_t>(2 * n)));
        }
    }
}

// Runs of one kind of unit with lone and paired surrogates between.
TEST(FastPaths, Utf16ToUtf8MatchesScalarOnRandomUnits) {
    static const char16_t edges[] = {0x7F, 0x80, 0x7FF, 0x800, 0xD7FF, 0xE000, 0xFFFF, 0};
    static const uint32_t base[] = {0x20, 0x400, 0x4E00, 0x80}, span[] = {0x5F, 0x60, 0x5000, 0x780};
    std::mt19937 rng(4242);
    for (const Path &path : paths()) {
        for (int round = 0; round < 400; ++round) {
            std::u16string s;
            for (size_t n = rng() % 300; s.size() < n;) {
                const uint32_t r = rng() % 100;
                if (r < 2) {
                    s += static_cast<char16_t>(0xD800 + rng() % 0x800);
                } else if (r < 4) {
                    s += {static_cast<char16_t>(0xD800 + rng() % 0x400),
                          static_cast<char16_t>(0xDC00 + rng() % 0x400)};
                } else if (r < 6) {
                    s += edges[rng() % std::size(edges)];
                } else {
                    s += static_cast<char16_t>(rng() % 3 == 0 ? 0x20 + rng() % 0x5F
                                                              : base[round % 4] + rng() % span[round % 4]);
                }
            }
            for (uint32_t cap : capacities(rng, static_cast<uint32_t>(3 * s.size())))
                ASSERT_NO_FATAL_FAILURE(compare16(path, s, cap));
        }
    }
}

TEST(FastPaths, CorporaMatchScalarInBothDirections) {
    const auto names = testsupport::corpus_files(".utf8.txt");
    if (names.empty()) GTEST_SKIP() << "corpora not available";
    std::mt19937 rng(99);
    for (const Path &path : paths()) {
        for (const auto &name : names) {
            const std::string text = *testsupport::read_corpus(name);
            const std::u16string units = *testsupport::iconv_to_utf16("UTF-8", text);
            const auto bytes = static_cast<uint32_t>(text.size()),
                       unitBytes = static_cast<uint32_t>(units.size() * 2);
            for (uint32_t cap : {2 * bytes, unitBytes, unitBytes - 3, static_cast<uint32_t>(rng() % bytes)})
                ASSERT_NO_FATAL_FAILURE(compare8(path, text, cap)) << name;
            for (uint32_t cap : {bytes, bytes - 1, static_cast<uint32_t>(rng() % bytes)})
                ASSERT_NO_FATAL_FAILURE(compare16(path, units, cap)) << name;
        }
    }
}

// 0 % to 100 % of bytes above 0x7F, exactly the room the contract asks for.
TEST(FastPaths, Latin1MatchesScalar) {
    std::mt19937 rng(31337);
    std::vector<std::string> inputs;
    for (int round = 0; round < 300; ++round) {
        std::string s(rng() % 200, '\0');
        for (char &c : s)
            c = static_cast<char>(static_cast<int>(rng() % 100) < round % 5 * 25 ? 0x80 + rng() % 0x80
                                                                                 : 1 + rng() % 0x7F);
        inputs.push_back(s);
    }
    if (auto text = testsupport::read_corpus("french.latin1.txt")) inputs.push_back(*text);
    for (const Path &path : paths()) {
        for (const auto &s : inputs) {
            std::vector<uint8_t> want(2 * s.size() + 1 + 32, 0xA5), got(want), exactOut(2 * s.size());
            const std::vector<uint8_t> in(s.begin(), s.end());
            const auto len = static_cast<uint32_t>(s.size());
            ASSERT_EQ(path.latin1_to_utf8(in.data(), len, got.data()),
                      textconv::latin1_to_utf8_scalar(in.data(), len, want.data()));
            path.latin1_to_utf8(in.data(), len, exactOut.data());
            ASSERT_TRUE(want == got) << path.name << " " << s.size();
        }
    }
}

TEST(FastPaths, ForcedScalarIsHonoured) {
    setenv("TEXTCONV_FORCE_SCALAR", "1", 1);
    EXPECT_STREQ(textconv::active_path(), "scalar");
    uint16_t out[4];
    uint32_t len = sizeof out;
    EXPECT_EQ(StringFromUTF8ToUnicode("\xC3\xA9", out, &len), 1);
    EXPECT_EQ(out[0], 0xE9);
}

TEST(FastPaths, FastestAvailablePathIsChosen) {
    unsetenv("TEXTCONV_FORCE_SCALAR");
#if defined(__x86_64__)
    EXPECT_STREQ(textconv::active_path(), textconv::fast::avx2_available() ? "avx2" : "sse2");
#elif defined(__arm__) && defined(__ARM_PCS_VFP)
    EXPECT_STREQ(textconv::active_path(), textconv::fast::neon_available() ? "neon" : "words");
#else
    EXPECT_STREQ(textconv::active_path(), "words");
#endif
}

}  // namespace
