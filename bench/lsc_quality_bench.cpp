// How flat the correction leaves a noisy flat field, for each lsc.sample_window.
//
// Generated 2000 x 1500 flat fields with 0.5% noise and 200 defective pixels,
// optical axis centred or off-centre, five noise seeds each, are prepared by
// the built tool (as a run with shared.proc_sampling_factor = 1 prepares
// them, with the median filter on as by default or off; build the target lsc
// in the same build directory first). On that prepared image the samples are
// collected, the surface is fitted and the correction applied with
// apply_lsc.sampling_factor = 1, as the run does (before white balance, so
// nothing is clipped or quantised).
//
// For each channel the program reports the largest deviation of an 8 x 8-pixel
// block mean from the mean of all blocks, in percent, averaged over the seeds:
// in the corrected image (R, GR, GB, B) and in the prepared image divided by
// the generator's exact shading (floorR ... floorB), and the largest ratio of
// the two over the channels. The defective pixels themselves are left out of
// the block means (the fit still sees them when the median filter is off), so
// the floor is what noise leaves. With the median filter, the floor also holds
// what the filter does to the steep shading near the corners, which the fit
// follows and the exact shading does not.

#include <algorithm>
#include <cmath>
#include <iterator>
#include <map>
#include <sstream>
#include <stdexcept>
#include <string>
#include <tuple>
#include <vector>

#include <benchmark/benchmark.h>

#include "image/bayer_image.h"
#include "lsc/fit_result.h"
#include "lsc/lens_shading_correction.h"
#include "lsc/lens_shading_fit.h"
#include "lsc/sample_collection.h"
#include "lsc/shading_settings.h"
#include "tests/support/temp_dir.h"
#include "tests/support/tool_runner.h"
#include "tools/flatfield/flat_field.h"

using lsc::applyLensShading;
using lsc::collectSamples;
using lsc::FitDeviations;
using lsc::fitLensShading;
using lsc::FitResult;
using lsc::levelledImage;
using lsc::SampleSet;
using lsc::ShadingSettings;

using img::BayerImage;

