// The engine on platforms glibc does not give by itself: converters that mark
// every output, converters that are missing, and the count of iconv calls.
#include <gtest/gtest.h>

#include "engine/engine.h"
#include "engine_checks.h"
#include "frame/registry.h"
#include "platform_shim.h"

using namespace enginetest;
using textconv::engine::terminatorOutsideConverter;

namespace {

// iconv calls on cd since call number `from`.
size_t calls_to(iconv_t cd, size_t from = 0) {
    return std::count_if(shim::calls.begin() + from, shim::calls.end(), [&](auto &c) { return c.cd == cd; });
}
const iconv_t &utf8Cd = textconv::toUnicodeConverters[CHARSET_UTF8];

const std::string kText = "h\xC3\xA9llo";  // five characters: 12 bytes with the terminator
const std::u16string kUnits = z(u"h\xE9llo");

}  // namespace

TEST(EngineMarks, GlibcMarkOnFirstOutputIsRetriedOnce) {
    Outcome run = to_unicode(CHARSET_UTF8, kText, 12);
    EXPECT_EQ(run.units(), kUnits);
    EXPECT_EQ(run.length, 12u);
    EXPECT_EQ(run.destinationMoved, 12u);  // past the converted terminator
    EXPECT_EQ(calls_to(utf8Cd), 2u);
    EXPECT_EQ(terminatorOutsideConverter, 0u);
    const size_t before = shim::calls.size();
    EXPECT_EQ(to_unicode(CHARSET_UTF8, kText, 12).units(), kUnits);
    EXPECT_EQ(calls_to(utf8Cd, before), 1u);
}

TEST(EngineMarks, SourceMarkInAFullBufferIsNoConverterMark) {
    ASSERT_EQ(to_unicode(CHARSET_UTF8, "a").result, 1);  // glibc's one mark
    Outcome full = to_unicode(CHARSET_UTF8, "\xEF\xBB\xBF\x61\x62\x63", 4);
    EXPECT_EQ(full.result, 0);
    EXPECT_EQ(full.length, 4u);
    EXPECT_EQ(terminatorOutsideConverter, 0u);
}

TEST(EngineMarks, SecondMarkSetsTheFlagAndLaterCallsLeaveTheTerminatorOut) {
    shim::markEveryCall = true;
    Outcome run = to_unicode(CHARSET_UTF8, kText, 12);
    EXPECT_EQ(terminatorOutsideConverter, 1u);
    EXPECT_EQ(run.units(), kUnits);
    EXPECT_EQ(run.length, 12u);
    EXPECT_EQ(run.destinationMoved, 10u);  // on the stored terminator
    EXPECT_EQ(run.sourceMoved, kText.size());
    // The pass, its rerun, and the pass without the terminator.
    ASSERT_EQ(calls_to(utf8Cd), 3u);
    EXPECT_EQ(shim::calls.back().inBytes, kText.size());

    // Another charset: one call, the NUL withheld, marks removed.
    size_t before = shim::calls.size();
    EXPECT_EQ(to_unicode(CHARSET_LATIN1, "caf\xE9").units(), z(u"caf\xE9"));
    ASSERT_EQ(calls_to(textconv::toUnicodeConverters[CHARSET_LATIN1], before), 1u);
    EXPECT_EQ(shim::calls.back().inBytes, 4u);
    // 16-bit text ends on the first byte of its terminating unit.
    Outcome units = to_unicode(CHARSET_UTF16, as_bytes(u"AB"));
    EXPECT_EQ(units.units(), z(u"AB"));
    EXPECT_EQ(units.sourceMoved, 4u);
    // A substitute in each pass; text ending inside a character gives what
    // the terminator would.
    EXPECT_EQ(to_unicode(CHARSET_UTF8, "A\xFF\x42").units(), z({'A', 0xFFFD, 'B'}));
    EXPECT_EQ(to_unicode(CHARSET_UTF8, "A\xE2\x82").units(), z({'A', 0xFFFD, 0xFFFD}));

    // A full buffer fails at once: no rerun any more.
    before = shim::calls.size();
    Outcome full = to_unicode(CHARSET_UTF8, kText, 6);
    EXPECT_EQ(std::tuple(full.result, full.length, full.destinationMoved), std::tuple(0, 6u, 0u));
    EXPECT_EQ(calls_to(utf8Cd, before), 1u);

    // Without marks the text may fill the room, leaving none for the stored
    // terminator: failure, nothing past the room.
    shim::markEveryCall = false;
    ASSERT_EQ(to_unicode(CHARSET_KOI8R, "abc").result, 1);  // glibc's one mark
    Outcome tight = to_unicode(CHARSET_KOI8R, "abcde", 10);
    EXPECT_EQ(std::tuple(tight.result, tight.length, tight.guardIntact), std::tuple(0, 10u, true));
}

// A UTF-8 text's own marks are text, however many open it: with glibc's
// mark on the first output only, the first call and the later ones agree.
TEST(EngineMarks, SourceMarksAreKeptEveryOne) {
    for (int call = 0; call < 3; ++call) {
        EXPECT_EQ(to_unicode(CHARSET_UTF8, "\xEF\xBB\xBF\xEF\xBB\xBF\x41").units(), z(u"\xFEFF\xFEFF\x41"));
        EXPECT_EQ(to_unicode(CHARSET_UTF8, "\xEF\xBB\xBF\x41").units(), z(u"\xFEFF\x41"));
    }
}

