// Image preparation at sensor size: a 12-megapixel (4000 x 3000) RGGB capture
// through split, 3 x 3 median filter with down-sampling by 4 and re-weave, as
// a run with default settings does; beside it the load of the same capture.

#include <cstdint>
#include <string>
#include <vector>

#include <benchmark/benchmark.h>

#include "bench/bench_captures.h"
#include "image/image_buffer.h"
#include "prep/bayer_planes.h"
#include "prep/median_filter.h"
#include "tools/flatfield/flat_field.h"

#include <unistd.h>

using img::BayerImage;
using img::kCfaRggb;

namespace {

constexpr std::int32_t kWidth = 4000;
constexpr std::int32_t kHeight = 3000;

// Flat field with some noise, so the median trees see distinct values.
std::vector<std::uint16_t> sensorSamples() {
    std::vector<std::uint16_t> samples(static_cast<std::size_t>(kWidth) * kHeight);
    bench::noisyFlatCodes(samples.size(),
                          [&](std::size_t i, std::uint16_t code) { samples[i] = code; });
    return samples;
}

BayerImage mosaicOf(const std::vector<std::uint16_t>& samples) {
    BayerImage image = bench::tenBitMosaic(kWidth, kHeight);
    for (std::size_t i = 0; i < samples.size(); ++i)
        image.pixels()[i] = static_cast<float>(samples[i] & 1023) / 1023.0f;
    return image;
}

void BM_PrepareDefault(benchmark::State& state) {
    const BayerImage mosaic = mosaicOf(sensorSamples());
    for (auto _ : state) {
        const BayerImage planes = prep::split(mosaic);
        BayerImage reduced;
        prep::medianFilterDownsample(planes, 3, 4, reduced);
        const BayerImage prepared = prep::weave(reduced, 2, 0, kCfaRggb);
        benchmark::DoNotOptimize(prepared.pixels());
    }
    state.SetItemsProcessed(state.iterations() * kWidth * kHeight);
}
BENCHMARK(BM_PrepareDefault)->Unit(benchmark::kMillisecond);

void BM_Split(benchmark::State& state) {
    const BayerImage mosaic = mosaicOf(sensorSamples());
    for (auto _ : state) {
        const BayerImage planes = prep::split(mosaic);
        benchmark::DoNotOptimize(planes.pixels());
    }
}
BENCHMARK(BM_Split)->Unit(benchmark::kMillisecond);

void BM_MedianFilterDownsample(benchmark::State& state) {
    const BayerImage planes = prep::split(mosaicOf(sensorSamples()));
    const int size = static_cast<int>(state.range(0));
    const int factor = static_cast<int>(state.range(1));
    for (auto _ : state) {
        BayerImage reduced;
        prep::medianFilterDownsample(planes, size, factor, reduced);
        benchmark::DoNotOptimize(reduced.pixels());
    }
}
BENCHMARK(BM_MedianFilterDownsample)
    ->Args({3, 4})
    ->Args({3, 1})
    ->Args({10, 4})
    ->Unit(benchmark::kMillisecond);

// Loading the same capture from a KQRAW2 file, for comparison.
void BM_LoadKqraw2(benchmark::State& state) {
    flatfield::FlatFieldShape shape;
    shape.width = kWidth;
    shape.height = kHeight;
    shape.noise = 0.01;
    const std::string bytes = flatfield::kqraw2FileBytes(flatfield::makeFlatField(shape));
    char path[] = "/tmp/prep_bench_XXXXXX";
    const int fd = mkstemp(path);
    if (fd < 0 || write(fd, bytes.data(), bytes.size()) != static_cast<ssize_t>(bytes.size())) {
        state.SkipWithError("cannot write the capture");
        return;
    }
    close(fd);
    for (auto _ : state) {
        BayerImage image;
        image.read(path);
        benchmark::DoNotOptimize(image.pixels());
    }
    unlink(path);
}
BENCHMARK(BM_LoadKqraw2)->Unit(benchmark::kMillisecond);

} // namespace
