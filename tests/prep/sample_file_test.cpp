#include <stdexcept>
#include <string>

#include <gtest/gtest.h>

#include "prep/sample_file.h"
#include "test_images.h"
#include "tests/support/temp_dir.h"

using testing_support::TempDir;

using lsc::SampleSet;
using lsc::shadingSample;

using img::BayerImage;

namespace {

std::string parseError(const std::string& text, std::int32_t width = 648, std::int32_t height = 486,
                       int factor = 4) {
    try {
        prep::parseSampleFile(text, width, height, {1023, factor});
    } catch (const std::runtime_error& e) {
        return e.what();
    }
    return "(no error)";
}

// A prepared image, its samples and the scale of their file.
struct Samples {
    BayerImage image;
    SampleSet set;
    prep::SampleFileScale scale;
};

Samples samplesFor(std::int32_t width, std::int32_t height, int factor) {
    Samples run;
    run.image = prep_test::makeImage(width, height);
    run.scale = {1023, factor};
    return run;
}

TEST(SampleFullScale, KeptToSixteenBits) {
    EXPECT_EQ(prep::sampleFullScale(10), 1023);
    EXPECT_EQ(prep::sampleFullScale(16), 65535);
    EXPECT_EQ(prep::sampleFullScale(17), 65535);
}

TEST(SampleFileFormat, TenBitUnitsCappedAtFullScale) {
    const float levels[4] = {0.5f, 1.0f, 0.999f, 1.2f};
    std::vector<shadingSample> samples = {{2, 4, {0.0f, 0.25f, 1.2f, -0.1f}}};
    EXPECT_EQ(prep::formatSampleFile(levels, samples, 648, 486, {1023, 1}), "512,1023,1022,1023\n"
                                                                            "648,486,4\n"
                                                                            "2,4,0,256,1023,0\n");
}

TEST(SampleFileFormat, SizeAndCoordinatesInFullResolution) {
    const float levels[4] = {0, 0, 0, 0};
    std::vector<shadingSample> samples = {{25, 12, {0, 0, 0, 0}}};
    EXPECT_EQ(prep::formatSampleFile(levels, samples, 648, 486, {1023, 4}), "0,0,0,0\n"
                                                                            "2592,1944,4\n"
                                                                            "100,48,0,0,0,0\n");
}

TEST(SampleFileParse, ScalesDownBySamplingFactor) {
    const SampleSet set = prep::parseSampleFile("1023,1023,1023,1023\n"
                                                "2592,1944,4\n"
                                                "100,50,1023,511.5,0,1023\n",
                                                648, 486, {1023, 4});
    ASSERT_EQ(set.samples.size(), 1u);
    EXPECT_EQ(set.samples[0].x, 25u);
    EXPECT_EQ(set.samples[0].y, 12u);
    EXPECT_FLOAT_EQ(set.samples[0].value[0], 1.0f);
    EXPECT_FLOAT_EQ(set.samples[0].value[1], 0.5f);
    EXPECT_FLOAT_EQ(set.targetLevels[3], 1.0f);
}

TEST(SampleFileParse, AcceptsCrLfAndBlankLines) {
    const SampleSet set = prep::parseSampleFile("\r\n1,2,3,4\r\n8,6,4\r\n\r\n0,0,1,2,3,4\r\n"
                                                "  \n2,4, 1.5,2,3,4 \n\n",
                                                8, 6, {1023, 1});
    EXPECT_EQ(set.samples.size(), 2u);
    EXPECT_FLOAT_EQ(set.targetLevels[1], 2.0f / 1023.0f);
}

TEST(SampleFileParse, FirstLineNeedsFourLevels) {
    const std::string expected = "Expecting four maximum channel values separated by commas at "
                                 "the beginning of the sample file.";
    EXPECT_EQ(parseError("1023,1023,1023\n2592,1944,4\n"), expected);
    EXPECT_EQ(parseError(""), expected);
    EXPECT_EQ(parseError("1,2,3,4,5\n2592,1944,4\n"), expected);
    EXPECT_EQ(parseError("1,2,3,4.5\n2592,1944,4\n"), expected);
}

TEST(SampleFileParse, SecondLineNeedsThreeNumbers) {
    const std::string expected = "Expecting a width, height and channel count separated by "
                                 "commas on the second line of the sample file.";
    EXPECT_EQ(parseError("1,2,3,4\n2592,1944\n"), expected);
    EXPECT_EQ(parseError("1,2,3,4\n"), expected);
    EXPECT_EQ(parseError("1,2,3,4\n2592,1944,4,\n"), expected);
}

TEST(SampleFileParse, ChannelCountMustBePositive) {
    EXPECT_EQ(parseError("1,2,3,4\n2592,1944,0\n"),
              "The channel count in the sample file must be positive.");
}

TEST(SampleFileParse, SizeMustMatchPreparedImage) {
    const std::string expected =
        "Width and height in sample file does not match input image dimensions.";
    EXPECT_EQ(parseError("1,2,3,4\n2592,1940,4\n"), expected);
    EXPECT_EQ(parseError("1,2,3,4\n648,486,4\n"), expected);
    EXPECT_EQ(parseError("1,2,3,4\n2595,1947,4\n"), "(no error)"); // divides down to 648 x 486
}

TEST(SampleFileParse, RefusesMalformedSampleLines) {
    const std::string head = "1,2,3,4\n2592,1944,4\n";
    const std::string expected = "Invalid format in sample file.";
    for (const char* line :
         {"100,50,1,2,3\n", "100,50,1,2,3,4,5\n", "100,50,1,2,3,4 junk\n", "100,50,nan,2,3,4\n",
          "100,50,1,inf,3,4\n", "100.5,50,1,2,3,4\n", "100;50;1;2;3;4\n"})
        EXPECT_EQ(parseError(head + line), expected) << line;
}

TEST(SampleFileParse, RefusesPointsOutsideTheImage) {
    const std::string head = "1,2,3,4\n2592,1944,4\n";
    const std::string expected = "A sample point in the sample file lies outside the image.";
    EXPECT_EQ(parseError(head + "2592,0,1,2,3,4\n"), expected);
    EXPECT_EQ(parseError(head + "0,1944,1,2,3,4\n"), expected);
    EXPECT_EQ(parseError(head + "-1,0,1,2,3,4\n"), expected);
    EXPECT_EQ(parseError(head + "2591,1943,1,2,3,4\n"), "(no error)");
}

// The fit's limit: 250000 points pass, one more is refused while reading.
TEST(SampleFileParse, SampleCountIsCapped) {
    std::string text = "1,2,3,4\n648,486,4\n";
    for (int i = 0; i < 250000; ++i)
        text += "0,0,1,2,3,4\n";
    EXPECT_EQ(prep::parseSampleFile(text, 162, 121, {1023, 4}).samples.size(), 250000u);
    EXPECT_EQ(parseError(text + "0,0,1,2,3,4\n", 162, 121),
              "More than 250000 sample points: a fit takes at most 250000 (raise "
              "lsc.sampling_factor, or use a sample file with fewer points).");
}

TEST(SampleFile, WrittenFileReadsBackWithSamplingFactor) {
    TempDir dir;
    Samples written = samplesFor(648, 486, 4);
    const float levels[4] = {0.5f, 0.75f, 0.7f, 0.25f};
    std::copy(levels, levels + 4, written.set.targetLevels);
    written.set.samples = {{0, 0, {0.4f, 0.6f, 0.6f, 0.2f}}, {646, 484, {0.1f, 0.3f, 0.3f, 0.05f}}};
    prep::writeSampleFile(dir.file("samples.txt"), written.set, written.image, written.scale);

    Samples read = samplesFor(648, 486, 4);
    read.set = prep::readSampleFile(dir.file("samples.txt"), read.image, read.scale);
    ASSERT_EQ(read.set.samples.size(), 2u);
    for (int k = 0; k < 4; ++k)
        EXPECT_NEAR(read.set.targetLevels[k], levels[k], 0.5 / 1023);
    for (std::size_t i = 0; i < 2; ++i) {
        EXPECT_EQ(read.set.samples[i].x, written.set.samples[i].x);
        EXPECT_EQ(read.set.samples[i].y, written.set.samples[i].y);
        for (int k = 0; k < 4; ++k)
            EXPECT_NEAR(read.set.samples[i].value[k], written.set.samples[i].value[k], 0.5 / 1023);
    }
}

TEST(SampleFile, MissingInputNamesThePath) {
    TempDir dir;
    Samples run = samplesFor(8, 8, 1);
    const std::string path = dir.file("none.txt");
    try {
        run.set = prep::readSampleFile(path, run.image, run.scale);
        FAIL();
    } catch (const std::runtime_error& e) {
        EXPECT_EQ(std::string(e.what()), "Cannot open input sample file: " + path);
    }
}

TEST(SampleFile, AFileWithABadLineIsRefused) {
    TempDir dir;
    testing_support::writeFile(dir.file("bad.txt"), "1,2,3,4\n8,8,4\n0,0,1,2,3,4\n0,0,x\n");
    const Samples run = samplesFor(8, 8, 1);
    EXPECT_THROW((void)prep::readSampleFile(dir.file("bad.txt"), run.image, run.scale),
                 std::runtime_error);
}

TEST(SampleFile, UnwritableOutputNamesThePath) {
    TempDir dir;
    const Samples run = samplesFor(8, 8, 1);
    const std::string path = dir.file("missing/samples.txt");
    try {
        prep::writeSampleFile(path, run.set, run.image, run.scale);
        FAIL();
    } catch (const std::runtime_error& e) {
        EXPECT_EQ(std::string(e.what()), "Cannot open sample output file: " + path);
    }
}

TEST(SampleFile, FullDeviceIsAWriteError) {
    const Samples run = samplesFor(8, 8, 1);
    try {
        prep::writeSampleFile("/dev/full", run.set, run.image, run.scale);
        FAIL();
    } catch (const std::runtime_error& e) {
        EXPECT_EQ(std::string(e.what()), "Cannot write sample output file: /dev/full");
    }
}

} // namespace
