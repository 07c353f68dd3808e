// The one-pass preparation of a 12-megapixel (4000 x 3000) RGGB capture with
// the default settings (3 x 3 median, down-sampling by 4), beside the same
// work in three steps (split, filter, weave) that it replaces.

#include <cstdint>
#include <vector>

#include <benchmark/benchmark.h>

#include "bench/bench_captures.h"
#include "image/image_buffer.h"
#include "prep/bayer_planes.h"
#include "prep/median_filter.h"
#include "prep/mosaic_preparation.h"

using img::BayerImage;
using img::kCfaRggb;

namespace {

constexpr std::int32_t kWidth = 4000;
constexpr std::int32_t kHeight = 3000;

// A flat field with some noise, so the windows hold distinct values.
BayerImage noisyCapture() {
    BayerImage image = bench::tenBitMosaic(kWidth, kHeight);
    bench::noisyFlatCodes(std::size_t{kWidth} * kHeight, [&](std::size_t i, std::uint16_t code) {
        image.pixels()[i] = static_cast<float>(code) / 1023.0f;
    });
    return image;
}

void BM_PrepareMosaic(benchmark::State& state) {
    const BayerImage mosaic = noisyCapture();
    const prep::MosaicPreparation settings{true, static_cast<int>(state.range(0)),
                                           static_cast<int>(state.range(1))};
    for (auto _ : state) {
        const BayerImage prepared = prep::prepareMosaic(mosaic, settings);
        benchmark::DoNotOptimize(prepared.pixels());
    }
    state.SetItemsProcessed(state.iterations() * kWidth * kHeight);
}
BENCHMARK(BM_PrepareMosaic)->Args({3, 4})->Args({5, 4})->Unit(benchmark::kMillisecond);

void BM_PrepareInThreeSteps(benchmark::State& state) {
    const BayerImage mosaic = noisyCapture();
    const int size = static_cast<int>(state.range(0));
    const int factor = static_cast<int>(state.range(1));
    for (auto _ : state) {
        const BayerImage planes = prep::split(mosaic);
        BayerImage reduced;
        prep::medianFilterDownsample(planes, size, factor, reduced);
        const BayerImage prepared = prep::weave(reduced, 2, 0, kCfaRggb);
        benchmark::DoNotOptimize(prepared.pixels());
    }
    state.SetItemsProcessed(state.iterations() * kWidth * kHeight);
}
BENCHMARK(BM_PrepareInThreeSteps)->Args({3, 4})->Args({5, 4})->Unit(benchmark::kMillisecond);

} // namespace
