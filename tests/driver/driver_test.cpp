// The run driver's own pieces: the message stream, the information file, the
// stage timer, the list of changed settings and what ends a run.

#include <cstdio>
#include <sstream>
#include <string>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include "config/config_file.h"
#include "config/parameter_table.h"
#include "driver/changed_settings.h"
#include "driver/output_stream.h"
#include "driver/run.h"
#include "driver/stage_timer.h"
#include "lsc/apan_exception.h"
#include "tests/lsc/test_helpers.h"
#include "tests/support/temp_dir.h"

namespace {

using testing_support::readStream;

class MessageStream : public ::testing::Test {
protected:
    void SetUp() override { stream.setTarget(file); }
    void TearDown() override { stream.reset(); }
    std::string written() { return readStream(file); }

    std::FILE* file = std::tmpfile();
    outputStream stream;
};

TEST_F(MessageStream, WritesWholeLinesOnlyKeepsItsFormatAndQuietDropsLines) {
    std::ostream& plain = stream; // also through a plain ostream reference
    plain << "partial " << 42;
    stream.flush();
    EXPECT_EQ(written(), "");
    plain << " line" << std::endl << "b";
    EXPECT_EQ(written(), "partial 42 line\n");
    stream << std::endl;
    stream.setQuiet(true);
    stream << "hidden" << std::endl;
    stream.setQuiet(false);
    stream.precision(3);
    stream << 0.0123456 << std::endl << std::fixed << 1.23456 << std::endl << 2.0 << std::endl;
    EXPECT_EQ(written(), "partial 42 line\nb\n0.0123\n1.235\n2.000\n");
}

TEST(InfoFile, DashKeepsStandardOutputAFileIsTruncatedAndFlushedPerLine) {
    outputStream dash;
    dash.openInfoFile("-");
    EXPECT_EQ(dash.target(), stdout);
    testing_support::TempDir dir;
    testing_support::writeFile(dir.file("info.txt"), "old content that must go\n");
    outputStream stream;
    stream.openInfoFile(dir.file("info.txt"));
    stream << "first" << std::endl;
    EXPECT_EQ(testing_support::readFile(dir.file("info.txt")), "first\n"); // seen at once
    stream.reset();
    outputStream full;
    full.openInfoFile("/dev/full");
    full << "line" << std::endl;
    EXPECT_TRUE(full.writeFailed());
    full.reset();
    const apan::exception error = lsc_test::caught([] {
        outputStream unwritable;
        unwritable.openInfoFile("/nonexistent-dir/info.txt");
    });
    EXPECT_EQ(error.code(), 240);
    EXPECT_STREQ(error.what(), "Unable to output information file.");
    EXPECT_EQ(error.hint(), "Likely a file protection issue.");
}

TEST(StageTimer, WritesLabelSecondsAndSecOnlyWhenEnabled) {
    std::ostringstream out;
    driver::StageTimer timer = driver::startStageTimer();
    timer.enabled = false;
    const std::clock_t before = timer.last;
    volatile double sink = 0; // burn a little processor time so that the clock moves
    for (int i = 0; i < 3000000; ++i)
        sink = sink + i * 0.5;
    driver::timerLine(timer, "Image load time: ", out);
    EXPECT_EQ(out.str(), "");
    EXPECT_EQ(timer.last, before);
    timer.enabled = true;
    driver::timerLine(timer, "Image load time: ", out);
    EXPECT_EQ(out.str().rfind("Image load time: ", 0), 0u);
    EXPECT_EQ(out.str().substr(out.str().size() - 5), " sec\n");
    EXPECT_EQ(out.precision(), 3);
}

TEST(ChangedSettings, OnlyChangedAndUnknownKeysAreListedInPrintOrder) {
    const auto changedAfter = [](const std::string& text) {
        config::config_node_impl root("root");
        auto& config = static_cast<config::config_node_impl&>(root.child("config"));
        config::set_defaults(config);
        config::parse_config_text(text, config);
        return driver::changedSettings(config);
    };
    EXPECT_TRUE(changedAfter("lsc.max_gain = 6; shared.block_name = reference; "
                             "apply_lsc.ccm[1] = {0.0, 1.0, 0.0};")
                    .empty()); // restated defaults
    const std::vector<std::pair<std::string, std::string>> expected = {
        {"apply_lsc.ccm[0][1]", "0.25"},
        {"custom.note", "hello"},
        {"lsc.max_gain", "4.5"},
        {"shared.bit_res", "10"},
    };
    EXPECT_EQ(changedAfter("shared.bit_res = 10; lsc.max_gain = 4.5; "
                           "apply_lsc.ccm[0][1] = 0.25; custom.note = hello;"),
              expected);
}

TEST(RunProgram, ANoticeEndsTheRunWithZeroAndAParserErrorWithOne) {
    std::FILE* file = std::tmpfile();
    messageStream.setTarget(file);
    const char* version[] = {"lsc", "--version"};
    EXPECT_EQ(driver::runProgram(2, version), 0);
    const char* wrong[] = {"lsc", "--nope"};
    EXPECT_EQ(driver::runProgram(2, wrong), 1);
    EXPECT_EQ(readStream(file), "lsc version 3.8.1\nERROR: unrecognised option '--nope'\n");
    messageStream.reset();
}

} // namespace