namespace {

using flatfield::FlatField;
using flatfield::FlatFieldShape;

constexpr int kBlock = 8;

constexpr std::uint32_t kSeeds[] = {21, 22, 23, 24, 25};

FlatFieldShape benchShape(bool offCentre, std::uint32_t seed) {
    FlatFieldShape shape;
    shape.width = 2000;
    shape.height = 1500;
    shape.noise = 0.005;
    shape.defects = 200;
    if (offCentre) {
        shape.centerX = 0.4;
        shape.centerY = 0.6;
    }
    shape.seed = seed;
    return shape;
}

struct PreparedField {
    FlatField field;
    BayerImage prepared;
    std::vector<bool> defect; // per pixel
    std::string error;        // what the tool said when it could not prepare the field
};

// The tool's prepared image of the bench's flat field, made once per case.
const PreparedField& preparedField(bool offCentre, bool medianFilter, std::uint32_t seed) {
    static std::map<std::tuple<bool, bool, std::uint32_t>, PreparedField> cache;
    const auto key = std::make_tuple(offCentre, medianFilter, seed);
    auto found = cache.find(key);
    if (found != cache.end())
        return found->second;
    PreparedField& entry = cache[key];
    entry.field = flatfield::makeFlatField(benchShape(offCentre, seed));
    entry.defect.assign(entry.field.samples.size(), false);
    for (std::size_t at : entry.field.hotPixels)
        entry.defect[at] = true;
    for (std::size_t at : entry.field.deadPixels)
        entry.defect[at] = true;
    testing_support::TempDir dir;
    testing_support::writeFile(dir.file("flat.kqraw"), flatfield::kqraw2FileBytes(entry.field));
    // Without the filter the defects stay, and the pixel limits must let them through.
    testing_support::writeFile(dir.file("lsc.cfg"), medianFilter
                                                        ? "shared.proc_sampling_factor = 1;\n"
                                                        : "shared.proc_sampling_factor = 1;\n"
                                                          "proc.median_filter_flag = 0;\n"
                                                          "proc.min_pixel_val = 0;\n"
                                                          "proc.max_pixel_val = 1023;\n"
                                                          "lsc.max_rms_err = 1;\n"
                                                          "lsc.max_err = 1;\n");
    const auto result =
        testing_support::runTool({"--kq", "--config", "lsc.cfg", "--input", "flat.kqraw",
                                  "--calibrate", "cal.txt", "--preproc", "prepared.kqraw"},
                                 dir.path());
    // The prepared image is written before the fit, so a run that fails
    // later (a dead pixel on a sample, say) still leaves it.
    if (testing_support::fileExists(dir.file("prepared.kqraw")))
        entry.prepared.read(dir.file("prepared.kqraw"));
    else
        entry.error = "lsc failed: " + result.out + result.err;
    return entry;
}

// Largest relative deviation of each channel's block means from their mean,
// leaving out the defective pixels; `value(x, y)` gives the pixel to average.
template <typename F>
std::vector<double> worstBlockDeviations(const PreparedField& input, F value) {
    const FlatField& field = input.field;
    const int width = field.shape.width, height = field.shape.height;
    std::vector<double> worst(4, 0.0);
    for (int k = 0; k < 4; ++k) {
        std::vector<double> means;
        for (int by = 0; by + kBlock <= height; by += kBlock)
            for (int bx = 0; bx + kBlock <= width; bx += kBlock) {
                double sum = 0.0;
                int count = 0;
                for (int y = by; y < by + kBlock; ++y)
                    for (int x = bx; x < bx + kBlock; ++x)
                        if (field.channelAt(x, y) == k &&
                            !input.defect[static_cast<std::size_t>(y) * width + x]) {
                            sum += value(x, y);
                            ++count;
                        }
                if (count > 0)
                    means.push_back(sum / count);
            }
        double mean = 0.0;
        for (double m : means)
            mean += m;
        mean /= static_cast<double>(means.size());
        double& channelWorst = worst[static_cast<std::size_t>(k)];
        for (double m : means)
            channelWorst = std::max(channelWorst, std::fabs(m / mean - 1.0));
    }
    return worst;
}

// The run's fit settings with lsc.sample_window = window; the default error
// bounds are opened without the median filter so that every window is measured.
ShadingSettings runSettings(int window, bool medianFilter) {
    ShadingSettings settings;
    settings.sampleAngleStep = 8;
    settings.procSamplingFactor = 1;
    settings.applyStep = 1;
    settings.sampleWindow = window;
    settings.quiet = true;
    if (!medianFilter) {
        settings.maxRmsError = 1.0f;
        settings.maxError = 1.0f;
    }
    return settings;
}

// The corrected image of one prepared field, as the run corrects it.
BayerImage correctedImage(const PreparedField& input, int window, bool medianFilter) {
    std::ostringstream messages;
    const ShadingSettings settings = runSettings(window, medianFilter);
    const BayerImage levelled = levelledImage(input.prepared, settings.blackLevel);
    const SampleSet samples = collectSamples(levelled, settings, messages);
    FitDeviations deviations;
    const FitResult fit = fitLensShading(samples, {levelled, true}, settings, messages, deviations);
    return applyLensShading(input.prepared, fit.correction, settings.blackLevel,
                            settings.applyStep);
}

void BM_FlatnessAfterCorrection(benchmark::State& state) {
    const int window = static_cast<int>(state.range(0));
    const bool offCentre = state.range(1) != 0;
    const bool medianFilter = state.range(2) != 0;
    std::vector<const PreparedField*> inputs;
    for (std::uint32_t seed : kSeeds) {
        inputs.push_back(&preparedField(offCentre, medianFilter, seed));
        if (!inputs.back()->error.empty()) {
            state.SkipWithError(inputs.back()->error.c_str());
            return;
        }
    }

    std::vector<double> flat(4, 0.0), floor(4, 0.0);
    for (auto _ : state) {
        for (const PreparedField* input : inputs) {
            const std::size_t width = static_cast<std::size_t>(input->field.shape.width);
            BayerImage correctedField;
            try {
                correctedField = correctedImage(*input, window, medianFilter);
            } catch (const std::exception& error) {
                state.SkipWithError(error.what()); // as the run would end
                break;
            }
            const float* corrected = correctedField.pixels();
            const float* prepared = input->prepared.pixels();
            const std::vector<double> seedFlat = worstBlockDeviations(
                *input, [&](int x, int y) { return corrected[y * width + x]; });
            const std::vector<double> seedFloor = worstBlockDeviations(*input, [&](int x, int y) {
                return prepared[y * width + x] /
                       input->field.level(input->field.channelAt(x, y), x, y);
            });
            for (std::size_t k = 0; k < 4; ++k) {
                flat[k] += seedFlat[k] / std::size(kSeeds);
                floor[k] += seedFloor[k] / std::size(kSeeds);
            }
        }
    }
    if (state.error_occurred())
        return;

    const char* names[4] = {"R", "GR", "GB", "B"};
    double ratio = 0.0;
    for (std::size_t k = 0; k < 4; ++k) {
        state.counters[names[k]] = flat[k] * 100.0;
        state.counters[std::string("floor") + names[k]] = floor[k] * 100.0;
        ratio = std::max(ratio, flat[k] / floor[k]);
    }
    state.counters["ratio"] = ratio;
}
// Arguments: sample window, optical axis off-centre (0 or 1), median filter (0 or 1).
BENCHMARK(BM_FlatnessAfterCorrection)
    ->ArgsProduct({{1, 3, 5, 9}, {0, 1}, {0, 1}})
    ->ArgNames({"window", "offCentre", "median"})
    ->Iterations(1)
    ->Unit(benchmark::kMillisecond);

} // namespace
