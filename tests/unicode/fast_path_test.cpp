// The vector fast paths against the scalar reference, called directly: same
// result, same written count, same bytes everywhere in the target (also past
// the output and on a full target), on random, damaged and cut-short input
// and on capacities that end inside a character.
#include <gtest/gtest.h>

#include <cstdlib>
#include <cstring>
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

// Code points drawn from a script profile: mostly one kind, with the
// boundary values of every length mixed in.
std::string random_text(std::mt19937 &rng, size_t chars, int profile) {
    static const uint32_t edges[] = {0x7F,   0x80,   0x7FF,  0x800,  0xFFF,   0x1000,
                                     0xD7FF, 0xE000, 0xFFFD, 0xFFFF, 0x10000, 0x10FFFF};
    std::string out;
    for (size_t i = 0; i < chars; ++i) {
        uint32_t r = rng() % 100, cp;
        if (r < 3) {
            cp = edges[rng() % std::size(edges)];
        } else if (r < (profile == 0 ? 95 : profile == 3 ? 30 : 15)) {
            cp = 0x20 + rng() % 0x5F;
        } else if (profile == 1 || (profile == 3 && r < 60)) {
            cp = 0x400 + rng() % 0x60;  // Cyrillic
        } else if (profile == 2 || (profile == 3 && r < 97)) {
            cp = 0x4E00 + rng() % 0x5000;  // CJK
        } else {
            cp = 0x1F600 + rng() % 0x40;
        }
        char buf[8];
        uint8_t n = 0;
        FromUCS4toUTF8(cp, buf, &n);
        out.append(buf, n);
    }
    return out;
}

// Bytes that break the decoder's rules in every way it knows.
void damage(std::mt19937 &rng, std::string &s, int hits) {
    static const uint8_t bad[] = {0x00, 0x41, 0x80, 0x9F, 0xA0, 0xBF, 0xC0, 0xC1, 0xC2, 0xDF, 0xE0,
                                  0xED, 0xEF, 0xF0, 0xF4, 0xF5, 0xF7, 0xF8, 0xFB, 0xFC, 0xFE, 0xFF};
    for (int i = 0; i < hits && !s.empty(); ++i) {
        size_t at = rng() % s.size();
        switch (rng() % 4) {
            case 0:
                s[at] = static_cast<char>(bad[rng() % std::size(bad)]);
                break;
            case 1:
                s.insert(at, 1, static_cast<char>(bad[rng() % std::size(bad)]));
                break;
            case 2:
                s.erase(at, 1);
                break;
            default:
                s.insert(at, rng() % 2 ? "\xED\xA0\x80" : "\xE0\x80\xAF");
                break;  // surrogate, overlong
        }
    }
}

void compare_utf8_to_utf16(const Path &path, const std::string &in, uint32_t cap) {
    const size_t units = cap / 2 + 40;
    std::vector<uint16_t> want(units, 0xA5A5), got(units, 0xA5A5);
    uint32_t wantWritten = 0xDEAD, gotWritten = 0xDEAD;
    // Input and a second target of exactly the given sizes, so that a
    // sanitizer sees any access past them.
    const std::vector<uint8_t> exactIn(in.begin(), in.end());
    std::vector<uint16_t> exactOut((cap + 1) / 2);
    const uint8_t *src = exactIn.data();
    const auto len = static_cast<uint32_t>(in.size());
    uint32_t wantResult = textconv::utf8_to_utf16_scalar(src, len, want.data(), cap, &wantWritten);
    uint32_t gotResult = path.utf8_to_utf16(src, len, got.data(), cap, &gotWritten);
    uint32_t unused;
    EXPECT_EQ(path.utf8_to_utf16(src, len, exactOut.data(), cap, &unused), wantResult);
    ASSERT_EQ(gotResult, wantResult) << path.name << " cap " << cap << " "
                                     << testsupport::hex(in.substr(0, 64));
    ASSERT_EQ(gotWritten, wantWritten) << path.name << " cap " << cap;
    ASSERT_TRUE(want == got) << path.name << " target differs, cap " << cap << " "
                             << testsupport::hex(in.substr(0, 64));
}

void compare_utf16_to_utf8(const Path &path, const std::u16string &in, uint32_t cap) {
    std::vector<uint8_t> want(cap + 64, 0xA5), got(cap + 64, 0xA5);
    uint32_t wantWritten = 0xDEAD, gotWritten = 0xDEAD;
    const std::vector<uint16_t> exactIn(in.begin(), in.end());
    std::vector<uint8_t> exactOut(cap);
    const uint16_t *src = exactIn.data();
    const auto len = static_cast<uint32_t>(in.size() * 2);
    uint32_t wantResult = textconv::utf16_to_utf8_scalar(src, len, want.data(), cap, &wantWritten);
    uint32_t gotResult = path.utf16_to_utf8(src, len, got.data(), cap, &gotWritten);
    uint32_t unused;
    EXPECT_EQ(path.utf16_to_utf8(src, len, exactOut.data(), cap, &unused), wantResult);
    ASSERT_EQ(gotResult, wantResult) << path.name << " cap " << cap;
    ASSERT_EQ(gotWritten, wantWritten) << path.name << " cap " << cap;
    ASSERT_TRUE(want == got) << path.name << " target differs, cap " << cap;
}

// Capacities: everything for short output, otherwise the full size and a
// spread of cuts, many of them inside a character.
std::vector<uint32_t> capacities(std::mt19937 &rng, uint32_t full) {
    std::vector<uint32_t> caps = {full, full + 1, full + 64};
    if (full <= 200) {
        for (uint32_t c = 0; c < full; ++c) caps.push_back(c);
    } else {
        for (int i = 0; i < 24; ++i) caps.push_back(rng() % full);
        for (uint32_t c = full - 50; c < full; ++c) caps.push_back(c);
    }
    return caps;
}

