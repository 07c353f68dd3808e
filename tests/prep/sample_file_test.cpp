// Sample files: texts and what they parse to (tests/data/prep/sample_parse.json
// and .golden), the written text, and the files.

#include <iomanip>
#include <sstream>
#include <stdexcept>
#include <string>

#include "prep/sample_file.h"
#include "tests/prep/test_images.h"
#include "tests/support/temp_dir.h"

namespace {

using testing_support::TempDir;

std::string describe(const lsc::SampleSet& set) {
    std::ostringstream out;
    out << std::setprecision(9) << "levels";
    for (float level : set.targetLevels)
        out << " " << level;
    for (const lsc::shadingSample& s : set.samples) {
        out << "\n" << s.x << "," << s.y << ":";
        for (float v : s.value)
            out << " " << v;
    }
    return out.str();
}

// Each case is parsed for a prepared 648 x 486 image of sampling factor 4
// unless it says otherwise ("size": [w, h, factor]).
TEST(SampleFile, TextsParseToSamplesOrMessages) {
    case_data::expectTranscript(
        "prep/sample_parse.json", "prep/sample_parse.golden", [](const nlohmann::json& c) {
            const nlohmann::json size = c.value("size", nlohmann::json::array({648, 486, 4}));
            std::string result;
            const std::string error = case_data::errorOf([&] {
                result = describe(prep::parseSampleFile(c["text"].get<std::string>(), size[0],
                                                        size[1], {1023, size[2].get<int>()}));
            });
            return error.empty() ? result : error;
        });
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

TEST(SampleFile, WrittenInSensorUnitsCappedAtFullScale) {
    const float levels[4] = {0.5f, 1.0f, 0.999f, 1.2f};
    std::vector<lsc::shadingSample> samples = {{2, 4, {0.0f, 0.25f, 1.2f, -0.1f}},
                                               {25, 12, {0, 0, 0, 0}}};
    EXPECT_EQ(prep::formatSampleFile(levels, samples, 648, 486, {1023, 1}),
              "512,1023,1022,1023\n648,486,4\n2,4,0,256,1023,0\n25,12,0,0,0,0\n");
    EXPECT_EQ(prep::formatSampleFile(levels, samples, 648, 486, {1023, 4}),
              "512,1023,1022,1023\n2592,1944,4\n8,16,0,256,1023,0\n100,48,0,0,0,0\n");
    EXPECT_EQ(prep::sampleFullScale(10), 1023);
    EXPECT_EQ(prep::sampleFullScale(16), 65535);
    EXPECT_EQ(prep::sampleFullScale(17), 65535);
}

TEST(SampleFile, WrittenFileReadsBackAndFileErrorsNameThePath) {
    TempDir dir;
    const img::BayerImage image = prep_test::makeImage(648, 486);
    lsc::SampleSet written;
    const float levels[4] = {0.5f, 0.75f, 0.7f, 0.25f};
    std::copy(levels, levels + 4, written.targetLevels);
    written.samples = {{0, 0, {0.4f, 0.6f, 0.6f, 0.2f}}, {646, 484, {0.1f, 0.3f, 0.3f, 0.05f}}};
    prep::writeSampleFile(dir.file("samples.txt"), written, image, {1023, 4});
    EXPECT_EQ(testing_support::readFile(dir.file("samples.txt")),
              "512,767,716,256\n2592,1944,4\n0,0,409,614,614,205\n2584,1936,102,307,307,51\n");
    EXPECT_EQ(describe(prep::readSampleFile(dir.file("samples.txt"), image, {1023, 4})),
              describe(prep::parseSampleFile(testing_support::readFile(dir.file("samples.txt")),
                                             648, 486, {1023, 4})));

    testing_support::writeFile(dir.file("bad.txt"), "1,2,3,4\n8,8,4\n0,0,1,2,3,4\n0,0,x\n");
    const std::string missing = dir.file("none.txt"), unwritable = dir.file("no/samples.txt");
    const std::pair<std::function<void()>, std::string> cases[] = {
        {[&] {
             prep::readSampleFile(missing, image, {1023, 1});
         },
         "Cannot open input sample file: " + missing},
        {[&] {
             prep::readSampleFile(dir.file("bad.txt"), prep_test::makeImage(8, 8), {1023, 1});
         },
         "Invalid format in sample file."},
        {[&] {
             prep::writeSampleFile(unwritable, written, image, {1023, 1});
         },
         "Cannot open sample output file: " + unwritable},
        {[&] {
             prep::writeSampleFile("/dev/full", written, image, {1023, 1});
         },
         "Cannot write sample output file: /dev/full"},
    };
    for (const auto& [action, message] : cases) {
        EXPECT_EQ(case_data::errorOf(action), message);
        EXPECT_THROW(action(), std::runtime_error);
    }
}

} // namespace
