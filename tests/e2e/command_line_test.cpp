// The tool's front door, run as a user runs it: help, version, the option
// groups, the combination checks and the parser's own errors.

#include <gtest/gtest.h>

#include "tests/e2e/e2e_fixture.h"

using testing_support::runTool;

namespace {

const char kVersionLine[] = "lsc version 3.8.1\n";
const char kUsage[] = "Use --help to print out all the options.\n";

TEST(CommandLine, VersionPrintsOneLineAndWinsOverHelp) {
    for (const auto& args : {std::vector<std::string>{"--version"},
                             {"-V"},
                             {"-V", "-H"},
                             {"--help", "--version", "--kq"},
                             {"-h", "-V"},
                             {"--kq", "-V", "-h"}}) {
        const auto result = runTool(args);
        EXPECT_EQ(result.status, 0);
        EXPECT_EQ(result.out, kVersionLine);
        EXPECT_EQ(result.err, "");
    }
}

// The help text whole: the version line, the usage line, then the option
// groups as the option library lays them out; "-h" is "-H" in every use.
TEST(CommandLine, HelpPrintsTheWholeHelpText) {
    struct Case {
        std::vector<std::string> args;
        const char* golden;
    };
    const Case cases[] = {
        {{"--help"}, "help.txt"},
        {{"-H"}, "help.txt"},
        {{"-h"}, "help.txt"},
        {{"-h", "-c", "a.cfg"}, "help.txt"},
        {{"--kq", "-H"}, "help_kq.txt"},
        {{"-h", "--kq"}, "help_kq.txt"},
        {{"--kq", "--help", "-q"}, "help_kq.txt"},
    };
    for (const Case& c : cases) {
        const auto result = runTool(c.args);
        EXPECT_EQ(result.status, 0) << c.args.front();
        EXPECT_EQ(result.err, "");
        e2e::expectGolden(result.out, c.golden);
    }
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
        {{"-x", "-x"}, "ERROR: option '--xtest' cannot be specified more than once\n"},
        {{"-h", "-H"}, "ERROR: option '--help' cannot be specified more than once\n"},
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
