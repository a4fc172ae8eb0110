// The engine on platforms glibc does not give by itself: converters that mark
// every output, converters that are missing, and the count of iconv calls.
#include <gtest/gtest.h>

#include <tuple>

#include "engine/engine.h"
#include "engine_checks.h"
#include "frame/registry.h"
#include "platform_shim.h"

using namespace enginetest;
using textconv::engine::terminatorOutsideConverter;

namespace {

// iconv calls on cd since call number `from`.
size_t calls_to(iconv_t cd, size_t from = 0) {
    size_t n = 0;
    for (size_t i = from; i < shim::calls.size(); ++i) n += shim::calls[i].cd == cd;
    return n;
}
const iconv_t &utf8_cd = textconv::toUnicodeConverters[CHARSET_UTF8];

const std::string kText = "h\xC3\xA9llo";  // five characters, room 12 with the terminator
const std::u16string kUnits = std::u16string(u"h\xE9llo") + u'\0';

}  // namespace

TEST(EngineMarks, GlibcMarkOnFirstOutputIsRetriedOnce) {
    Outcome run = to_unicode(CHARSET_UTF8, kText, 12);
    ASSERT_EQ(run.result, 1);
    EXPECT_EQ(run.units(), kUnits);
    EXPECT_EQ(run.length, 12u);
    EXPECT_EQ(run.destinationMoved, 12u);  // past the converted terminator
    EXPECT_EQ(calls_to(utf8_cd), 2u);
    EXPECT_EQ(terminatorOutsideConverter, 0u);
    const size_t before = shim::calls.size();
    EXPECT_EQ(to_unicode(CHARSET_UTF8, kText, 12).units(), kUnits);
    EXPECT_EQ(calls_to(utf8_cd, before), 1u);
}

TEST(EngineMarks, SourceMarkInAFullBufferIsNoConverterMark) {
    ASSERT_EQ(to_unicode(CHARSET_UTF8, "a").result, 1);  // glibc's one mark
    Outcome full = to_unicode(CHARSET_UTF8,
                              "\xEF\xBB\xBF"
                              "abc",
                              4);
    EXPECT_EQ(full.result, 0);
    EXPECT_EQ(full.length, 4u);
    EXPECT_EQ(terminatorOutsideConverter, 0u);
}

TEST(EngineMarks, SecondMarkSetsTheFlagAndLaterCallsLeaveTheTerminatorOut) {
    shim::markEveryCall = true;
    Outcome run = to_unicode(CHARSET_UTF8, kText, 12);
    ASSERT_EQ(run.result, 1);
    EXPECT_EQ(terminatorOutsideConverter, 1u);
    EXPECT_EQ(run.units(), kUnits);
    EXPECT_EQ(run.length, 12u);
    EXPECT_EQ(run.destinationMoved, 10u);  // on the stored terminator
    EXPECT_EQ(run.sourceMoved, kText.size());
    // The pass, its rerun, and the pass without the terminator.
    ASSERT_EQ(calls_to(utf8_cd), 3u);
    EXPECT_EQ(shim::calls.back().inBytes, kText.size());

    // Another charset: one call, the NUL withheld, marks removed.
    size_t before = shim::calls.size();
    EXPECT_EQ(to_unicode(CHARSET_LATIN1, "caf\xE9").units(), std::u16string(u"caf\xE9") + u'\0');
    ASSERT_EQ(calls_to(textconv::toUnicodeConverters[CHARSET_LATIN1], before), 1u);
    EXPECT_EQ(shim::calls.back().inBytes, 4u);
    // 16-bit text ends on the first byte of its terminating unit.
    Outcome units = to_unicode(CHARSET_UTF16, as_bytes(u"AB"));
    EXPECT_EQ(units.units(), std::u16string(u"AB") + u'\0');
    EXPECT_EQ(units.sourceMoved, 4u);
    // A substitute in each pass; text ending inside a character gives what
    // the terminator would.
    EXPECT_EQ(to_unicode(CHARSET_UTF8,
                         "A\xFF"
                         "B")
                  .units(),
              std::u16string(u"A\xFFFD"
                             u"B") +
                  u'\0');
    EXPECT_EQ(to_unicode(CHARSET_UTF8, "A\xE2\x82").units(), std::u16string(u"A\xFFFD\xFFFD") + u'\0');

    // A full buffer fails at once: no rerun any more.
    before = shim::calls.size();
    Outcome full = to_unicode(CHARSET_UTF8, kText, 6);
    EXPECT_EQ(full.result, 0);
    EXPECT_EQ(full.length, 6u);
    EXPECT_EQ(full.destinationMoved, 0u);
    EXPECT_EQ(calls_to(utf8_cd, before), 1u);

    // Without marks the text may fill the room, leaving none for the stored
    // terminator: failure, nothing past the room.
    shim::markEveryCall = false;
    ASSERT_EQ(to_unicode(CHARSET_KOI8R, "abc").result, 1);  // glibc's one mark
    Outcome tight = to_unicode(CHARSET_KOI8R, "abcde", 10);
    EXPECT_EQ(tight.result, 0);
    EXPECT_EQ(tight.length, 10u);
    EXPECT_TRUE(tight.guardIntact);
}

