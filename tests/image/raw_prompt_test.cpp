#include <cstdio>
#include <string>

#include <gtest/gtest.h>

#include "image/image_buffer.h"
#include "image/raw_prompt.h"

namespace img {
namespace {

// Runs the questions over a given input; returns what was written to the console.
struct Session {
    int result = 0;
    img::RawLayout layout;
    std::string out;
    std::string err;
};

std::string contents(std::FILE* file) {
    std::string text;
    std::rewind(file);
    for (int c; (c = std::fgetc(file)) != EOF;)
        text += static_cast<char>(c);
    return text;
}

Session ask(const std::string& input) {
    Session s;
    std::FILE* in = std::tmpfile();
    std::FILE* out = std::tmpfile();
    std::FILE* err = std::tmpfile();
    std::fputs(input.c_str(), in);
    std::rewind(in);
    s.result = img::askRawLayout(in, out, err, &s.layout);
    s.out = contents(out);
    s.err = contents(err);
    std::fclose(in);
    std::fclose(out);
    std::fclose(err);
    return s;
}

TEST(RawPrompt, AsksEveryQuestionInOrder) {
    const Session s = ask("640\n480\n10\n3\nn\n1\n512\n");
    EXPECT_EQ(s.result, 0);
    EXPECT_EQ(s.out, "Read input file as RAW with or without header...\n"
                     "RAW Image Width = RAW Image Height= RAW Bit Depth (1-16) = "
                     "RAW Bayer Type (1=RGGB, 2=BGGR, 3=GRBG, 4=GBRG) = "
                     "Data in Little-Endian ? (Y/N) : Number of Images = Header Size = ");
    EXPECT_EQ(s.layout.width, 640u);
    EXPECT_EQ(s.layout.height, 480u);
    EXPECT_EQ(s.layout.bitDepth, 10u);
    EXPECT_EQ(s.layout.cfa, kCfaGrbg);
    EXPECT_FALSE(s.layout.littleEndian);
    EXPECT_EQ(s.layout.images, 1u);
    EXPECT_EQ(s.layout.headerSize, 512u);
}

TEST(RawPrompt, RepeatsBitDepthAndBayerTypeUntilValid) {
    const Session s = ask("4\n4\n0\n17\n12\n5\nx\n2\ny\n1\n0\n");
    EXPECT_EQ(s.result, 0);
    const std::string depthError = "ERROR: Bit Depth must be between 1 and 16 inclusive\n";
    const std::string bayerError = "ERROR: Invalid choice of RAW Bayer Type\n";
    const std::string depth = "RAW Bit Depth (1-16) = ";
    const std::string bayer = "RAW Bayer Type (1=RGGB, 2=BGGR, 3=GRBG, 4=GBRG) = ";
    EXPECT_NE(s.out.find(depth + depthError + depth + depthError + depth + bayer + bayerError +
                         bayer + bayerError + bayer + "Data"),
              std::string::npos);
    EXPECT_EQ(s.layout.bitDepth, 12u);
    EXPECT_EQ(s.layout.cfa, kCfaBggr);
    EXPECT_TRUE(s.layout.littleEndian);
}

TEST(RawPrompt, EndOfInputFailsWithAClearLineInsteadOfLooping) {
    for (const char* input : {"", "640\n480\n", "640\n480\n99\n", "1\n1\n8\n1\nY\n1\n"}) {
        const Session s = ask(input);
        EXPECT_EQ(s.result, -2) << input;
        EXPECT_EQ(s.err, "ERROR: No answer on standard input.\n") << input;
    }
}

TEST(RawPrompt, AnswersThatAreNotNumbersAreAskedAgain) {
    const Session s = ask("wide\n-3\n 8 \n99999999999\n6\n16\n4\nY\n2\n18446744073709551615\n");
    EXPECT_EQ(s.result, 0);
    EXPECT_EQ(s.layout.width, 8u);
    EXPECT_EQ(s.layout.height, 6u);
    EXPECT_EQ(s.layout.cfa, kCfaGbrg);
    EXPECT_EQ(s.layout.headerSize, 18446744073709551615ull);
}

} // namespace
} // namespace img
