#include <cstdio>
#include <thread>

#include <gtest/gtest.h>

#include "driver/output_stream.h"
#include "driver/stage_timer.h"
#include "lsc/apan_exception.h"
#include "tests/support/temp_dir.h"

namespace {

using driver::StageTimer;
using driver::startStageTimer;
using driver::timerLine;

using testing_support::readFile;
using testing_support::TempDir;

class OutputStreamTest : public ::testing::Test {
protected:
    void SetUp() override {
        file_ = std::tmpfile();
        stream_.setTarget(file_);
    }
    void TearDown() override { stream_.reset(); }

    std::string written() { return testing_support::readStream(file_); }

    outputStream stream_;
    std::FILE* file_ = nullptr;
};

TEST_F(OutputStreamTest, WritesNothingUntilTheLineEnds) {
    stream_ << "partial " << 42;
    stream_.flush();
    EXPECT_EQ(written(), "");
    stream_ << " line" << std::endl;
    EXPECT_EQ(written(), "partial 42 line\n");
}

TEST_F(OutputStreamTest, QuietDropsLinesForGood) {
    stream_.setQuiet(true);
    stream_ << "hidden" << std::endl;
    stream_.setQuiet(false);
    stream_ << "shown" << std::endl;
    EXPECT_EQ(written(), "shown\n");
}

TEST_F(OutputStreamTest, ThroughAPlainOstreamReferenceLinesStillEndWhole) {
    std::ostream& plain = stream_;
    plain << "a" << std::endl << "b";
    EXPECT_EQ(written(), "a\n");
    plain << std::endl;
    EXPECT_EQ(written(), "a\nb\n");
}

TEST_F(OutputStreamTest, FormatStateIsTheStreamsOwnAndPersists) {
    stream_.precision(3);
    stream_ << 0.0123456 << std::endl;
    stream_ << std::fixed << 1.23456 << std::endl;
    stream_ << 2.0 << std::endl;
    EXPECT_EQ(written(), "0.0123\n1.235\n2.000\n");
}

TEST(InfoFile, DashKeepsStandardOutput) {
    outputStream stream;
    stream.openInfoFile("-");
    EXPECT_EQ(stream.target(), stdout);
}

TEST(InfoFile, IsCreatedTruncatedAndFlushedPerLine) {
    TempDir dir;
    testing_support::writeFile(dir.file("info.txt"), "old content that must go\n");
    outputStream stream;
    stream.openInfoFile(dir.file("info.txt"));
    stream << "first" << std::endl;
    // Flushed at the end of the line: visible to another reader at once.
    EXPECT_EQ(readFile(dir.file("info.txt")), "first\n");
    stream.reset();
}

TEST(InfoFile, UnwritablePathThrowsCode240) {
    outputStream stream;
    try {
        stream.openInfoFile("/nonexistent-dir/info.txt");
        FAIL() << "expected an exception";
    } catch (const apan::exception& error) {
        EXPECT_EQ(error.code(), 240);
        EXPECT_STREQ(error.what(), "Unable to output information file.");
        EXPECT_EQ(error.hint(), "Likely a file protection issue.");
    }
}

TEST(InfoFile, AFullDeviceIsNoticed) {
    outputStream stream;
    stream.openInfoFile("/dev/full");
    stream << "line" << std::endl;
    EXPECT_TRUE(stream.writeFailed());
    stream.reset();
}

TEST(StageTimer, DisabledTimerWritesNothingAndKeepsItsMark) {
    std::ostringstream out;
    StageTimer timer = startStageTimer();
    timer.enabled = false;
    const std::clock_t before = timer.last;
    // Burn a little processor time so that the clock moves.
    volatile double sink = 0;
    for (int i = 0; i < 3000000; ++i)
        sink = sink + i * 0.5;
    timerLine(timer, "Image load time: ", out);
    EXPECT_EQ(out.str(), "");
    EXPECT_EQ(timer.last, before);
}

TEST(StageTimer, EnabledTimerWritesLabelSecondsAndSec) {
    std::ostringstream out;
    StageTimer timer = startStageTimer();
    timerLine(timer, "Image load time: ", out);
    const std::string text = out.str();
    EXPECT_EQ(text.rfind("Image load time: ", 0), 0u);
    EXPECT_EQ(text.substr(text.size() - 5), " sec\n");
    EXPECT_EQ(out.precision(), 3);
}

} // namespace