TEST(FastPaths, Utf8ToUtf16MatchesScalarOnRandomDamagedAndCutInput) {
    std::mt19937 rng(12345);
    for (const Path &path : paths()) {
        for (int round = 0; round < 400; ++round) {
            std::string s = random_text(rng, rng() % 300, round % 4);
            if (round % 3) damage(rng, s, 1 + static_cast<int>(rng() % 6));
            if (round % 5 == 0 && !s.empty()) s.resize(rng() % s.size());  // cut anywhere
            for (uint32_t cap : capacities(rng, static_cast<uint32_t>(2 * s.size())))
                ASSERT_NO_FATAL_FAILURE(compare_utf8_to_utf16(path, s, cap));
        }
    }
}

TEST(FastPaths, Utf8ToUtf16MatchesScalarAtEveryCut) {
    std::mt19937 rng(777);
    for (const Path &path : paths()) {
        for (int profile = 0; profile < 4; ++profile) {
            std::string s = random_text(rng, 60, profile);
            damage(rng, s, profile);
            for (size_t n = 0; n <= s.size(); ++n)
                ASSERT_NO_FATAL_FAILURE(
                    compare_utf8_to_utf16(path, s.substr(0, n), static_cast<uint32_t>(2 * n)));
        }
    }
}

TEST(FastPaths, Utf16ToUtf8MatchesScalarOnRandomUnits) {
    std::mt19937 rng(4242);
    for (const Path &path : paths()) {
        for (int round = 0; round < 400; ++round) {
            // Runs of one kind of unit, lone and paired surrogates between.
            std::u16string s;
            const size_t n = rng() % 300;
            const int profile = round % 4;
            while (s.size() < n) {
                uint32_t r = rng() % 100;
                if (r < 2) {
                    s += static_cast<char16_t>(0xD800 + rng() % 0x800);  // lone, either half
                } else if (r < 4) {
                    s += static_cast<char16_t>(0xD800 + rng() % 0x400);
                    s += static_cast<char16_t>(0xDC00 + rng() % 0x400);
                } else if (r < 6) {
                    static const char16_t edges[] = {0x7F, 0x80, 0x7FF, 0x800, 0xD7FF, 0xE000, 0xFFFF, 0};
                    s += edges[rng() % std::size(edges)];
                } else {
                    static const uint32_t base[] = {0x20, 0x400, 0x4E00, 0x80};
                    static const uint32_t span[] = {0x5F, 0x60, 0x5000, 0x780};
                    s += static_cast<char16_t>(rng() % 3 == 0 ? 0x20 + rng() % 0x5F
                                                              : base[profile] + rng() % span[profile]);
                }
            }
            for (uint32_t cap : capacities(rng, static_cast<uint32_t>(3 * s.size())))
                ASSERT_NO_FATAL_FAILURE(compare_utf16_to_utf8(path, s, cap));
        }
    }
}

TEST(FastPaths, CorporaMatchScalarInBothDirections) {
    auto names = testsupport::corpus_files(".utf8.txt");
    if (names.empty()) GTEST_SKIP() << "corpora not available";
    std::mt19937 rng(99);
    for (const Path &path : paths()) {
        for (const auto &name : names) {
            std::string text = *testsupport::read_corpus(name);
            std::u16string units = *testsupport::iconv_to_utf16("UTF-8", text);
            for (uint32_t cap :
                 {static_cast<uint32_t>(2 * text.size()), static_cast<uint32_t>(units.size() * 2),
                  static_cast<uint32_t>(units.size() * 2 - 3), static_cast<uint32_t>(rng() % text.size())})
                ASSERT_NO_FATAL_FAILURE(compare_utf8_to_utf16(path, text, cap)) << name;
            for (uint32_t cap : {static_cast<uint32_t>(text.size()), static_cast<uint32_t>(text.size() - 1),
                                 static_cast<uint32_t>(rng() % text.size())})
                ASSERT_NO_FATAL_FAILURE(compare_utf16_to_utf8(path, units, cap)) << name;
        }
    }
}

TEST(FastPaths, Latin1MatchesScalar) {
    std::mt19937 rng(31337);
    std::vector<std::string> inputs;
    for (int round = 0; round < 300; ++round) {
        std::string s(rng() % 200, '\0');
        const int highShare = round % 5 * 25;  // 0 % to 100 % of bytes above 0x7F
        for (char &c : s)
            c = static_cast<char>(static_cast<int>(rng() % 100) < highShare ? 0x80 + rng() % 0x80
                                                                            : 1 + rng() % 0x7F);
        inputs.push_back(s);
    }
    if (auto text = testsupport::read_corpus("french.latin1.txt")) inputs.push_back(*text);
    for (const Path &path : paths()) {
        for (const auto &s : inputs) {
            // Exactly the room the contract asks for, then a guard.
            std::vector<uint8_t> want(2 * s.size() + 1 + 32, 0xA5), got(want);
            const std::vector<uint8_t> exactIn(s.begin(), s.end());
            std::vector<uint8_t> exactOut(2 * s.size());
            const uint8_t *src = exactIn.data();
            const auto len = static_cast<uint32_t>(s.size());
            ASSERT_EQ(path.latin1_to_utf8(src, len, got.data()),
                      textconv::latin1_to_utf8_scalar(src, len, want.data()));
            path.latin1_to_utf8(src, len, exactOut.data());
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
