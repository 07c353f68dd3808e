// The sample and delta ab files on disk: written, read back, and the errors
// of files that cannot be opened or written.

#include <functional>
#include <stdexcept>
#include <string>

#include "prep/delta_ab_report.h"
#include "prep/sample_file.h"
#include "tests/prep/test_images.h"
#include "tests/support/temp_dir.h"

namespace {

TEST(OutputFiles, SampleFileIsWrittenReadBackAndCapped) {
    testing_support::TempDir dir;
    const img::BayerImage image = prep_test::makeImage(648, 486);
    lsc::SampleSet written;
    const float levels[4] = {0.5f, 0.75f, 0.7f, 0.25f};
    std::copy(levels, levels + 4, written.targetLevels);
    written.samples = {{0, 0, {0.4f, 0.6f, 0.6f, 0.2f}}, {646, 484, {0.1f, 0.3f, 0.3f, 0.05f}}};
    const std::string path = dir.file("samples.txt");
    prep::writeSampleFile(path, written, image, {1023, 4});
    case_data::expectGolden("prep/samples.txt", testing_support::readFile(path));
    const lsc::SampleSet read = prep::readSampleFile(path, image, {1023, 4});
    ASSERT_EQ(read.samples.size(), 2u);
    EXPECT_EQ(read.samples[1].x, 646u);
    EXPECT_EQ(read.samples[1].y, 484u);
    EXPECT_FLOAT_EQ(read.samples[1].value[3], 51.0f / 1023.0f);
    EXPECT_FLOAT_EQ(read.targetLevels[2], 716.0f / 1023.0f);

    std::string text = "1,2,3,4\n648,486,4\n"; // the fit's limit: 250000 points
    for (int i = 0; i < 250000; ++i)
        text += "0,0,1,2,3,4\n";
    EXPECT_EQ(prep::parseSampleFile(text, 162, 121, {1023, 4}).samples.size(), 250000u);
    EXPECT_EQ(case_data::errorOf([&] {
                  prep::parseSampleFile(text + "0,0,1,2,3,4\n", 162, 121, {1023, 4});
              }),
              "More than 250000 sample points: a fit takes at most 250000 (raise "
              "lsc.sampling_factor, or use a sample file with fewer points).");
}

TEST(OutputFiles, DeltaAbFilesAreWrittenByteForByte) {
    prep::DeltaAbResult result{3,    2,     {0.5f, 1.25f, 2.0f, 0.000004f, 10.123456f, 0.0f},
                               1.5f, 2.25f, 1.0f / 3.0f};
    testing_support::TempDir dir;
    prep::writeDeltaFile(dir.file("delta.csv"), result);
    prep::writeStatsFile(dir.file("stats.csv"), result);
    case_data::expectGolden("prep/delta.csv", testing_support::readFile(dir.file("delta.csv")));
    case_data::expectGolden("prep/stats.csv", testing_support::readFile(dir.file("stats.csv")));
}

TEST(OutputFiles, FilesThatCannotBeOpenedOrWrittenAreNamed) {
    testing_support::TempDir dir;
    const img::BayerImage image = prep_test::makeImage(8, 8);
    testing_support::writeFile(dir.file("bad.txt"), "1,2,3,4\n8,8,4\n0,0,1,2,3,4\n0,0,x\n");
    const std::string missing = dir.file("none.txt"), unwritable = dir.file("no/out.txt");
    const lsc::SampleSet set;
    const prep::DeltaAbResult result{1, 1, {1.0f}, 0, 0, 0};
    const std::pair<std::function<void()>, std::string> cases[] = {
        {[&] {
             prep::readSampleFile(missing, image, {1023, 1});
         },
         "Cannot open input sample file: " + missing},
        {[&] {
             prep::readSampleFile(dir.file("bad.txt"), image, {1023, 1});
         },
         "Invalid format in sample file."},
        {[&] {
             prep::writeSampleFile(unwritable, set, image, {1023, 1});
         },
         "Cannot open sample output file: " + unwritable},
        {[&] {
             prep::writeSampleFile("/dev/full", set, image, {1023, 1});
         },
         "Cannot write sample output file: /dev/full"},
        {[&] { prep::writeDeltaFile(unwritable, result); }, "Cannot open file : " + unwritable},
        {[&] { prep::writeStatsFile(unwritable, result); }, "Cannot open file : " + unwritable},
        {[&] { prep::writeDeltaFile("/dev/full", result); }, "Cannot write file : /dev/full"},
    };
    for (const auto& [action, message] : cases)
        EXPECT_EQ(case_data::errorOf(action), message);
    EXPECT_THROW(prep::readSampleFile(missing, image, {1023, 1}), std::runtime_error);
    EXPECT_THROW(prep::writeSampleFile("/dev/full", set, image, {1023, 1}), std::runtime_error);
}

} // namespace
