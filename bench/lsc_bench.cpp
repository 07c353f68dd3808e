// Timings of the lens-shading surface: sample collection with and without the
// sample window, the least-squares fit of one channel, the whole fit of four
// channels and the correction of a 12-megapixel image.

#include <cmath>
#include <cstdint>
#include <sstream>
#include <vector>

#include <benchmark/benchmark.h>

#include "bench/bench_captures.h"
#include "image/image_buffer.h"
#include "lsc/fit_result.h"
#include "lsc/lens_shading_correction.h"
#include "lsc/lens_shading_fit.h"
#include "lsc/patch_surface.h"
#include "lsc/sample_collection.h"
#include "lsc/shading_settings.h"

using lsc::applyLensShading;
using lsc::collectSamples;
using lsc::FitDeviations;
using lsc::fitLensShading;
using lsc::FitResult;
using lsc::kChannels;
using lsc::kGridPoints;
using lsc::patchSurface;
using lsc::SampleSet;
using lsc::ShadingCorrection;
using lsc::shadingSample;
using lsc::ShadingSettings;

using img::BayerImage;

namespace {

// A lens-like flat field: each channel falls to about half at the corners.
float flatField(int x, int y, int width, int height) {
    const double dx = (x - width / 2.0) / (width / 2.0);
    const double dy = (y - height / 2.0) / (height / 2.0);
    const double r2 = 0.5 * (dx * dx + dy * dy);
    const double channel[4] = {0.45, 0.8, 0.8, 0.55};
    return static_cast<float>(channel[(x & 1) + (y & 1) * 2] / ((1 + 0.41 * r2) * (1 + 0.41 * r2)));
}

BayerImage makeFlatImage(int width, int height) {
    BayerImage image = bench::tenBitMosaic(width, height);
    float* p = image.pixels();
    for (int y = 0; y < height; ++y)
        for (int x = 0; x < width; ++x)
            p[static_cast<std::size_t>(y) * width + x] = flatField(x, y, width, height);
    return image;
}

// The prepared image of a 4000 x 3000 sensor after down-sampling by 4 in
// each plane, sampled with an angle step of 8 degrees (the default) or finer.
struct Collected {
    BayerImage levelled;
    ShadingSettings settings;
    SampleSet samples;
};
Collected collected(int angleStep) {
    Collected c;
    c.levelled = makeFlatImage(1000, 750);
    c.settings.sampleAngleStep = angleStep;
    c.settings.procSamplingFactor = 4;
    c.settings.quiet = true;
    std::ostringstream messages;
    c.samples = collectSamples(c.levelled, c.settings, messages);
    return c;
}

// The samples of a 4000 x 3000 sensor's full-resolution image (down-sampling
// 1), with the median over window x window blocks per sample; angle step 8
// (the default) or 1 (the densest grid).
void BM_CollectSamples(benchmark::State& state) {
    const BayerImage levelled = makeFlatImage(4000, 3000);
    ShadingSettings settings;
    settings.sampleWindow = static_cast<int>(state.range(0));
    settings.sampleAngleStep = static_cast<int>(state.range(1));
    settings.quiet = true;
    std::ostringstream messages;
    std::size_t count = 0;
    for (auto _ : state) {
        const SampleSet samples = collectSamples(levelled, settings, messages);
        benchmark::DoNotOptimize(samples.samples.data());
        count = samples.samples.size();
    }
    state.counters["samples"] = static_cast<double>(count);
}
BENCHMARK(BM_CollectSamples)
    ->ArgsProduct({{1, 5, 15}, {8, 1}})
    ->ArgNames({"window", "angleStep"})
    ->Unit(benchmark::kMillisecond);

void BM_PatchFitOneChannel(benchmark::State& state) {
    const Collected c = collected(8);
    const std::vector<double> xBreaks = {0, 250, 750, 1000}, yBreaks = {0, 187, 562, 750};
    std::ostringstream messages;
    for (auto _ : state) {
        patchSurface surface(3, 3, xBreaks, yBreaks);
        for (const shadingSample& s : c.samples.samples)
            surface.addValueConstraint(s.x, s.y, 1.0 / s.value[0]);
        surface.fit(1e-10, messages);
        benchmark::DoNotOptimize(surface.global(5, 5));
    }
    state.counters["samples"] = static_cast<double>(c.samples.samples.size());
}
BENCHMARK(BM_PatchFitOneChannel)->Unit(benchmark::kMillisecond);

void BM_FitLensShading(benchmark::State& state) {
    const Collected c = collected(static_cast<int>(state.range(0)));
    std::ostringstream messages;
    FitDeviations deviations;
    for (auto _ : state) {
        const FitResult fit =
            fitLensShading(c.samples, {c.levelled, true}, c.settings, messages, deviations);
        benchmark::DoNotOptimize(fit.correction.controlGrids[0][0]);
    }
    state.counters["samples"] = static_cast<double>(c.samples.samples.size());
}
BENCHMARK(BM_FitLensShading)->Arg(8)->Arg(2)->Unit(benchmark::kMillisecond);

void BM_ApplyLensShading12MP(benchmark::State& state) {
    const BayerImage image = makeFlatImage(4000, 3000);
    ShadingCorrection correction;
    for (int k = 0; k < kChannels; ++k)
        for (int i = 0; i < kGridPoints; ++i)
            correction.controlGrids[k][i] = 1.0f + 0.01f * static_cast<float>(i % 13);
    const auto step = static_cast<unsigned>(state.range(0));
    for (auto _ : state) {
        const BayerImage corrected = applyLensShading(image, correction, 0.0f, step);
        benchmark::DoNotOptimize(corrected.pixels()[0]);
    }
    const double pixels = 4000.0 * 3000.0 / static_cast<double>(state.range(0) * state.range(0));
    state.counters["pixels/s"] =
        benchmark::Counter(pixels, benchmark::Counter::kIsIterationInvariantRate);
}
BENCHMARK(BM_ApplyLensShading12MP)->Arg(1)->Arg(4)->Unit(benchmark::kMillisecond);

} // namespace