TEST(EngineMarks, UnitsWrittenWithAMarkEveryCall) {
    shim::markEveryCall = true;
    // The converter's mark goes, a UTF-8 source's own mark stays.
    EXPECT_EQ(to_unicode(CHARSET_UTF8,
                         "\xEF\xBB\xBF"
                         "A")
                  .units(),
              std::u16string(u"\xFEFF"
                             u"A") +
                  u'\0');
    const struct {
        const char *source;
        int result;
        uint16_t unit;
        size_t moved;
    } cases[] = {{"\xE2\x82\xAC", 1, 0x20AC, 3},
                 {"\xEF\xBB\xBF", 1, 0xFEFF, 3},
                 {"\xFF", 1, 0xFFFD, 1},
                 {"\xF0\x9F\x98\x80", 0, 0, 0}};  // a mark and a pair overflow 4 bytes
    for (const auto &c : cases) {
        const Char got = decode_char(CHARSET_UTF8, c.source);
        EXPECT_EQ(std::tuple(got.result, got.unit, got.moved), std::tuple(c.result, c.unit, c.moved))
            << c.source;
    }
}

TEST(EngineRoom, FullDestinationFailsWithoutAnotherCall) {
    // E2BIG ends the call; so does a "?" with no room left.
    for (const char16_t *text : {u"abcdef", u"ab\x20AC"}) {
        const size_t before = shim::calls.size();
        Outcome run = from_unicode(CHARSET_LATIN1, text, 2);
        EXPECT_EQ(run.result, 0);
        EXPECT_EQ(run.length, 2u);
        EXPECT_EQ(run.sourceMoved, 0u);
        EXPECT_TRUE(run.guardIntact);
        EXPECT_EQ(calls_to(textconv::fromUnicodeConverters[CHARSET_LATIN1], before), 1u);
    }
}

TEST(EngineMissing, AskedOnceThenEveryCallFailsWithItsMessage) {
    // glibc knows neither "UTF16-LE" nor "UTF16-BE".
    testing::internal::CaptureStderr();
    for (int i = 0; i < 2; ++i) {
        Outcome out = from_unicode(CHARSET_UTF16LE, u"AB", 20);
        EXPECT_EQ(out.result, 0);
        EXPECT_EQ(out.length, 20u);  // the room, unchanged
        EXPECT_EQ(out.sourceMoved + out.destinationMoved, 0u);
        Outcome in = to_unicode(CHARSET_UTF16BE, as_bytes(u"AB"));
        EXPECT_EQ(in.result, 0);
        EXPECT_EQ(in.sourceMoved + in.destinationMoved, 0u);
    }
    // The character functions share the cells: no new question.
    EXPECT_EQ(encode_char(CHARSET_UTF16LE, 0x263A), std::nullopt);
    EXPECT_EQ(decode_char(CHARSET_UTF16BE, "\x42").result, 0);
    EXPECT_EQ(decode_char(CHARSET_NONE, "\x42").result, 0);
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
        EXPECT_EQ(FromUnicodeToKOI8R(0x410, &q), 0);
        EXPECT_EQ(q, &out);
        const char *p = "\xE1";
        uint16_t unit = 7;
        EXPECT_EQ(FromKOI8RToUnicode(&p, &unit), 0);
        EXPECT_EQ(unit, 7);
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