TEST(EngineMarks, UnitsWrittenWithAMarkEveryCall) {
    shim::markEveryCall = true;
    // The converter's mark goes, a UTF-8 source's own marks stay.
    EXPECT_EQ(to_unicode(CHARSET_UTF8, "\xEF\xBB\xBF\x41").units(), z(u"\xFEFF\x41"));
    EXPECT_EQ(to_unicode(CHARSET_UTF8, "\xEF\xBB\xBF\xEF\xBB\xBF\x41").units(), z(u"\xFEFF\xFEFF\x41"));
    EXPECT_EQ(decode_char(CHARSET_UTF8, "\xE2\x82\xAC"), Char(1, 0x20AC, 3));
    EXPECT_EQ(decode_char(CHARSET_UTF8, "\xEF\xBB\xBF"), Char(1, 0xFEFF, 3));
    EXPECT_EQ(decode_char(CHARSET_UTF8, "\xFF"), Char(1, 0xFFFD, 1));
    EXPECT_EQ(decode_char(CHARSET_UTF8, "\xF0\x9F\x98\x80"),
              Char(0, 0, 0));  // a mark and a pair overflow 4 bytes
}

TEST(EngineRoom, FullDestinationFailsWithoutAnotherCall) {
    // E2BIG ends the call; so does a "?" with no room left.
    for (const char16_t *text : {u"abcdef", u"ab\x20AC"}) {
        const size_t before = shim::calls.size();
        Outcome run = from_unicode(CHARSET_LATIN1, text, 2);
        EXPECT_EQ(std::tuple(run.result, run.length, run.sourceMoved, run.guardIntact),
                  std::tuple(0, 2u, 0u, true));
        EXPECT_EQ(calls_to(textconv::fromUnicodeConverters[CHARSET_LATIN1], before), 1u);
    }
}

TEST(EngineMissing, AskedOnceThenEveryCallFailsWithItsMessage) {
    // glibc knows neither "UTF16-LE" nor "UTF16-BE".
    testing::internal::CaptureStderr();
    for (int i = 0; i < 2; ++i) {
        Outcome out = from_unicode(CHARSET_UTF16LE, u"AB", 20);
        EXPECT_EQ(std::tuple(out.result, out.length, out.sourceMoved + out.destinationMoved),
                  std::tuple(0, 20u, 0u));
        Outcome in = to_unicode(CHARSET_UTF16BE, as_bytes(u"AB"));
        EXPECT_EQ(std::tuple(in.result, in.sourceMoved + in.destinationMoved), std::tuple(0, 0u));
    }
    // The character functions share the cells: no new question.
    EXPECT_EQ(encode_char(CHARSET_UTF16LE, 0x263A), std::nullopt);
    EXPECT_EQ(std::get<0>(decode_char(CHARSET_UTF16BE, "\x42")), 0);
    EXPECT_EQ(std::get<0>(decode_char(CHARSET_NONE, "\x42")), 0);
    EXPECT_EQ(testing::internal::GetCapturedStderr(),
              "Cannot use iconv to convert from UTF-16 to UTF16-LE (65)\n"
              "Cannot use iconv to convert from UTF16-BE (65) to UTF-16\n"
              "Cannot use iconv to convert from UTF-16 to UTF16-LE (65)\n"
              "Cannot use iconv to convert from UTF16-BE (65) to UTF-16\n"
              "Cannot use iconv to convert from UTF-16 to UTF16-LE (9786)\n"
              "Cannot use iconv to convert from UTF16-BE (66) to UTF-16\n"
              "Cannot use iconv to convert from (none) (66) to UTF-16\n");
    EXPECT_EQ(shim::prompts, (std::vector<std::string>{"UTF-16->UTF16-LE", "UTF16-BE->UTF-16"}));
    EXPECT_EQ(shim::opened.size(), 2u);  // nothing opened for CHARSET_NONE
}

TEST(EngineMissing, KOI8RPairAsksOncePerDirection) {
    shim::missingNames = {"KOI8-R"};
    testing::internal::CaptureStderr();
    for (int i = 0; i < 2; ++i) {
        char out = 'x', *q = &out;
        const char *p = "\xE1";
        uint16_t unit = 7;
        EXPECT_EQ(FromUnicodeToKOI8R(0x410, &q), 0);
        EXPECT_EQ(FromKOI8RToUnicode(&p, &unit), 0);
        EXPECT_EQ(std::tuple(q, unit), std::tuple(&out, 7));
    }
    EXPECT_EQ(testing::internal::GetCapturedStderr(),
              "Cannot use iconv to convert from koi8r (225) to UTF-16\n"
              "Cannot use iconv to convert from koi8r (225) to UTF-16\n");
    EXPECT_EQ(shim::prompts, (std::vector<std::string>{"UTF-16->KOI8-R", "KOI8-R->UTF-16"}));
}

TEST(EngineMissing, DeclinedQuestionEndsTheProcess) {
    shim::promptAnswer = 0;
    shim::missingNames = {"KOI8-R"};
    EXPECT_EXIT(to_unicode(CHARSET_UTF16LE, as_bytes(u"A")), testing::ExitedWithCode(1), "");
    EXPECT_EXIT(FromUnicodeToKOI8R(0x410, nullptr), testing::ExitedWithCode(1), "");
}
