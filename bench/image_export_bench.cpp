// Demosaic and JPEG output of a 12-megapixel sensor image, the path every
// flattened image takes on its way to the operator.

#include <cstdint>
#include <cstdio>
#include <string>

#include <benchmark/benchmark.h>

#include "image/demosaic.h"
#include "image/image_buffer.h"
#include "image/image_save.h"

#include <unistd.h>

using img::demosaicToRgb8;
using img::imageCreate;
using img::ImagePtr;
using img::imageSave;
using img::kBufferRawCfa;
using img::kCfaRggb;
using img::kDataReal32;
using img::kPixelRaw;

namespace {

constexpr std::int32_t kWidth = 4000;
constexpr std::int32_t kHeight = 3000;

// A flat field with fall-off towards the corners and a little texture, so
// the encoder has something other than one flat colour to compress.
ImagePtr flatField() {
    int result = 0;
    ImagePtr image(imageCreate(kWidth, kHeight, 10, 1, 1, 0, kCfaRggb, kPixelRaw, kBufferRawCfa,
                               kDataReal32, &result));
    auto* samples = static_cast<float*>(image->data);
    for (std::int32_t y = 0; y < kHeight; ++y) {
        for (std::int32_t x = 0; x < kWidth; ++x) {
            const float dx = static_cast<float>(x - kWidth / 2) / kWidth;
            const float dy = static_cast<float>(y - kHeight / 2) / kHeight;
            const float texture = static_cast<float>((x * 7 + y * 13) % 17) / 1700.0f;
            samples[static_cast<std::size_t>(y) * kWidth + x] =
                0.8f - (dx * dx + dy * dy) + texture;
        }
    }
    return image;
}

void BM_Demosaic12Mp(benchmark::State& state) {
    const ImagePtr source = flatField();
    for (auto _ : state) {
        int result = 0;
        ImagePtr rgb(demosaicToRgb8(source.get(), &result));
        benchmark::DoNotOptimize(rgb.get());
    }
    state.SetItemsProcessed(state.iterations() * kWidth * kHeight);
}
BENCHMARK(BM_Demosaic12Mp)->Unit(benchmark::kMillisecond);

void BM_DemosaicAndJpeg12Mp(benchmark::State& state) {
    const ImagePtr source = flatField();
    char pattern[] = "/tmp/image_export_bench_XXXXXX";
    const int fd = mkstemp(pattern);
    if (fd >= 0)
        close(fd);
    for (auto _ : state) {
        int result = 0;
        ImagePtr rgb(demosaicToRgb8(source.get(), &result));
        const int quality[] = {90};
        if (imageSave(pattern, rgb.get(), img::kFormatJpeg, quality, 1) != 0)
            state.SkipWithError("JPEG save failed");
    }
    std::remove(pattern);
    state.SetItemsProcessed(state.iterations() * kWidth * kHeight);
}
BENCHMARK(BM_DemosaicAndJpeg12Mp)->Unit(benchmark::kMillisecond);

} // namespace
