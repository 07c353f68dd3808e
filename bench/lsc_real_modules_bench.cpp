// How well the calibration undoes the lens shading measured on real camera
// modules (the tuning tables in tests/data/real_modules), with the default
// settings and with the recommended ones.
//
// For each module and colour temperature a capture is rendered at the
// sensor's native size (10 bits, brightest green at 80 % of full scale, a
// 5000-electron full well, 2.5 DN of read noise, 300 hot and dead pixels, the
// module's black level) for each noise seed, and the built tool (build the
// target lsc in the same build directory first) calibrates it. Counters, over
// the seeds whose run was accepted (figures in per cent unless named):
// - errMax, errRms: calibration error, the largest and the RMS |8 x 8-block
//   mean / channel mean - 1| of the fitted gain times the exact shading (no
//   noise), on the prepared image's grid, over the four channels;
//   edgeMax, innerMax: errMax over the blocks within 10 % of the image size
//   from a border and over the others;
// - residual, floor: the same on the noisy prepared image times the gain,
//   and on the prepared image divided by the exact shading (what noise alone
//   leaves);
// - deltaAb: the run's maximum delta ab; luma: its luminance residual, when
//   the run prints it;
// - refused: runs that ended with an error, of `seeds`.
// The time is the wall time of the tool's runs, per run.
//
// LSC_BENCH_SEEDS sets the number of seeds (default 5); LSC_BENCH_QUICK=1
// renders at half the native size with one seed.

#include <algorithm>
#include <chrono>
#include <cmath>
#include <cstdlib>
#include <map>
#include <memory>
#include <regex>
#include <sstream>
#include <stdexcept>
#include <string>
#include <vector>

#include <benchmark/benchmark.h>

#include "image/bayer_image.h"
#include "lsc/fit_result.h"
#include "lsc/lens_shading_correction.h"
#include "tests/support/temp_dir.h"
#include "tests/support/tool_runner.h"
#include "tools/flatfield/flat_field.h"
#include "tools/flatfield/module_shading.h"

using lsc::applyLensShading;
using lsc::ShadingCorrection;

using img::BayerImage;

