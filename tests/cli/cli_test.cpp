// The textconv tool run as a user runs it, with the iconv program as oracle.
#include <fcntl.h>
#include <gtest/gtest.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <sstream>
#include <string>
#include <vector>

#include "test_support.h"
#include "textconv.h"

extern char **environ;

namespace {

struct Outcome {
    int status = -1;
    std::string out, err;
};

std::string slurp(const std::string &path) {
    std::ifstream in(path, std::ios::binary);
    std::ostringstream ss;
    ss << in.rdbuf();
    return ss.str();
}

std::string scratch_dir() {
    static std::string dir = [] {
        std::string pattern = testing::TempDir() + "textconv-cli-XXXXXX";
        char *made = mkdtemp(pattern.data());
        return std::string(made ? made : "/tmp");
    }();
    return dir;
}

std::string write_temp(const std::string &name, const std::string &bytes) {
    const std::string path = scratch_dir() + "/" + name;
    std::ofstream(path, std::ios::binary) << bytes;
    return path;
}

// Runs the tool with args, stdin from `input`, extra environment entries
// (NAME=value, or NAME alone to remove it), in directory cwd.
Outcome tool(const std::vector<std::string> &args, const std::string &input = "",
             const std::vector<std::string> &env = {}, const std::string &cwd = "") {
    const std::string in = write_temp("stdin", input), out = scratch_dir() + "/stdout",
                      err = scratch_dir() + "/stderr";
    std::vector<std::string> argStore{TEXTCONV_TOOL};
    argStore.insert(argStore.end(), args.begin(), args.end());
    std::vector<char *> argv;
    for (std::string &a : argStore) argv.push_back(a.data());
    argv.push_back(nullptr);

    std::vector<std::string> envStore;
    for (char **e = environ; *e; ++e) {
        std::string entry = *e, name = entry.substr(0, entry.find('='));
        bool replaced = false;
        for (const std::string &x : env) replaced |= x.substr(0, x.find('=')) == name;
        if (!replaced) envStore.push_back(entry);
    }
    for (const std::string &x : env)
        if (x.find('=') != std::string::npos) envStore.push_back(x);
    std::vector<char *> envp;
    for (std::string &e : envStore) envp.push_back(e.data());
    envp.push_back(nullptr);

    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_addopen(&actions, 0, in.c_str(), O_RDONLY, 0);
    posix_spawn_file_actions_addopen(&actions, 1, out.c_str(), O_WRONLY | O_CREAT | O_TRUNC, 0600);
    posix_spawn_file_actions_addopen(&actions, 2, err.c_str(), O_WRONLY | O_CREAT | O_TRUNC, 0600);
    char here[4096] = "/";
    if (!getcwd(here, sizeof here)) ADD_FAILURE() << "getcwd";
    if (!cwd.empty() && chdir(cwd.c_str()) != 0) ADD_FAILURE() << "chdir " << cwd;
    pid_t pid = 0;
    int rc = posix_spawn(&pid, argv[0], &actions, nullptr, argv.data(), envp.data());
    if (!cwd.empty() && chdir(here) != 0) ADD_FAILURE() << "chdir back";
    posix_spawn_file_actions_destroy(&actions);
    Outcome run;
    if (rc != 0) {
        ADD_FAILURE() << "cannot start " << argv[0];
        return run;
    }
    int status = 0;
    waitpid(pid, &status, 0);
    run.status = WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
    run.out = slurp(out);
    run.err = slurp(err);
    return run;
}

bool have_iconv() { return std::string(TEXTCONV_ICONV_PROGRAM).find("NOTFOUND") == std::string::npos; }

// The output of a shell pipeline of the iconv program reading `input`.
std::string oracle(const std::string &pipeline, const std::string &input) {
    const std::string path = write_temp("oracle-in", input);
    std::string command = "(" + pipeline + ") < '" + path + "' 2>/dev/null";
    std::FILE *pipe = popen(command.c_str(), "r");
    std::string out;
    char buffer[65536];
    size_t got;
    while (pipe && (got = std::fread(buffer, 1, sizeof buffer, pipe)) > 0) out.append(buffer, got);
    if (pipe) pclose(pipe);
    return out;
}

std::string sample(const std::string &name) {
    return slurp(std::string(TEXTCONV_SOURCE_DIR) + "/samples/" + name);
}

// Text by lines, for line-by-line comparisons.
std::vector<std::string> lines(const std::string &text) {
    std::vector<std::string> out;
    std::istringstream in(text);
    for (std::string line; std::getline(in, line);) out.push_back(line);
    return out;
}

// "87 40": bytes as the tool shows them.
std::string hex_of(const std::string &bytes) {
    std::string h = testsupport::hex(bytes);
    if (!h.empty()) h.pop_back();
    return h;
}

#define REQUIRE_ICONV() \
    if (!have_iconv()) GTEST_SKIP() << "no iconv program"

// ---- convert against the iconv program ----

struct Differential {
    const char *name;
    const char *text;     // "samples/NAME" or a corpus file
    const char *prepare;  // iconv pipeline making the input from the text, or ""
    const char *from, *to;
    const char *oracle;  // iconv pipeline the tool's output must equal
};

// Pairs where the library's rules and glibc agree on valid text. glibc's own
// "SJIS" reads 0x5C and 0x7E as yen sign and overline where the library reads
// ASCII, so Shift-JIS goes through glibc's EUC-JP for the oracle.
const Differential kDifferentials[] = {
    {"SampleSjis", "samples/japanese.sjis.txt", "", "sjis", "utf8", "iconv -f SJIS -t UTF-8"},
    {"SampleEucjp", "samples/japanese.eucjp.txt", "", "EUC-JP", "UTF-8", "iconv -f EUC-JP -t UTF-8"},
    {"SampleKoi8r", "samples/russian.koi8r.txt", "", "koi8r", "utf8", "iconv -f KOI8-R -t UTF-8"},
    {"SampleHebrew", "samples/hebrew.iso8859-8.txt", "", "hebrew", "utf8", "iconv -f ISO-8859-8 -t UTF-8"},
    {"SampleServerCp1256", "samples/server.cp1256.txt", "", "cp1256", "utf8", "iconv -f CP1256 -t UTF-8"},
    {"SampleRow13", "samples/row13.sjis.txt", "", "sjis", "utf8", "iconv -f CP932 -t UTF-8"},
    {"SjisToEucjp", "japanese.sjis.txt", "", "sjis", "eucjp", "iconv -f SJIS -t EUC-JP"},
    {"SjisToUtf8", "japanese.sjis.txt", "", "SJIS", "utf8",
     "iconv -f SJIS -t EUC-JP | iconv -f EUC-JP -t UTF-8"},
    {"ServerCp932", "japanese-lipsum.sjis.txt", "", "cp932", "utf8",
     "iconv -f SJIS -t EUC-JP | iconv -f EUC-JP -t UTF-8"},
    {"EucjpToUtf8", "japanese.eucjp.txt", "", "eucjp", "utf8", "iconv -f EUC-JP -t UTF-8"},
    {"EucjpToSjis", "japanese-lipsum.eucjp.txt", "", "eucjp", "sjis", "iconv -f EUC-JP -t SJIS"},
    {"Utf8ToSjis", "japanese.sjis.txt", "iconv -f SJIS -t UTF-8", "utf8", "sjis", "iconv -f UTF-8 -t SJIS"},
    {"Utf8ToEucjp", "japanese.eucjp.txt", "iconv -f EUC-JP -t UTF-8", "utf8", "eucjp",
     "iconv -f UTF-8 -t EUC-JP"},
    {"Koi8rToUtf8", "russian.koi8r.txt", "", "KOI8-R", "utf8", "iconv -f KOI8-R -t UTF-8"},
    {"Utf8ToKoi8r", "russian.koi8r.txt", "iconv -f KOI8-R -t UTF-8", "utf8", "koi8r",
     "iconv -f UTF-8 -t KOI8-R"},
    {"Koi8rToCp1251", "russian-lipsum.koi8r.txt", "", "koi8r", "windows-1251", "iconv -f KOI8-R -t CP1251"},
    {"Latin1ToUtf8", "french.latin1.txt", "", "latin1", "utf8", "iconv -f ISO-8859-1 -t UTF-8"},
    {"ServerCp1252", "french.latin1.txt", "", "cp1252", "utf8", "iconv -f ISO-8859-1 -t UTF-8"},
    {"ServerCp1255", "hebrew-lipsum.utf8.txt", "iconv -c -f UTF-8 -t ISO-8859-8", "cp1255", "utf8",
     "iconv -f ISO-8859-8 -t UTF-8"},
    {"Utf8ToCp1256", "arabic-lipsum.utf8.txt", "iconv -c -f UTF-8 -t CP1256 | iconv -f CP1256 -t UTF-8",
     "utf8", "cp1256", "iconv -f UTF-8 -t CP1256"},
    {"Utf8ToGbk", "chinese-lipsum.utf8.txt", "", "utf8", "gbk", "iconv -f UTF-8 -t GBK"},
    {"Gb18030ToUtf8", "chinese.utf8.txt", "iconv -f UTF-8 -t GB18030", "gb18030", "utf8",
     "iconv -f GB18030 -t UTF-8"},
    {"Utf8ToUtf8", "japanese-lipsum.utf8.txt", "", "utf8", "utf8", "cat"},
    {"Utf8ToUtf16", "english.utf8.txt", "", "utf8", "utf16", "iconv -f UTF-8 -t UTF-16"},
    {"Utf16ToUtf8", "russian-lipsum.utf8.txt", "iconv -f UTF-8 -t UTF-16", "utf16", "utf8",
     "iconv -f UTF-16 -t UTF-8"},
};

void PrintTo(const Differential &d, std::ostream *os) { *os << d.name; }

class CliConvertMatchesIconv : public testing::TestWithParam<Differential> {};

// Whole files as arguments, and standard input in small chunks that cut long
// lines between characters.
TEST_P(CliConvertMatchesIconv, ByteForByte) {
    REQUIRE_ICONV();
    const Differential &c = GetParam();
    std::string text;
    if (std::strncmp(c.text, "samples/", 8) == 0) {
        text = sample(c.text + 8);
    } else {
        auto corpus = testsupport::read_corpus(c.text);
        if (!corpus) GTEST_SKIP() << "no corpora";
        text = *corpus;
    }
    const std::string input = *c.prepare ? oracle(c.prepare, text) : text;
    ASSERT_FALSE(input.empty());
    const std::string expected = oracle(c.oracle, input);
    ASSERT_FALSE(expected.empty());

    Outcome whole = tool({"convert", "-f", c.from, "-t", c.to, write_temp("input", input)});
    EXPECT_EQ(whole.status, 0) << whole.err;
    EXPECT_EQ(whole.err, "");
    EXPECT_TRUE(whole.out == expected)
        << "differs at byte "
        << std::mismatch(whole.out.begin(), whole.out.end(), expected.begin(), expected.end()).first -
               whole.out.begin();
    Outcome chunked = tool({"convert", "--chunk-size", "61", "-f", c.from, "-t", c.to}, input);
    EXPECT_EQ(chunked.status, 0) << chunked.err;
    EXPECT_TRUE(chunked.out == expected) << "chunked output differs";
}

INSTANTIATE_TEST_SUITE_P(Texts, CliConvertMatchesIconv, testing::ValuesIn(kDifferentials),
                         [](const testing::TestParamInfo<Differential> &info) { return info.param.name; });

// A line far longer than a chunk is cut between characters, whatever their
// length in the charset, both when it is read and when it is written.
TEST(CliConvertChunks, LongLinesCutBetweenCharacters) {
    REQUIRE_ICONV();
    std::string text;
    for (int i = 0; i < 40; ++i)
        text +=
            "\xE6\x9D\xB1\xE4\xBA\xAC"
            "a\xE5\xA4\xA7\xE5\xAD\xB8"
            "1 \xE4\xB8\xAD\xE5\x9C\x8B";
    for (const char *charset :
         {"SJIS", "EUC-JP", "GB18030", "GBK", "BIG5", "BIG5HKSCS", "EUC-KR", "UTF-16", "UTF-8"}) {
        const std::string encoded = oracle(std::string("iconv -f UTF-8 -t ") + charset, text);
        ASSERT_FALSE(encoded.empty()) << charset;
        for (const char *chunk : {"16", "17", "23"}) {
            EXPECT_EQ(tool({"convert", "--chunk-size", chunk, "-f", charset, "-t", "utf8"}, encoded).out,
                      text)
                << charset << " read in chunks of " << chunk;
            EXPECT_EQ(tool({"convert", "--chunk-size", chunk, "-f", "utf8", "-t", charset}, text).out,
                      encoded)
                << charset << " written in chunks of " << chunk;
        }
    }
}

// Every KOI8-R byte, both ways.
TEST(CliConvertExhaustive, EveryKoi8rByte) {
    REQUIRE_ICONV();
    std::string koi8r;
    for (int b = 0x20; b <= 0xFF; ++b) {
        if (b != 0x7F) koi8r.push_back(static_cast<char>(b));
        if (b % 16 == 15) koi8r.push_back('\n');
    }
    Outcome decoded = tool({"convert", "-f", "koi8r", "-t", "utf8"}, koi8r);
    EXPECT_EQ(decoded.out, oracle("iconv -f KOI8-R -t UTF-8", koi8r));
    Outcome encoded = tool({"convert", "-f", "utf8", "-t", "koi8r"}, decoded.out);
    EXPECT_EQ(encoded.out, koi8r);
    EXPECT_EQ(decoded.status + encoded.status, 0);
}

// One character per line; where glibc converts a line (through the chain of
// charsets given, in process: one call per line) the tool must agree, and
// every line glibc rejects must come out as a counted substitute (row 13,
// which glibc lacks and the library's table fills, excepted).
void expect_lines_match(const std::string &input, const std::vector<std::string> &args,
                        const std::vector<const char *> &chain, const std::string &substitute,
                        unsigned char row13Lead) {
    Outcome run = tool(args, input);
    ASSERT_EQ(run.status, 0) << run.err;
    const auto in = lines(input), got = lines(run.out);
    ASSERT_EQ(got.size(), in.size());
    size_t substituted = 0, agreed = 0;
    for (size_t i = 0; i < in.size(); ++i) {
        std::optional<std::string> want = in[i];
        for (size_t k = 0; want && k + 1 < chain.size(); ++k)
            want = testsupport::iconv_convert(chain[k + 1], chain[k], *want);
        if (want) {
            EXPECT_EQ(got[i], *want) << "input " << testsupport::hex(in[i]);
            ++agreed;
        } else {
            if (static_cast<unsigned char>(in[i][0]) != row13Lead) {
                EXPECT_EQ(got[i], substitute) << "input " << testsupport::hex(in[i]);
            }
            substituted += got[i] == substitute;
        }
    }
    EXPECT_GT(agreed, 6000u);
    const std::string report = substituted ? std::to_string(substituted) + " substitution" : "";
    EXPECT_NE(run.err.find(report), std::string::npos) << run.err;
}

TEST(CliConvertExhaustive, EveryShiftJisDoubleByteCode) {
    std::string input;
    for (int lead = 0x81; lead <= 0xEF; ++lead) {
        if (lead > 0x9F && lead < 0xE0) continue;
        for (int trail = 0x40; trail <= 0xFC; ++trail) {
            if (trail == 0x7F) continue;
            input += {static_cast<char>(lead), static_cast<char>(trail), '\n'};
        }
    }
    expect_lines_match(input, {"convert", "-f", "sjis", "-t", "utf8"}, {"SJIS", "EUC-JP", "UTF-8"},
                       "\xEF\xBF\xBF", 0x87);
}

TEST(CliConvertExhaustive, EveryEucjpDoubleByteCode) {
    std::string input;
    for (int lead = 0xA1; lead <= 0xFE; ++lead)
        for (int trail = 0xA1; trail <= 0xFE; ++trail)
            input += {static_cast<char>(lead), static_cast<char>(trail), '\n'};
    expect_lines_match(input, {"convert", "-f", "eucjp", "-t", "utf8"}, {"EUC-JP", "UTF-8"}, "\xEF\xBF\xBF",
                       0xAD);
    expect_lines_match(input, {"convert", "-f", "eucjp", "-t", "sjis"}, {"EUC-JP", "SJIS"}, " ", 0xAD);
}

// ---- substitutes: counted against what the text already held ----

struct Substitution {
    const char *from, *to, *input, *output;
    int count;
};

const Substitution kSubstitutions[] = {
    // The text's own "?" is no substitute; the euro sign is.
    {"utf8", "latin1", "caf\xC3\xA9 \xE2\x82\xAC?\n", "caf\xE9 ??\n", 1},
    // A U+FFFD already in the text is not counted; a bad byte is, once, though
    // it becomes U+FFFD and then "?".
    {"utf8", "utf8", "ok \xEF\xBF\xBD \xFF\n", "ok \xEF\xBF\xBD \xEF\xBF\xBD\n", 1},
    {"utf8", "latin1", "\xFF?\n", "??\n", 1},
    {"utf8", "utf8", "x\xE3\x81", "x\xEF\xBF\xBD", 1},  // cut short at the end of the input
    // Shift-JIS: line ends and tabs kept; a lead byte before a line end and a
    // byte that starts nothing become U+FFFD; an unassigned code U+FFFF.
    {"sjis", "utf8", "A\x88\nB\x80\tC\x85\x40\n", "A\xEF\xBF\xBD\nB\xEF\xBF\xBD\tC\xEF\xBF\xBF\n", 3},
    {"sjis", "eucjp", "\x88 x\n\x82\xA0", "  x\n\xA4\xA2", 1},
    {"eucjp", "utf8", "\xA4\n\xA4\xA2\x80\n", "\xEF\xBF\xBD\n\xE3\x81\x82\xEF\xBF\xBD\n", 2},
    // JIS X 0212 has no Shift-JIS form: a space; the text's own space is not counted.
    {"eucjp", "sjis", "a b\x8F\xB0\xA1\n", "a b \n", 1},
    {"cp1252", "koi8r", "\xE9t\xE9?\n", "?t??\n", 2},
    {"koi8r", "cp1251", "\xC1\x80\n", "\xE0?\n", 1},
    {"latin1", "utf8", "\xE9\n", "\xC3\xA9\n", 0},
};

TEST(CliConvertSubstitutions, CountedAndStrict) {
    for (const Substitution &s : kSubstitutions) {
        SCOPED_TRACE(testsupport::hex(std::string(s.input)) + " " + s.from + " to " + s.to);
        Outcome plain = tool({"convert", "-f", s.from, "-t", s.to}, s.input);
        EXPECT_EQ(plain.status, 0);
        EXPECT_EQ(plain.out, s.output) << testsupport::hex(plain.out);
        if (s.count) {
            EXPECT_NE(plain.err.find(std::to_string(s.count) + " substitution"), std::string::npos)
                << plain.err;
        } else {
            EXPECT_EQ(plain.err, "");
        }
        Outcome strict = tool({"convert", "--strict", "-f", s.from, "-t", s.to}, s.input);
        EXPECT_EQ(strict.status, s.count ? 1 : 0);
        if (s.count) {
            EXPECT_NE(strict.err.find("--strict"), std::string::npos);
        }
        Outcome quiet = tool({"convert", "-q", "-f", s.from, "-t", s.to}, s.input);
        EXPECT_EQ(quiet.err, "");
    }
}

// ---- bad input, usage, missing converters ----

TEST(CliConvertErrors, NulByteIsReportedWithItsOffset) {
    std::string text;
    for (int i = 0; i < 20000; ++i) text += "line\n";  // beyond the first chunk
    Outcome late = tool({"convert", "-f", "utf8", "-t", "latin1"}, text + std::string("ab\0c", 4));
    EXPECT_EQ(late.status, 4);
    EXPECT_NE(late.err.find("NUL byte at byte offset 100002"), std::string::npos) << late.err;
    EXPECT_EQ(late.out.substr(0, 5), "line\n");  // what came before was converted
    Outcome units = tool({"convert", "-f", "utf16", "-t", "utf8"}, std::string("a\0\0\x4e\0\0", 6));
    EXPECT_EQ(units.status, 4);
    EXPECT_NE(units.err.find("0 unit at byte offset 4"), std::string::npos) << units.err;
}

TEST(CliConvertErrors, FilesNamesAndUsage) {
    Outcome missing = tool({"convert", "-f", "utf8", "-t", "utf8", "/nonexistent/in.txt"});
    EXPECT_EQ(missing.status, 4);
    EXPECT_NE(missing.err.find("/nonexistent/in.txt"), std::string::npos);
    Outcome unknown = tool({"convert", "-f", "utf8", "-t", "klingon"}, "a");
    EXPECT_EQ(unknown.status, 2);
    EXPECT_NE(unknown.err.find("klingon"), std::string::npos);
    EXPECT_EQ(tool({"convert", "-f", "cp1253", "-t", "utf8"}, "a").status, 2);  // unknown code page
    EXPECT_EQ(tool({"convert", "-f", "utf8", "-t", "cp932"}, "a").status, 2);  // a code page is a source only
    EXPECT_EQ(tool({"convert", "-t", "utf8"}, "a").status, 2);
    EXPECT_EQ(tool({"frobnicate"}).status, 2);
    // Ids, case and "local" name charsets too.
    Outcome ids = tool({"convert", "-f", "1", "-t", "Utf-8"}, "\xE9");
    EXPECT_EQ(ids.out, "\xC3\xA9");
    EXPECT_EQ(tool({"convert", "-f", "local", "-t", "utf8"}, "x", {"LC_ALL=C.UTF-8"}).out, "x");
    // Several files in a row, and -o.
    const std::string a = write_temp("a.txt", "\xE9\n"), b = write_temp("b.txt", "\xFC\n"),
                      o = scratch_dir() + "/out.txt";
    EXPECT_EQ(tool({"convert", "-f", "latin1", "-t", "utf8", "-o", o, a, b}).status, 0);
    EXPECT_EQ(slurp(o), "\xC3\xA9\n\xC3\xBC\n");
}

TEST(CliConvertErrors, MissingConverterStopsOrContinues) {
    REQUIRE_ICONV();
    if (!oracle("iconv -f UTF-8 -t UTF16-LE && echo yes", "a").empty())
        GTEST_SKIP() << "this system has a UTF16-LE converter";
    Outcome stopped = tool({"convert", "-f", "utf8", "-t", "UTF16-LE"}, "ab\xC3\xA9\n");
    EXPECT_EQ(stopped.status, 3);
    EXPECT_NE(stopped.err.find("UTF16-LE"), std::string::npos) << stopped.err;
    EXPECT_EQ(stopped.out, "");
    Outcome going = tool({"convert", "--continue", "-f", "utf8", "-t", "UTF16-LE"}, "ab\xC3\xA9\n");
    EXPECT_EQ(going.status, 0);
    EXPECT_EQ(going.out, std::string("a\0b\0?\0\n\0", 8));
    EXPECT_NE(going.err.find("1 substitution"), std::string::npos) << going.err;
    EXPECT_EQ(tool({"convert", "--continue", "--strict", "-f", "UTF16-BE", "-t", "utf8"}, "\xFF\xFE").status,
              1);
}

// On a terminal the reference host asks; "n" stops with status 3, "y" goes on.
TEST(CliConvertErrors, MissingConverterPromptOnATerminal) {
    REQUIRE_ICONV();
    if (!oracle("iconv -f UTF-8 -t UTF16-LE && echo yes", "a").empty())
        GTEST_SKIP() << "this system has a UTF16-LE converter";
    if (oracle("command -v script", "").empty()) GTEST_SKIP() << "no script program to make a terminal";
    const std::string input = write_temp("prompt.txt", "ab\n");
    for (const char *answer : {"n", "y"}) {
        const std::string command = std::string("printf '") + answer + "\\n' | script -qec '" +
                                    TEXTCONV_TOOL + " convert -f utf8 -t UTF16-LE " + input +
                                    "; echo status=$?' /dev/null";
        const std::string shown = oracle(command, "");
        EXPECT_NE(shown.find("Continue without it?"), std::string::npos) << shown;
        EXPECT_NE(shown.find(*answer == 'n' ? "status=3" : "status=0"), std::string::npos) << shown;
    }
}

TEST(CliConvertProgress, ForcedBarReachesTheEndAndClears) {
    std::string text(300000, 'x');
    Outcome run = tool({"convert", "--progress", "-f", "latin1", "-t", "utf8", write_temp("big.txt", text)});
    EXPECT_EQ(run.status, 0);
    EXPECT_EQ(run.out.size(), text.size());
    EXPECT_NE(run.err.find("%"), std::string::npos);
    EXPECT_EQ(run.err.substr(run.err.size() - 4), "\r\033[K");
    EXPECT_EQ(tool({"convert", "-f", "latin1", "-t", "utf8", write_temp("big.txt", text)}).err, "");
}

// ---- the other commands ----

TEST(CliCommands, HelpAndVersion) {
    Outcome help = tool({"--help"});
    EXPECT_EQ(help.status, 0);
    for (const char *command : {"convert", "list", "locale", "escape", "equal", "jis", "demo"}) {
        EXPECT_NE(help.out.find(command), std::string::npos) << command;
        Outcome sub = tool({command, "--help"});
        EXPECT_EQ(sub.status, 0) << command;
        EXPECT_NE(sub.out.find("Usage"), std::string::npos) << command;
    }
    Outcome version = tool({"--version"});
    EXPECT_EQ(version.status, 0);
    EXPECT_NE(version.out.find(version_info), std::string::npos);
}

// Every charset listed, and its converter columns tell what the iconv program
// can do on this system.
TEST(CliCommands, ListAgreesWithThePlatform) {
    REQUIRE_ICONV();
    Outcome run = tool({"list"});
    ASSERT_EQ(run.status, 0);
    const auto rows = lines(run.out);
    for (CharsetId id = 1; id < CHARSET_COUNT; ++id) {
        const std::string name = charsetConversion[id].iconvName;
        std::istringstream row(rows.at(id + 1));
        std::string rid, symbol, iconvName, bits, decodes, encodes;
        row >> rid >> symbol >> iconvName >> bits >> decodes >> encodes;
        EXPECT_EQ(rid, std::to_string(id));
        EXPECT_EQ(iconvName, name);
        const bool platform = !oracle("iconv -f " + name + " -t UTF-16 && echo yes", "").empty();
        EXPECT_EQ(decodes, platform ? "yes" : "no") << name;
        EXPECT_EQ(tool({"convert", "-f", std::to_string(id), "-t", "utf8"}, "a").status, platform ? 0 : 3)
            << name;
    }
}

TEST(CliCommands, LocaleTellsHowItDecided) {
    Outcome c = tool({"locale"}, "", {"LANG", "LC_ALL=C", "LC_CTYPE"});
    EXPECT_EQ(c.status, 0);
    EXPECT_NE(c.out.find("local encoding:   1 ISO-8859-1"), std::string::npos) << c.out;
    EXPECT_NE(c.out.find("'languages' table"), std::string::npos);
    Outcome utf8 = tool({"locale", "--utf8-rewrite"}, "", {"LANG", "LC_ALL=C.utf8"});
    EXPECT_NE(utf8.out.find("local encoding:   4 UTF-8"), std::string::npos) << utf8.out;
    EXPECT_NE(utf8.out.find("LC_ALL=\"C.UTF-8\""), std::string::npos) << utf8.out;
    EXPECT_EQ(tool({"locale"}, "", {"LANG", "LC_ALL=C.utf8"}).out.find("after rewrite"), std::string::npos);
}

TEST(CliCommands, EscapeMarksRuns) {
    Outcome hebrew = tool({"escape", "-f", "iso8859-8", "-i",
                           std::string(TEXTCONV_SOURCE_DIR) + "/samples/hebrew.iso8859-8.txt"});
    EXPECT_EQ(hebrew.status, 0);
    const std::string text = sample("hebrew.iso8859-8.txt");
    const size_t comma = text.find(',');
    EXPECT_EQ(hebrew.out, "%r" + text.substr(0, comma) + "%l" + text.substr(comma));
    EXPECT_EQ(tool({"escape", "50% off"}).out, "%l50%% off\n");
    EXPECT_EQ(tool({"escape", "-i", "-"}, "?!\nab\n").out, "?!\n%lab\n");
    EXPECT_EQ(tool({"escape", "-i", "-"}, std::string("a\0b", 3)).status, 4);
    EXPECT_EQ(tool({"escape"}).status, 2);
}

TEST(CliCommands, EqualExitStatus) {
    struct Case {
        std::vector<std::string> args;
        int status;
    } cases[] = {
        {{"abc", "abc"}, 0},
        {{"abc", "ABC"}, 1},
        {{"-i", "abc", "ABC"}, 0},
        {{"abc", "abcd"}, 1},
        {{"", ""}, 0},
        {{"--first", "latin1", "caf\xE9", "caf\xC3\xA9"}, 0},
        {{"--first", "sjis", "--second", "eucjp", "\x82\xA0", "\xA4\xA2"}, 0},
        {{"--first", "koi8r", "\xC1", "\xD0\xB0"}, 0},
        {{"--first", "koi8r", "\xC1", "a"}, 1},
    };
    for (const Case &c : cases) {
        std::vector<std::string> args{"equal"};
        args.insert(args.end(), c.args.begin(), c.args.end());
        Outcome run = tool(args, "", {"LC_ALL=C.UTF-8"});
        EXPECT_EQ(run.status, c.status) << testsupport::hex(c.args.back()) << run.err;
    }
    EXPECT_EQ(tool({"equal", "a"}).status, 2);
}

// Every way of naming a character shows the same forms, and the forms agree
// with the iconv program.
TEST(CliCommands, JisFormsAgree) {
    REQUIRE_ICONV();
    const std::string utf8 =
        "\xE9\xA7\x85\xE3\x81\xAE\xEF\xBD\xB6\xE2\x91\xA0";  // three JIS kinds and row 13
    for (size_t at = 0; at < utf8.size();) {
        const size_t len = (static_cast<unsigned char>(utf8[at]) >= 0xE0) ? 3 : 2;
        const std::string ch = utf8.substr(at, len);
        at += len;
        Outcome byChar = tool({"jis", ch});
        ASSERT_EQ(byChar.status, 0) << byChar.err;
        const auto field = [&](const std::string &key) {
            for (const std::string &line : lines(byChar.out))
                if (line.rfind(key, 0) == 0) return line.substr(12);
            return std::string();
        };
        const std::string sjis = field("Shift-JIS"), euc = field("EUC-JP"), unit = field("UTF-16");
        const std::string oracleCodePage = ch == "\xE2\x91\xA0" ? "CP932" : "SJIS";
        EXPECT_EQ(sjis, hex_of(oracle("iconv -f UTF-8 -t " + oracleCodePage, ch)));
        if (ch != "\xE2\x91\xA0") {
            EXPECT_EQ(euc, hex_of(oracle("iconv -f UTF-8 -t EUC-JP", ch)));
        }
        std::string sjisHex = sjis, eucHex = euc;
        sjisHex.erase(std::remove(sjisHex.begin(), sjisHex.end(), ' '), sjisHex.end());
        eucHex.erase(std::remove(eucHex.begin(), eucHex.end(), ' '), eucHex.end());
        for (const std::string &form : {unit, "0x" + sjisHex, "eucjp:" + eucHex}) {
            Outcome other = tool({"jis", form});
            EXPECT_EQ(other.out, byChar.out) << form;
        }
    }
    EXPECT_EQ(tool({"jis", "13-1"}).out, tool({"jis", "U+2460"}).out);
    EXPECT_EQ(tool({"jis", "13-93"}).status, 4);  // an empty cell of row 13
    EXPECT_EQ(tool({"jis", "0x8"}).status, 2);
}

TEST(CliCommands, DemoRunsFromAnywhere) {
    REQUIRE_ICONV();
    Outcome demo = tool({}, "", {"TEXTCONV_SAMPLES=/nonexistent"}, "/");
    EXPECT_EQ(demo.status, 0) << demo.out << demo.err;
    const std::string firstLine = lines(oracle("iconv -f SJIS -t UTF-8", sample("japanese.sjis.txt")))[0];
    EXPECT_NE(demo.out.find(firstLine), std::string::npos);
    EXPECT_EQ(demo.out.find("FAILED"), std::string::npos);
    EXPECT_EQ(tool({"demo", "--samples", "/nonexistent"}).status, 4);
}

}  // namespace
