// textconv: the library's conversions from a shell.
#include <unistd.h>

#include <CLI/CLI.hpp>
#include <cstdio>
#include <cstdlib>

#include "tool.h"

#ifndef TEXTCONV_TOOL_VERSION
#define TEXTCONV_TOOL_VERSION "unknown"
#endif

namespace {

const char *const kExitCodes =
    "Exit status: 0 done (equal: equivalent); 1 substitutions under --strict, or not equivalent;\n"
    "2 bad command line or unknown charset; 3 a converter this system lacks (see --continue);\n"
    "4 bad input: unreadable file, NUL byte, invalid code or text.\n"
    "Run without a command for the demo. See textconv(1).";

std::string version_text() {
    std::string stamp = version_info ? version_info : "(none)";
    return std::string("textconv " TEXTCONV_TOOL_VERSION "\nlibrary build stamp: ") + stamp;
}

}  // namespace

int main(int argc, char **argv) {
    using namespace tool;
    CLI::App app{"textconv: convert text between encodings with the textconv library."};
    app.set_version_flag("--version", version_text(),
                         "Print the tool's version and the library's build stamp");
    app.footer(kExitCodes);
    app.require_subcommand(0, 1);
    app.fallthrough();

    bool keepGoing = false;
    app.add_flag(
        "--continue", keepGoing,
        "When this system lacks a converter and there is no terminal to ask on, go on with substitutes "
        "instead of stopping with exit status 3");

    ConvertOptions convert;
    auto *convertCmd = app.add_subcommand("convert", "Convert text from one charset to another");
    convertCmd->footer(
        "FROM and TO: an iconv name, id or alias from 'textconv list' (case does not matter), or 'local';\n"
        "FROM may also be cpN, text in server code page N (874 932 936 949 950 1250 1251 1252 1255 1256).\n"
        "Substitutes (?, U+FFFD, spaces, U+FFFF) are counted and reported on stderr.");
    convertCmd->add_option("-f,--from", convert.from, "Charset of the input")
        ->required()
        ->type_name("CHARSET");
    convertCmd->add_option("-t,--to", convert.to, "Charset of the output")->required()->type_name("CHARSET");
    convertCmd->add_option("-o,--output", convert.output, "Write here instead of standard output")
        ->type_name("FILE");
    convertCmd->add_flag("--strict", convert.strict, "Make any substitution an error (exit status 1)");
    convertCmd->add_flag("-q,--quiet", convert.quiet, "Do not report the number of substitutions");
    convertCmd->add_flag_function(
        "--progress", [&](int64_t) { convert.progress = 1; },
        "Show a progress bar on stderr (by default shown for files of 8 MiB or more when stderr is a "
        "terminal)");
    convertCmd->add_flag_function(
        "--no-progress", [&](int64_t) { convert.progress = 0; }, "Never show the progress bar");
    convertCmd->add_option("--chunk-size", convert.chunkSize, "Bytes converted at a time (default 65536)")
        ->check(CLI::Range(size_t{16}, size_t{1} << 30));
    convertCmd->add_option("FILE", convert.inputs, "Input files (default: standard input)")
        ->type_name("FILE");

    auto *listCmd = app.add_subcommand("list", "List the registered charsets and this system's converters");

    bool rewrite = false;
    auto *localeCmd = app.add_subcommand("locale", "Show the local encoding and how it was decided");
    localeCmd->add_flag("--utf8-rewrite", rewrite,
                        "Switch on the library's \".UTF8\" locale rewrite before the detection");

    EscapeOptions escape;
    auto *escapeCmd =
        app.add_subcommand("escape", "Mark right-to-left and left-to-right runs with %r and %l");
    escapeCmd->footer(
        "The output is in the same charset as the input; a literal % is doubled. Each line is\n"
        "escaped on its own.");
    escapeCmd->add_option("-f,--from", escape.charset, "Charset of the text (default utf8)")
        ->type_name("CHARSET");
    escapeCmd
        ->add_option("-i,--input", escape.inputFile, "Read the text from this file ('-': standard input)")
        ->type_name("FILE");
    escapeCmd->add_option("TEXT", escape.text, "The text")->type_name("TEXT");

    EqualOptions equal;
    auto *equalCmd = app.add_subcommand("equal", "Tell whether two strings hold the same text (exit 0 or 1)");
    equalCmd->footer("ENC: utf8, local, or another charset (read into UTF-8 through the library first).");
    equalCmd->add_flag("-i,--ignore-case", equal.ignoreCase,
                       "Ignore the case of letters up to U+00FF, as the current locale folds them");
    equalCmd->add_option("--first", equal.first, "Encoding of A (default utf8)")->type_name("ENC");
    equalCmd->add_option("--second", equal.second, "Encoding of B (default utf8)")->type_name("ENC");
    equalCmd->add_option("A", equal.a, "First string")->required()->type_name("STRING");
    equalCmd->add_option("B", equal.b, "Second string")->required()->type_name("STRING");

    std::string code;
    auto *jisCmd = app.add_subcommand("jis", "Show one Japanese character in every form");
    jisCmd->footer(
        std::string(jis_syntax()) +
        "\nExamples: textconv jis 0x8740; textconv jis 13-1; textconv jis U+2460; textconv jis eucjp:ADA1");
    jisCmd->add_option("CODE", code, "The character")->required()->type_name("CODE");

    std::string samples;
    auto *demoCmd =
        app.add_subcommand("demo", "A short tour of the library over the bundled samples (the default)");
    demoCmd->add_option("--samples", samples, "Folder of the sample texts")->type_name("DIR");

    try {
        app.parse(argc, argv);
    } catch (const CLI::ParseError &e) {
        const int rc = app.exit(e);
        return rc == 0 ? kExitDone : kExitUsage;
    }

    MissingConverterPolicy policy;
    policy.keepGoing = keepGoing;
    policy.interactive = isatty(STDIN_FILENO);
    // The reference host answers its question from this variable when there
    // is no terminal; the tool has already decided by then.
    // The demo goes on past a missing converter and shows the step as failed.
    const bool demo = !*convertCmd && !*listCmd && !*localeCmd && !*escapeCmd && !*equalCmd && !*jisCmd;
    setenv("TEXTCONV_HOST_ANSWER", keepGoing || demo ? "yes" : "no", 1);
    convert.policy = escape.policy = equal.policy = policy;
    if (demo) policy.keepGoing = true;

    watch_library_exit(true);
    int rc = kExitDone;
    try {
        if (*convertCmd)
            rc = run_convert(convert);
        else if (*listCmd)
            rc = run_list();
        else if (*localeCmd)
            rc = run_locale(rewrite);
        else if (*escapeCmd) {
            escape.haveText = escapeCmd->count("TEXT") > 0;
            rc = run_escape(escape);
        } else if (*equalCmd)
            rc = run_equal(equal);
        else if (*jisCmd)
            rc = run_jis(code, policy);
        else
            rc = run_demo(samples, policy);
    } catch (const Failure &failure) {
        std::fflush(stdout);
        std::fprintf(stderr, "textconv: error: %s\n", failure.what());
        rc = failure.code;
    } catch (const std::exception &e) {
        std::fflush(stdout);
        std::fprintf(stderr, "textconv: error: %s\n", e.what());
        rc = kExitBadInput;
    }
    watch_library_exit(false);
    if (std::fflush(stdout) != 0 && rc == kExitDone) rc = kExitBadInput;
    return rc;
}
