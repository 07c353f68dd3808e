// The tool's front door, run as a user runs it: help, version, the option
// groups, the combination checks and the parser's own errors.

#include "tests/support/temp_dir.h"
#include "tests/support/tool_runner.h"

#include <gtest/gtest.h>

using testing_support::runTool;

namespace {

const char kVersionLine[] = "lsc version 3.8.1\n";
const char kUsage[] = "Use --help to print out all the options.\n";

TEST(CommandLine, VersionPrintsOneLineAndWinsOverHelp) {
    for (const auto& args : {std::vector<std::string>{"--version"}, {"-V"}, {"-V", "-H"},
                             {"--help", "--version", "--kq"}}) {
        const auto result = runTool(args);
        EXPECT_EQ(result.status, 0);
        EXPECT_EQ(result.out, kVersionLine);
        EXPECT_EQ(result.err, "");
    }
}

TEST(CommandLine, HelpListsOnlyTheBasicGroupWithoutKq) {
    const auto result = runTool({"--help"});
    EXPECT_EQ(result.status, 0);
    EXPECT_EQ(result.out.rfind("lsc version 3.8.1\nOptions:\n", 0), 0u) << result.out;
    for (const char* text :
         {"-i [ --input ] arg", "The input kqraw bayer image file.", "-u [ --inputasjpeg ] arg",
          "-w [ --inputasbmp ] arg", "-r [ --raw ] arg", "-z [ --translate ] arg",
          "-c [ --config ] arg", "-l [ --calibrate ] arg", "-a [ --autofocus ] arg",
          "-b [ --binary ] arg", "filename to store binary calibration data.", "-f [ --flat ] arg",
          "-j [ --jpeg ] arg", "-m [ --bmp ] arg", "-x [ --xtest ]", "-V [ --version ]",
          "Print version string.", "-H [ --help ]", "Print this help message."})
        EXPECT_NE(result.out.find(text), std::string::npos) << text;
    EXPECT_EQ(result.out.find("Advanced Options"), std::string::npos);
    EXPECT_EQ(result.out.find("--kq"), std::string::npos);
}

TEST(CommandLine, HelpWithKqListsBothGroups) {
    const auto result = runTool({"--kq", "-H"});
    EXPECT_EQ(result.status, 0);
    for (const char* text :
         {"Advanced Options:", "--kq", "Enable advanced options.", "-s [ --samples ] arg",
          "-o [ --outsamples ] arg", "-p [ --preproc ] arg", "-n [ --nodelta ]",
          "Skip the delta ab check.", "-d [ --delta ] arg", "-t [ --stats ] arg", "--log arg",
          "--debug", "Enable debug mode.", "-I [ --ignore ]", "error code 257.",
          "-q [ --quiet ]", "-v [ --verbose ]", "-i [ --input ] arg"})
        EXPECT_NE(result.out.find(text), std::string::npos) << text;
    // The help library wraps lines, so check the log option's two blanks unwrapped.
    EXPECT_NE(result.out.find("The name of the output info file.  \"-\" means use"),
              std::string::npos);
}

TEST(CommandLine, NoArgumentsListsThreeProblemsAndExitsZero) {
    const auto result = runTool({});
    EXPECT_EQ(result.status, 0);
    EXPECT_EQ(result.err, "ERROR: Configuration file must be specified.\n"
                          "ERROR: Input image file or input sample file must be specified.\n"
                          "ERROR: Must specify either an output calibration register file or "
                          "output sample file.\n");
    EXPECT_EQ(result.out, kUsage);
}

TEST(CommandLine, OutSamplesWithoutInputIsReported) {
    const auto result = runTool({"--kq", "-c", "a.cfg", "-s", "in.txt", "-o", "out.txt"});
    EXPECT_EQ(result.status, 0);
    EXPECT_EQ(result.err, "ERROR: Input image file must be specified when storing samples.\n");
    EXPECT_EQ(result.out, kUsage);
}

TEST(CommandLine, EachMissingPieceAloneIsReported) {
    auto result = runTool({"-i", "x.kqraw", "-l", "out.txt"});
    EXPECT_EQ(result.err, "ERROR: Configuration file must be specified.\n");
    result = runTool({"-c", "a.cfg", "-i", "x.kqraw"});
    EXPECT_EQ(result.err,
              "ERROR: Must specify either an output calibration register file or output sample "
              "file.\n");
    EXPECT_EQ(result.out, kUsage);
    EXPECT_EQ(result.status, 0);
}

TEST(CommandLine, ParserErrorsEndWithStatusOne) {
    struct Case {
        std::vector<std::string> args;
        std::string out;
    };
    const Case cases[] = {
        {{"--bogus"}, "ERROR: unrecognised option '--bogus'\n"},
        {{"--input"}, "ERROR: the required argument for option '--input' is missing\n"},
        {{"-i", "a", "-i", "b"}, "ERROR: option '--input' cannot be specified more than once\n"},
        {{"-x", "-x"}, "ERROR: option '--xtest' cannot be specified more than once\n"},
        // Advanced options need --kq, even when given in short form.
        {{"--samples", "f"}, "ERROR: unrecognised option '--samples'\n  --samples needs --kq\n"},
        {{"-s", "f"}, "ERROR: unrecognised option '-s'\n  -s needs --kq\n"},
        {{"--log", "x"}, "ERROR: unrecognised option '--log'\n  --log needs --kq\n"},
        {{"--kq", "--debug", "--debug"},
         "ERROR: option '--debug' cannot be specified more than once\n"},
    };
    for (const Case& c : cases) {
        const auto result = runTool(c.args);
        EXPECT_EQ(result.status, 1) << c.out;
        EXPECT_EQ(result.out, c.out);
        EXPECT_EQ(result.err, "");
    }
}

TEST(CommandLine, AdvancedOptionsAreAcceptedWithKq) {
    // Accepted by the parser: only the combination checks remain to complain.
    const auto result =
        runTool({"--kq", "--samples", "s.txt", "--verbose", "--ignore", "-q", "--debug"});
    EXPECT_EQ(result.status, 0);
    EXPECT_EQ(result.err,
              "ERROR: Configuration file must be specified.\n"
              "ERROR: Must specify either an output calibration register file or output sample "
              "file.\n");
    EXPECT_EQ(result.out, kUsage);
}

} // namespace
