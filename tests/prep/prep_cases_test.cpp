// Colour planes, median filter, white balance, pixel checks, delta ab, sample
// files and number lines: the cases are in tests/data/prep/prep_cases.json,
// what each gives (image, values, text or message) in prep_cases.golden. Then
// the files on disk: written, read back, and the errors of files that cannot
// be opened or written.

#include <algorithm>
#include <functional>
#include <iomanip>
#include <map>
#include <numeric>
#include <optional>
#include <sstream>
#include <stdexcept>

#include "prep/bayer_planes.h"
#include "prep/delta_ab.h"
#include "prep/delta_ab_report.h"
#include "prep/image_checks.h"
#include "prep/luminance_residual.h"
#include "prep/median_filter.h"
#include "prep/median_tree.h"
#include "prep/mosaic_preparation.h"
#include "prep/mosaic_stream.h"
#include "prep/number_line.h"
#include "prep/sample_file.h"
#include "prep/white_balance.h"
#include "tests/prep/test_images.h"
#include "tests/support/temp_dir.h"

namespace {

using img::BayerImage;
using nlohmann::json;

const std::map<std::string, std::uint32_t> kOrders = {{"RGGB", img::kCfaRggb},
                                                      {"GRBG", img::kCfaGrbg},
                                                      {"GBRG", img::kCfaGbrg},
                                                      {"BGGR", img::kCfaBggr}};

using case_data::number;

std::uint32_t cfaOf(const json& cfa) {
    return cfa.is_string() ? kOrders.at(cfa) : cfa.get<std::uint32_t>();
}

// "size": [w, h, channels], "cfa": a Bayer order or a number, "samples": values
// repeated over the image or "count" (0, 1, 2, ...), "tile": 2 x 2 values
// repeated, "set": [[index, value]], "tint": [x0, y0, x1, y1] RGB pixels whose
// top left sample becomes 0.9, "integer": 16-bit samples.
BayerImage imageOf(const json& c) {
    const json size = c["size"];
    const std::size_t count =
        size[0].get<std::size_t>() * size[1].get<std::size_t>() * size[2].get<std::size_t>();
    std::vector<float> samples(c.value("samples", json()) == "count" ? count : 0);
    std::iota(samples.begin(), samples.end(), 0.0f);
    for (const json& v : c.value("samples", json::array())) // "count" iterates as itself
        if (v != "count")
            samples.push_back(number(v));
    const json cfa = c.value("cfa", json("RGGB"));
    const std::size_t width = size[0];
    if (c.contains("tile")) {
        samples.resize(2 * width);
        for (std::size_t x = 0; x < width; ++x) {
            samples[x] = number(c["tile"][x % 2]);
            samples[width + x] = number(c["tile"][2 + x % 2]);
        }
    }
    BayerImage image = prep_test::makeImage(size[0], size[1], size[2], cfaOf(cfa), samples);
    if (c.contains("integer")) {
        int result = 0;
        image.reset(img::imageCreate(size[0], size[1], 10, 1, 1, 0, img::kCfaRggb, img::kPixelRaw,
                                     img::kBufferRawCfa, img::kDataUint16, &result));
    }
    for (const json& s : c.value("set", json::array()))
        image.pixels()[s[0].get<std::size_t>()] = number(s[1]);
    if (c.contains("tint"))
        for (std::size_t y = c["tint"][1]; y < c["tint"][3]; ++y)
            for (std::size_t x = c["tint"][0]; x < c["tint"][2]; ++x)
                image.pixels()[2 * y * width + 2 * x] = 0.9f;
    return image;
}

// Values with 9 significant digits, or `decimals` after the point where the
// last bits may differ between machines (powers, sums of many values).
std::string text(const float* values, std::size_t count, int decimals = 0) {
    std::ostringstream out;
    decimals ? out << std::fixed << std::setprecision(decimals) : out << std::setprecision(9);
    for (std::size_t i = 0; i < count; ++i)
        out << (i ? " " : "") << values[i];
    return out.str();
}

std::string text(const BayerImage& image, int decimals = 0) {
    const std::vector<float> samples = prep_test::samplesOf(image);
    std::string name = std::to_string(image.cfa());
    for (const auto& [order, cfa] : kOrders)
        if (cfa == image.cfa())
            name = order;
    return std::to_string(image.width()) + "x" + std::to_string(image.height()) + "x" +
           std::to_string(image.channels()) + " " + name +
           (image.buffer()->pixelType == img::kPixelRaw ? " raw: " : ": ") +
           (samples.size() <= 64
                ? text(samples.data(), samples.size(), decimals)
                : "min " + text(&*std::min_element(samples.begin(), samples.end()), 1, decimals) +
                      " max " +
                      text(&*std::max_element(samples.begin(), samples.end()), 1, decimals));
}

std::string text(const lsc::SampleSet& set) {
    std::string result = "levels " + text(set.targetLevels, 4);
    for (const lsc::shadingSample& s : set.samples)
        result += "\n" + std::to_string(s.x) + "," + std::to_string(s.y) + ": " + text(s.value, 4);
    return result;
}

// What case `c` gives; `out` collects what the checks print, `image` is the
// case's image.
std::string run(const json& c, std::ostream& out, BayerImage& image) {
    const std::string op = c["op"];
    if (op == "patternSize")
        return std::to_string(prep::patternSize(c["cfa0"], cfaOf(c["cfa1"])));
    if (op == "numberLine") {               // "i" an integer, "d" a decimal, else a separator
        const std::string text = c["text"]; // the line views it
        prep::NumberLine line(text);
        std::ostringstream read;
        read << std::setprecision(9);
        for (char step : c["steps"].get<std::string>()) {
            if (step == 'i')
                read << line.integer() << " ";
            else if (step == 'd')
                read << line.decimal() << " ";
            else
                line.expect(step);
        }
        line.expectEnd();
        return line.ok() ? read.str() + "ok" : "refused";
    }
    if (op == "stream") {
        const prep::MosaicPreparation settings{c["median"], c["window"], c["factor"]};
        out << (prep::MosaicStream::accepts(c["size"][0], c["size"][1], settings) ? "accepted; "
                                                                                  : "refused; ");
        prep::MosaicStream(c["size"][0], c["size"][1], settings);
        return "constructed";
    }
    if (op == "parseSamples") { // for a 648 x 486 image of sampling factor 4 by default
        const json size = c.value("size", json::array({648, 486, 4}));
        return text(prep::parseSampleFile(c["text"].get<std::string>(), size[0], size[1],
                                          {1023, size[2].get<int>()}));
    }
    if (op == "formatSamples") {
        float levels[4];
        std::vector<lsc::shadingSample> samples;
        for (int k = 0; k < 4; ++k)
            levels[k] = c["levels"][k];
        for (const json& s : c["samples"])
            samples.push_back({s[0], s[1], {s[2], s[3], s[4], s[5]}});
        return prep::formatSampleFile(levels, samples, c["size"][0], c["size"][1],
                                      {1023, c["factor"]});
    }
    if (op == "sampleFullScale")
        return std::to_string(prep::sampleFullScale(c["bits"]));
    if (op == "deltaFiles") {
        prep::DeltaAbResult r{c["columns"], c["rows"], c["deltas"],
                              c["mean"],    c["max"],  c["deviation"]};
        return prep::formatDeltaFile(r) + "---\n" + prep::formatStatsFile(r);
    }
    if (op == "deltaBound") {
        prep::checkDeltaThreshold(number(c["max"]), c["bound"]);
        return "passed";
    }
    if (op == "luminanceBound") {
        prep::checkLuminanceResidual(c["residual"].is_null() ? std::nullopt
                                                             : std::optional<float>(c["residual"]),
                                     c["bound"]);
        return "passed";
    }
    if (op == "fullScale")
        return std::to_string(prep::fullScale(c["depth"]));
    if (op == "sampleUnits")
        return std::to_string(prep::sampleUnits(c["sample"], c["scale"]));
    if (op == "medianTree") {
        prep::MedianTree tree;
        for (const json& values : {c.value("before", json::array()), c["values"]}) {
            tree.clear(); // a fresh window: what came before is gone
            for (const json& v : values)
                tree.insert(v);
        }
        return text(std::vector<float>{tree.median()}.data(), 1) + " of " +
               std::to_string(tree.valueCount());
    }
    if (op == "centreWindow") {
        const prep::CentreWindow w = prep::centreWindow(c["size"][0], c["size"][1]);
        return std::to_string(w.x0) + ".." + std::to_string(w.x1) + " x " + std::to_string(w.y0) +
               ".." + std::to_string(w.y1);
    }
    if (op == "boxSide")
        return std::to_string(prep::boxSide(c["filter"], c["factor"]));

    image = imageOf(c["image"]);
    BayerImage target;
    if (op == "prepare")
        return text(prep::prepareMosaic(image, {c["median"], c["window"], c["factor"]}));
    if (op == "split")
        return text(prep::split(image));
    if (op == "splitWeave")
        return text(prep::weave(prep::split(image), 2, 0, image.cfa()));
    if (op == "weave")
        return text(prep::weave(image, c["pattern"], 0, cfaOf(c["cfa"])));
    if (op == "downsample")
        prep::downsample(image, c["factor"], target);
    if (op == "median")
        prep::medianFilterDownsample(image, c["size"], c["factor"], target);
    if (op == "downsample" || op == "median")
        return text(target);
    float levels[4];
    if (op == "balance") {
        float targetLevels[4];
        for (int k = 0; k < 4; ++k)
            targetLevels[k] = c["levels"][k];
        prep::balanceLevels(targetLevels, image, levels);
        prep::whiteBalance(image, levels);
        return text(image);
    }
    if (op == "measureLevels") {
        prep::measureLevels(levels, image, c["awb"], 1);
        return text(levels, 4);
    }
    if (op == "statistics") {
        prep::writeStatistics(image, c["depth"], out);
        out << " then " << 1.0 / 3.0; // the stream is left fixed with two decimals
        return "";
    }
    if (op == "scanRange") {
        const prep::OutOfRangePosition p = prep::scanRange(image, c["low"], c["high"]);
        return std::to_string(p.row) + "," + std::to_string(p.column) + "," +
               std::to_string(p.channel);
    }
    const json l = c.value("limits", json::array({0, 0, 0}));
    const prep::PixelLimits limits{l[0], l[1], l[2]};
    if (op == "checkPixels")
        prep::checkPixels(image, limits, 1023, out);
    if (op == "checkRange")
        prep::checkPixelRange(image, limits, 1023, out);
    if (op == "checkPeak")
        prep::checkPeakLevel(image, limits, 1023, out);
    if (op.rfind("check", 0) == 0)
        return "passed";
    lsc::ShadingSettings settings;
    settings.deltaAbBlocks[0] = c["blocks"][0];
    settings.deltaAbBlocks[1] = c["blocks"][1];
    for (std::size_t i = 0; c.contains("ccm") && i < 9; ++i)
        settings.ccm[i / 3][i % 3] = c["ccm"][i];
    if (op == "residual") {
        const float residual = prep::luminanceResidual(image, settings).value_or(-1.0f);
        return text(&residual, 1, 5);
    }
    const prep::DeltaAbResult r = prep::evaluateDeltaAb(image, settings);
    const float statistics[3] = {r.meanChroma, r.maxDelta, r.deltaStdDev};
    return "deltas " + std::to_string(r.columns) + "x" + std::to_string(r.rows) + ": " +
           text(r.deltaImage.data(), r.deltaImage.size(), 4) + "\nmean chroma, max, deviation " +
           text(statistics, 3, 4) + "\ndisplay " + text(image, 5);
}

TEST(PrepCases, EachCaseGivesItsResultOrMessage) {
    case_data::expectTranscript(
        "prep/prep_cases.json", "prep/prep_cases.golden", [](const json& c) {
            std::ostringstream out;
            BayerImage image;
            const std::string result = case_data::outcomeOf([&] { return run(c, out, image); });
            // "unchanged": the image after a refusal, as it was.
            return out.str() + result + (c.contains("unchanged") ? "\nimage " + text(image) : "");
        });
}

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
    // Read back and written again, the file stays the same.
    prep::writeSampleFile(dir.file("again.txt"), prep::readSampleFile(path, image, {1023, 4}),
                          image, {1023, 4});
    EXPECT_EQ(testing_support::readFile(dir.file("again.txt")), testing_support::readFile(path));

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
    const prep::SampleFileScale one{1023, 1};
    const std::pair<std::function<void()>, std::string> cases[] = {
        {[&] { prep::readSampleFile(missing, image, one); },
         "Cannot open input sample file: " + missing},
        {[&] { prep::readSampleFile(dir.file("bad.txt"), image, one); },
         "Invalid format in sample file."},
        {[&] { prep::writeSampleFile(unwritable, set, image, one); },
         "Cannot open sample output file: " + unwritable},
        {[&] { prep::writeSampleFile("/dev/full", set, image, one); },
         "Cannot write sample output file: /dev/full"},
        {[&] { prep::writeDeltaFile(unwritable, result); }, "Cannot open file : " + unwritable},
        {[&] { prep::writeStatsFile(unwritable, result); }, "Cannot open file : " + unwritable},
        {[&] { prep::writeDeltaFile("/dev/full", result); }, "Cannot write file : /dev/full"},
    };
    for (const auto& [action, message] : cases)
        EXPECT_EQ(case_data::errorOf(action), message);
    EXPECT_THROW(prep::readSampleFile(missing, image, one), std::runtime_error);
    EXPECT_THROW(prep::writeSampleFile("/dev/full", set, image, one), std::runtime_error);
}

} // namespace
