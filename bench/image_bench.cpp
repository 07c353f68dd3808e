// Loading a 12-megapixel 10-bit container: the whole load with normalisation
// against the plain cost of reading the file into memory, plus its parts.

#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <string>
#include <vector>

#include <benchmark/benchmark.h>

#include "image/bayer_image.h"
#include "image/image_result.h"
#include "image/raw_reader.h"
#include "image/sample_memory.h"
#include "image/sample_scaling.h"
#include "tools/flatfield/flat_field.h"

#include <sys/mman.h>
#include <unistd.h>

using img::BayerImage;
using img::ImagePtr;
using img::rawRead;

namespace {

constexpr int kWidth = 4000;
constexpr int kHeight = 3000;

// Written once per process into the temporary directory, removed at exit.
class ContainerFile {
public:
    ContainerFile() {
        const char* tmp = std::getenv("TMPDIR");
        path_ = std::string(tmp && *tmp ? tmp : "/tmp") + "/image_bench_" +
                std::to_string(getpid()) + ".kqraw";
        std::vector<std::uint16_t> samples(std::size_t{kWidth} * kHeight);
        for (std::size_t i = 0; i < samples.size(); ++i)
            samples[i] = static_cast<std::uint16_t>((i * 2654435761u >> 7) & 1023);
        const float gains[4] = {1.0f, 1.0f, 1.0f, 1.0f};
        const std::string bytes = flatfield::KqRawBuilder()
                                      .header(kWidth, kHeight, 0x52474742)
                                      .pixels(samples)
                                      .capture(33.0f, gains)
                                      .sensorInfo("", "0a1b2c3d", "")
                                      .bytes();
        std::ofstream(path_, std::ios::binary)
            .write(bytes.data(), static_cast<std::streamsize>(bytes.size()));
        size_ = bytes.size();
    }
    ~ContainerFile() { std::remove(path_.c_str()); }
    const std::string& path() const { return path_; }
    std::size_t size() const { return size_; }

private:
    std::string path_;
    std::size_t size_ = 0;
};

const ContainerFile& container() {
    static const ContainerFile file;
    return file;
}

void BM_ReadFileIntoMemory(benchmark::State& state) {
    const ContainerFile& file = container();
    for (auto _ : state) {
        std::FILE* in = std::fopen(file.path().c_str(), "rb");
        auto* bytes = static_cast<char*>(std::malloc(file.size()));
        if (!in || !bytes || std::fread(bytes, 1, file.size(), in) != file.size())
            state.SkipWithError("cannot read the file");
        benchmark::DoNotOptimize(bytes);
        std::free(bytes);
        if (in)
            std::fclose(in);
    }
    state.SetBytesProcessed(static_cast<std::int64_t>(state.iterations() * file.size()));
}
BENCHMARK(BM_ReadFileIntoMemory)->Unit(benchmark::kMillisecond)->UseRealTime();

// The same into memory that no earlier iteration has touched, as in a real
// run (the loop above gets its buffer back warm from the heap): plain pages,
// and the large-block allocator that the image library uses.
void readIntoFreshMemory(benchmark::State& state, bool hugePages) {
    const ContainerFile& file = container();
    for (auto _ : state) {
        std::FILE* in = std::fopen(file.path().c_str(), "rb");
        void* bytes = hugePages ? img::allocateSamples(file.size())
                                : mmap(nullptr, file.size(), PROT_READ | PROT_WRITE,
                                       MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
        if (!in || !bytes || bytes == MAP_FAILED ||
            std::fread(bytes, 1, file.size(), in) != file.size())
            state.SkipWithError("cannot read the file");
        benchmark::DoNotOptimize(bytes);
        if (hugePages)
            std::free(bytes);
        else
            munmap(bytes, file.size());
        if (in)
            std::fclose(in);
    }
}
void BM_ReadFileIntoFreshPages(benchmark::State& state) {
    readIntoFreshMemory(state, false);
}
void BM_ReadFileIntoFreshLargeBlock(benchmark::State& state) {
    readIntoFreshMemory(state, true);
}
BENCHMARK(BM_ReadFileIntoFreshPages)->Unit(benchmark::kMillisecond)->UseRealTime();
BENCHMARK(BM_ReadFileIntoFreshLargeBlock)->Unit(benchmark::kMillisecond)->UseRealTime();

void BM_LoadAndNormalise(benchmark::State& state) {
    const ContainerFile& file = container();
    for (auto _ : state) {
        BayerImage image;
        image.read(file.path());
        benchmark::DoNotOptimize(image.pixels());
    }
    state.SetBytesProcessed(static_cast<std::int64_t>(state.iterations() * file.size()));
}
BENCHMARK(BM_LoadAndNormalise)->Unit(benchmark::kMillisecond)->UseRealTime();

// The parts: the raw reader alone, and the normalisation alone (into a buffer
// that is reused, so no fresh pages are involved).
void BM_RawReadOnly(benchmark::State& state) {
    const ContainerFile& file = container();
    for (auto _ : state) {
        int rc = img::kOk;
        ImagePtr raw(rawRead(file.path().c_str(), &rc));
        benchmark::DoNotOptimize(raw.get());
    }
}
BENCHMARK(BM_RawReadOnly)->Unit(benchmark::kMillisecond)->UseRealTime();

void BM_NormaliseOnly(benchmark::State& state) {
    int rc = img::kOk;
    ImagePtr raw(rawRead(container().path().c_str(), &rc));
    std::vector<float> out(std::size_t{kWidth} * kHeight);
    for (auto _ : state) {
        if (!img::normaliseSamples(raw.get(), out.data())) {
            state.SkipWithError("the capture's samples cannot be normalised");
            return;
        }
        benchmark::DoNotOptimize(out.data());
    }
}
BENCHMARK(BM_NormaliseOnly)->Unit(benchmark::kMillisecond)->UseRealTime();

void BM_StoreKqraw(benchmark::State& state) {
    BayerImage image;
    image.read(container().path());
    const std::string out = container().path() + ".out";
    for (auto _ : state)
        image.storeKqraw(out);
    std::remove(out.c_str());
}
BENCHMARK(BM_StoreKqraw)->Unit(benchmark::kMillisecond)->UseRealTime();

} // namespace
