// Image preparation at sensor size: a 12-megapixel (4000 x 3000) RGGB capture
// through split, 3 x 3 median filter with down-sampling by 4 and re-weave, as
// a run with default settings does; beside it the least a load must do (read
// the 16-bit samples from a file and normalise them), for comparison.

#include "image/image_buffer.h"
#include "prep/bayer_planes.h"
#include "prep/median_filter.h"

#include <cstdint>
#include <cstdio>
#include <string>
#include <vector>

#include <benchmark/benchmark.h>
#include <unistd.h>

namespace {

constexpr std::int32_t kWidth = 4000;
constexpr std::int32_t kHeight = 3000;

// Flat field with some noise, so the median trees see distinct values.
std::vector<std::uint16_t> sensorSamples() {
    std::vector<std::uint16_t> samples(static_cast<std::size_t>(kWidth) * kHeight);
    std::uint32_t state = 12345;
    for (auto& s : samples) {
        state = state * 1664525u + 1013904223u;
        s = static_cast<std::uint16_t>(600 + (state >> 24) % 64);
    }
    return samples;
}

BayerImage mosaicOf(const std::vector<std::uint16_t>& samples) {
    int result = 0;
    BayerImage image;
    image.reset(imageCreate(kWidth, kHeight, 10, 1, 1, 0, kCfaRggb, kPixelRaw, kBufferRawCfa,
                            kDataReal32, &result));
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

// Reading 24 MB of samples and normalising them into a new image: a lower
// bound for loading, which also parses the container.
void BM_LoadLowerBound(benchmark::State& state) {
    const std::vector<std::uint16_t> samples = sensorSamples();
    char path[] = "/tmp/prep_bench_XXXXXX";
    const int fd = mkstemp(path);
    if (fd < 0) {
        state.SkipWithError("no temporary file");
        return;
    }
    close(fd);
    std::FILE* out = std::fopen(path, "wb");
    std::fwrite(samples.data(), sizeof(std::uint16_t), samples.size(), out);
    std::fclose(out);
    std::vector<std::uint16_t> buffer(samples.size());
    for (auto _ : state) {
        // Like a load, every pass fills a new float image.
        std::FILE* in = std::fopen(path, "rb");
        const std::size_t got = std::fread(buffer.data(), sizeof(std::uint16_t), buffer.size(), in);
        std::fclose(in);
        int result = 0;
        BayerImage image;
        image.reset(imageCreate(kWidth, kHeight, 10, 1, 1, 0, kCfaRggb, kPixelRaw, kBufferRawCfa,
                                kDataReal32, &result));
        float* normalised = image.pixels();
        for (std::size_t i = 0; i < got; ++i)
            normalised[i] = static_cast<float>(buffer[i] & 1023) / 1023.0f;
        benchmark::DoNotOptimize(normalised);
    }
    unlink(path);
}
BENCHMARK(BM_LoadLowerBound)->Unit(benchmark::kMillisecond);

} // namespace
