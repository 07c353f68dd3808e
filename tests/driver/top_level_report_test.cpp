// How the run driver reports whatever ends a run.

#include <cstdio>

#include <gtest/gtest.h>

#include "driver/output_stream.h"
#include "driver/run.h"
#include "tests/support/temp_dir.h"

namespace {

using driver::runProgram;

class TopLevelReport : public ::testing::Test {
protected:
    void SetUp() override {
        file_ = std::tmpfile();
        messageStream.setTarget(file_);
    }
    void TearDown() override { messageStream.reset(); }

    std::string written() { return testing_support::readStream(file_); }

    int run(std::vector<const char*> args) {
        args.insert(args.begin(), "lsc");
        return runProgram(static_cast<int>(args.size()), args.data());
    }

    std::FILE* file_ = nullptr;
};

TEST_F(TopLevelReport, NoticeIsPrintedWithStatusZero) {
    EXPECT_EQ(run({"--version"}), 0);
    EXPECT_EQ(written(), "lsc version 3.8.1\n");
}

TEST_F(TopLevelReport, ParserErrorIsPrefixedWithError) {
    EXPECT_EQ(run({"--nope"}), 1);
    EXPECT_EQ(written(), "ERROR: unrecognised option '--nope'\n");
}

} // namespace
