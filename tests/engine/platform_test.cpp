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

size_t calls_to(iconv_t cd, size_t from = 0) {
    size_t n = 0;
    for (size_t i = from; i < shim::calls.size(); ++i) n += shim::calls[i].cd == cd;
    return n;
}
iconv_t to_unicode_cd(CharsetId charset) { return textconv::toUnicodeConverters[charset]; }

const std::string kText = "h\xC3\xA9llo";  // five characters
const std::u16string kUnits = u"h\xE9llo";

// The first conversion into a buffer sized for the text and its terminator
// alone, with a converter that marks every call: sets the flag.
void first_call_sets_the_flag() {
    Outcome run = to_unicode(CHARSET_UTF8, kText, 2 * (5 + 1));
    ASSERT_EQ(run.result, 1);
    ASSERT_EQ(terminatorOutsideConverter, 1u);
}

}  // namespace

TEST(EngineMarks, GlibcMarkOnFirstOutputIsRetriedOnce) {
    Outcome run = to_unicode(CHARSET_UTF8, kText, 2 * (5 + 1));
    ASSERT_EQ(run.result, 1);
    EXPECT_EQ(run.units(), kUnits + u'\0');
    EXPECT_EQ(run.length, 12u);
    EXPECT_EQ(run.destinationMoved, 12u);  // past the converted terminator
    EXPECT_EQ(calls_to(to_unicode_cd(CHARSET_UTF8)), 2u);
    EXPECT_EQ(terminatorOutsideConverter, 0u);

    const size_t before = shim::calls.size();
    EXPECT_EQ(to_unicode(CHARSET_UTF8, kText, 12).units(), kUnits + u'\0');
    EXPECT_EQ(calls_to(to_unicode_cd(CHARSET_UTF8), before), 1u);
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

TEST(EngineMarks, SecondMarkSetsTheFlagAndTheTerminatorIsStoredHere) {
    shim::markEveryCall = true;
    Outcome run = to_unicode(CHARSET_UTF8, kText, 12);
    ASSERT_EQ(run.result, 1);
    EXPECT_EQ(terminatorOutsideConverter, 1u);
    EXPECT_EQ(run.units(), kUnits + u'\0');
    EXPECT_EQ(run.length, 12u);
    EXPECT_EQ(run.destinationMoved, 10u);  // on the stored terminator
    EXPECT_EQ(run.sourceMoved, kText.size());
    // The pass, its rerun, and the pass without the terminator.
    ASSERT_EQ(calls_to(to_unicode_cd(CHARSET_UTF8)), 3u);
    EXPECT_EQ(shim::calls.back().inBytes, kText.size());
}

TEST(EngineMarks, LaterCallsLeaveTheTerminatorOut) {
    shim::markEveryCall = true;
    first_call_sets_the_flag();
    // Another charset: one call, the NUL withheld, marks removed.
    size_t before = shim::calls.size();
    Outcome latin = to_unicode(CHARSET_LATIN1, "caf\xE9");
    ASSERT_EQ(latin.result, 1);
    EXPECT_EQ(latin.units(), std::u16string(u"caf\xE9") + u'\0');
    ASSERT_EQ(calls_to(to_unicode_cd(CHARSET_LATIN1), before), 1u);
    EXPECT_EQ(shim::calls.back().inBytes, 4u);

    // 16-bit text ends on the first byte of its terminating unit.
    Outcome units = to_unicode(CHARSET_UTF16, as_bytes(u"AB"));
    ASSERT_EQ(units.result, 1);
    EXPECT_EQ(units.units(), std::u16string(u"AB") + u'\0');
    EXPECT_EQ(units.sourceMoved, 4u);

    // A substitute in each pass, each pass's mark removed.
    EXPECT_EQ(to_unicode(CHARSET_UTF8,
                         "A\xFF"
                         "B")
                  .units(),
              std::u16string(u"A\xFFFD"
                             "B") +
                  u'\0');
    // Text that ends inside a character gives what the terminator would.
    EXPECT_EQ(to_unicode(CHARSET_UTF8, "A\xE2\x82").units(), std::u16string(u"A\xFFFD\xFFFD") + u'\0');

    // A full buffer fails at once: no rerun any more.
    before = shim::calls.size();
    Outcome full = to_unicode(CHARSET_UTF8, kText, 6);
    EXPECT_EQ(full.result, 0);
    EXPECT_EQ(full.length, 6u);
    EXPECT_EQ(full.destinationMoved, 0u);
    EXPECT_EQ(calls_to(to_unicode_cd(CHARSET_UTF8), before), 1u);

    // A converter without marks may fill the room with text, leaving none
    // for the stored terminator: failure, nothing past the room.
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
                             "A") +
                  u'\0');

    struct Case {
        const char *source;
        int result;
        uint16_t unit;
        size_t moved;
    } cases[] = {{"\xE2\x82\xAC", 1, 0x20AC, 3},
                 {"\xEF\xBB\xBF", 1, 0xFEFF, 3},
                 {"\xFF", 1, 0xFFFD, 1},
                 {"\xF0\x9F\x98\x80", 0, 0, 0}};  // a mark and a pair overflow 4 bytes
    for (const Case &c : cases) {
        const char *p = c.source;
        uint16_t unit = 0;
        uint32_t length = 0;
        EXPECT_EQ(FromCharsetToUnicode(CHARSET_UTF8, &p, &unit, &length), c.result) << c.source;
        EXPECT_EQ(unit, c.unit);
        EXPECT_EQ(static_cast<size_t>(p - c.source), c.moved);
    }
}

TEST(EngineRoom, FullDestinationFailsWithoutAnotherCall) {
    // To a charset: E2BIG ends the call; so does a "?" with no room left.
    for (const std::u16string &text : {std::u16string(u"abcdef"), std::u16string(u"ab\x20AC")}) {
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
    char bytes[4], *q = bytes;
    EXPECT_EQ(FromUnicodeToCharset(CHARSET_UTF16LE, 0x263A, &q), 0);
    const char *p = "\x42";
    uint16_t unit;
    uint32_t length;
    EXPECT_EQ(FromCharsetToUnicode(CHARSET_UTF16BE, &p, &unit, &length), 0);
    EXPECT_EQ(FromCharsetToUnicode(CHARSET_NONE, &p, &unit, &length), 0);
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