namespace {

using flatfield::FlatField;
using flatfield::FlatFieldShape;
using flatfield::ModuleShading;

struct Module {
    const char* name;
    const char* file;
    int width, height;
    const char* order;
    int blackLevel; // 10-bit units
    int temperatures[3];
};

const Module kModules[] = {
    {"imx219", "rpi_imx219.json", 3280, 2464, "RGGB", 64, {3000, 3850, 6000}},
    {"imx477", "rpi_imx477.json", 4056, 3040, "RGGB", 64, {2960, 4850, 5930}},
    {"ov5647", "rpi_ov5647.json", 2592, 1944, "BGGR", 16, {3000, 5000, 6500}},
};

struct Setting {
    const char* name;
    const char* config;
};

const Setting kSettings[] = {
    {"default", ""},
    {"window5", "lsc.sample_window = 5;\n"},
    {"recommended", "lsc.sample_window = 5;\nlsc.patch_layout = auto;\n"
                    "apply_lsc.max_luma_residual = 3;\n"},
};

bool quick() {
    const char* value = std::getenv("LSC_BENCH_QUICK");
    return value && std::string(value) == "1";
}

int seedCount() {
    if (quick())
        return 1;
    const char* value = std::getenv("LSC_BENCH_SEEDS");
    return value ? std::max(1, std::atoi(value)) : 5;
}

std::string dataPath(const char* file) {
    return std::string(LSC_SOURCE_DIR) + "/tests/data/real_modules/" + file;
}

// One rendered capture, kept for every setting.
struct Capture {
    FlatField field;
    std::unique_ptr<testing_support::TempDir> dir;
};

// The rendered shading must pass through the tuning table's values at the
// cell centres: otherwise these figures would measure the generator, not the
// calibration.
void checkCellCentres(const ModuleShading& shading, int width, int height) {
    for (int channel = 0; channel < 4; ++channel)
        for (int row = 0; row < ModuleShading::kRows; ++row)
            for (int column = 0; column < ModuleShading::kColumns; ++column) {
                const double x = (column + 0.5) * width / ModuleShading::kColumns;
                const double y = (row + 0.5) * height / ModuleShading::kRows;
                const double table = shading.cell(channel, column, row);
                if (std::fabs(shading.at(channel, x, y, width, height) / table - 1) > 1e-9)
                    throw std::logic_error("rendered shading misses the table at a cell centre");
            }
}

const Capture& capture(const Module& module, int temperature, int seed) {
    // The seeds of one module and colour temperature at a time.
    static std::string cached;
    static std::map<int, Capture> cache;
    const std::string key = std::string(module.name) + "/" + std::to_string(temperature);
    if (key != cached) {
        cache.clear();
        cached = key;
    }
    auto found = cache.find(seed);
    if (found != cache.end())
        return found->second;
    Capture& entry = cache[seed];
    FlatFieldShape shape;
    const int scale = quick() ? 2 : 1;
    shape.width = (module.width / scale) & ~1;
    shape.height = (module.height / scale) & ~1;
    shape.cfa = flatfield::cfaOfBayerOrder(module.order);
    shape.module = std::make_shared<const ModuleShading>(
        ModuleShading::fromTuningFile(dataPath(module.file), temperature));
    checkCellCentres(*shape.module, shape.width, shape.height);
    shape.fullWell = 5000;
    shape.readNoise = 2.5;
    shape.defects = 300;
    shape.blackLevel = module.blackLevel;
    shape.seed = std::uint32_t(seed);
    entry.field = flatfield::makeFlatField(shape);
    entry.dir = std::make_unique<testing_support::TempDir>();
    testing_support::writeFile(entry.dir->file("flat.kqraw"),
                               flatfield::kqraw2FileBytes(entry.field));
    return entry;
}

// Patch factors and control grids of a register file.
bool readRegisterFile(const std::string& text, ShadingCorrection& correction) {
    const char* factorNames[4] = {"leftPatchFactor", "centerPatchFactor", "topPatchFactor",
                                  "middlePatchFactor"};
    double* factors[4] = {&correction.layout.left, &correction.layout.center,
                          &correction.layout.top, &correction.layout.middle};
    for (int i = 0; i < 4; ++i) {
        std::smatch match;
        if (!std::regex_search(
                text, match, std::regex(std::string("\\.") + factorNames[i] + " *= ([0-9.e-]+);")))
            return false;
        *factors[i] = std::stod(match[1]);
    }
    const char* gridNames[4] = {"R", "GR", "GB", "B"};
    for (int k = 0; k < 4; ++k) {
        const std::regex point(std::string("controlPoint") + gridNames[k] +
                               "\\[([0-9])\\]\\[([0-9])\\] *= ([-0-9.e+]+);");
        int found = 0;
        for (auto it = std::sregex_iterator(text.begin(), text.end(), point);
             it != std::sregex_iterator(); ++it, ++found)
            correction.controlGrids[k][std::stoi((*it)[1]) * 10 + std::stoi((*it)[2])] =
                std::stof((*it)[3]);
        if (found != 100)
            return false;
    }
    return true;
}

struct BlockFigures {
    double max = 0, rms = 0, edgeMax = 0, innerMax = 0;
};

// |8 x 8-block mean / channel mean - 1| of `values` (a Bayer image of the
// prepared size), per channel, pooled over the channels.
BlockFigures blockFigures(const std::vector<float>& values, int width, int height,
                          const FlatField& field) {
    constexpr int kBlock = 8;
    BlockFigures figures;
    double sumOfSquares = 0;
    int count = 0;
    for (int k = 0; k < 4; ++k) {
        std::vector<double> means;
        std::vector<bool> edge;
        for (int by = 0; by + kBlock <= height; by += kBlock)
            for (int bx = 0; bx + kBlock <= width; bx += kBlock) {
                double sum = 0;
                int n = 0;
                for (int y = by; y < by + kBlock; ++y)
                    for (int x = bx; x < bx + kBlock; ++x)
                        if (field.channelAt(x, y) == k) {
                            sum += values[std::size_t(y) * width + x];
                            ++n;
                        }
                means.push_back(sum / n);
                const double cx = (bx + kBlock / 2.0) / width, cy = (by + kBlock / 2.0) / height;
                edge.push_back(cx < 0.1 || cx > 0.9 || cy < 0.1 || cy > 0.9);
            }
        double mean = 0;
        for (double m : means)
            mean += m;
        mean /= double(means.size());
        for (std::size_t i = 0; i < means.size(); ++i) {
            const double deviation = std::fabs(means[i] / mean - 1.0);
            figures.max = std::max(figures.max, deviation);
            (edge[i] ? figures.edgeMax : figures.innerMax) =
                std::max(edge[i] ? figures.edgeMax : figures.innerMax, deviation);
            sumOfSquares += deviation * deviation;
            ++count;
        }
    }
    figures.rms = std::sqrt(sumOfSquares / count);
    return figures;
}

// The fitted gain at every pixel of the prepared image, as the run corrects it.
std::vector<float> gainMap(const BayerImage& prepared, const ShadingCorrection& fitted) {
    BayerImage ones;
    ones.copy(prepared);
    std::fill(ones.pixels(), ones.pixels() + std::size_t(prepared.width()) * prepared.height(),
              1.0f);
    const BayerImage corrected = applyLensShading(ones, fitted, 0.0f, 1);
    const float* gains = corrected.pixels();
    return std::vector<float>(gains, gains + std::size_t(prepared.width()) * prepared.height());
}

double number(const std::string& text, const std::string& pattern) {
    std::smatch match;
    return std::regex_search(text, match, std::regex(pattern)) ? std::stod(match[1]) : -1.0;
}

void BM_RealModule(benchmark::State& state, const Module& module, int temperature,
                   const Setting& setting) {
    const int seeds = seedCount();
    int refused = 0, accepted = 0;
    BlockFigures error, residual, floor;
    double deltaAb = 0, luma = -1, seconds = 0;
    std::string lastError;
    for (auto _ : state) {
        for (int seed = 1; seed <= seeds; ++seed) {
            state.PauseTiming();
            const Capture& input = capture(module, temperature, seed);
            const FlatField& field = input.field;
            testing_support::writeFile(
                input.dir->file("lsc.cfg"),
                "shared.bit_res = 10;\nproc.black_level = " + std::to_string(module.blackLevel) +
                    ";\n" + setting.config);
            std::remove(input.dir->file("cal.txt").c_str());
            state.ResumeTiming();
            const auto start = std::chrono::steady_clock::now();
            const auto result =
                testing_support::runTool({"--kq", "--config", "lsc.cfg", "--input", "flat.kqraw",
                                          "--calibrate", "cal.txt", "--preproc", "pre.kqraw"},
                                         input.dir->path());
            seconds +=
                std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
            state.PauseTiming();
            if (result.status != 0) {
                ++refused;
                lastError = result.out.substr(result.out.rfind("ERROR"));
                state.ResumeTiming();
                continue;
            }
            ShadingCorrection fitted;
            BayerImage prepared;
            prepared.read(input.dir->file("pre.kqraw"));
            if (!readRegisterFile(testing_support::readFile(input.dir->file("cal.txt")), fitted)) {
                state.SkipWithError("cannot read the register file");
                return;
            }
            const std::vector<float> gains = gainMap(prepared, fitted);
            const int w = prepared.width(), h = prepared.height();
            const int factor = 4; // shared.proc_sampling_factor
            const float black = float(module.blackLevel) / 1023.0f;
            std::vector<float> exact(gains.size()), corrected(gains.size()), divided(gains.size());
            for (int y = 0; y < h; ++y)
                for (int x = 0; x < w; ++x) {
                    const std::size_t at = std::size_t(y) * w + x;
                    const int fx = 2 * factor * (x / 2) + (x & 1);
                    const int fy = 2 * factor * (y / 2) + (y & 1);
                    const float shading = field.exact[std::size_t(fy) * field.shape.width + fx];
                    const float value = prepared.pixels()[at] - black;
                    exact[at] = gains[at] * shading;
                    corrected[at] = gains[at] * value;
                    divided[at] = value / shading;
                }
            const BlockFigures e = blockFigures(exact, w, h, field);
            const BlockFigures r = blockFigures(corrected, w, h, field);
            const BlockFigures f = blockFigures(divided, w, h, field);
            ++accepted;
            error.max += e.max, error.rms += e.rms, error.edgeMax += e.edgeMax,
                error.innerMax += e.innerMax;
            residual.max += r.max, floor.max += f.max;
            deltaAb = std::max(deltaAb, number(result.out, "Maximum delta ab: ([0-9.e+-]+)"));
            luma = std::max(luma, number(result.out, "Maximum luminance residual: ([0-9.]+) %"));
            state.ResumeTiming();
        }
    }
    const double n = accepted > 0 ? accepted : 1;
    state.counters["errMax"] = 100 * error.max / n;
    state.counters["errRms"] = 100 * error.rms / n;
    state.counters["edgeMax"] = 100 * error.edgeMax / n;
    state.counters["innerMax"] = 100 * error.innerMax / n;
    state.counters["residual"] = 100 * residual.max / n;
    state.counters["floor"] = 100 * floor.max / n;
    state.counters["deltaAb"] = deltaAb;
    state.counters["luma"] = luma;
    state.counters["refused"] = refused;
    state.counters["seeds"] = seeds;
    state.counters["runSeconds"] = seconds / seeds;
    if (!lastError.empty())
        state.SetLabel(lastError.substr(0, lastError.find('\n')));
}

const bool kRegistered = [] {
    for (const Module& module : kModules)
        for (int temperature : module.temperatures)
            for (const Setting& setting : kSettings)
                benchmark::RegisterBenchmark(
                    (std::string("RealModule/") + module.name + "/" + std::to_string(temperature) +
                     "/" + setting.name)
                        .c_str(),
                    [&module, temperature, &setting](benchmark::State& state) {
                        BM_RealModule(state, module, temperature, setting);
                    })
                    ->Iterations(1)
                    ->Unit(benchmark::kMillisecond);
    return true;
}();

} // namespace
