#include "lsc/patch_layout_choice.h"

#include <cmath>
#include <new>
#include <sstream>

#include "image/bayer_phase.h"
#include "lsc/lens_shading_correction.h"
#include "lsc/lens_shading_fit.h"
#include "lsc/patch_geometry.h"
#include "lsc/sample_collection.h"

namespace lsc {

using img::BayerImage;

namespace {

constexpr double kOuterFactors[] = {0.2, 0.3, 0.35, 0.4};
constexpr std::uint32_t kFlatnessBlock = 16;
// The trials fit and judge green/red alone: a quarter of the fit's cost, and
// green carries the luminance shading whose steep corners decide the layout.
constexpr int kTrialChannel = 1;

bool sameLayout(const PatchLayout& a, const PatchLayout& b) {
    return a.left == b.left && a.center == b.center && a.top == b.top && a.middle == b.middle;
}

} // namespace

std::vector<PatchLayout> candidateLayouts(const PatchLayout& configured, std::uint32_t width,
                                          std::uint32_t height) {
    std::vector<PatchLayout> layouts = {configured};
    for (double outer : kOuterFactors) {
        const PatchLayout layout = {outer, 1.0 - 2.0 * outer, outer, 1.0 - 2.0 * outer};
        if (sameLayout(layout, configured) ||
            !patchGeometryUsable(patchBreakpoints(width, height, layout.left, layout.center,
                                                  layout.top, layout.middle)))
            continue;
        layouts.push_back(layout);
    }
    return layouts;
}

double correctedFlatness(const BayerImage& corrected, int channel) {
    const std::uint32_t width = static_cast<std::uint32_t>(corrected.width());
    const std::uint32_t height = static_cast<std::uint32_t>(corrected.height());
    const std::uint32_t columns = width / kFlatnessBlock, rows = height / kFlatnessBlock;
    if (columns == 0 || rows == 0)
        return 0.0;
    const int phase = img::bayerPhase(corrected.cfa());
    // Per block and channel: sum (the counts are equal, 64 each, for an even block side).
    std::vector<double> sums(std::size_t(columns) * rows * kChannels, 0.0);
    const float* pixels = corrected.pixels();
    for (std::uint32_t y = 0; y < rows * kFlatnessBlock; ++y) {
        const float* row = pixels + std::size_t(y) * width;
        double* blockRow = &sums[std::size_t(y / kFlatnessBlock) * columns * kChannels];
        for (std::uint32_t x = 0; x < columns * kFlatnessBlock; ++x)
            blockRow[(x / kFlatnessBlock) * kChannels + img::bayerChannel(x, y, phase)] += row[x];
    }
    double worst = 0.0;
    const std::size_t blocks = std::size_t(columns) * rows;
    for (int k = 0; k < kChannels; ++k) {
        if (channel >= 0 && k != channel)
            continue;
        double mean = 0.0;
        for (std::size_t b = 0; b < blocks; ++b)
            mean += sums[b * kChannels + k];
        mean /= static_cast<double>(blocks);
        for (std::size_t b = 0; b < blocks; ++b) {
            const double deviation = std::fabs(sums[b * kChannels + k] / mean - 1.0);
            // Written so that a NaN counts as the worst.
            if (!(deviation <= worst))
                worst = deviation;
        }
    }
    return worst;
}

LayoutChoice chooseLayout(const BayerImage& prepared, const ShadingSettings& settings) {
    const std::uint32_t width = static_cast<std::uint32_t>(prepared.width());
    const std::uint32_t height = static_cast<std::uint32_t>(prepared.height());
    const std::vector<PatchLayout> layouts = candidateLayouts(settings.layout, width, height);
    LayoutChoice choice;
    choice.layout = layouts.front();
    choice.candidates = layouts.size();
    double best = 0.0;
    bool found = false;
    std::ostringstream quiet;
    ShadingSettings trial = settings;
    // Half the sample grid's density along each axis: a quarter of the fit's
    // cost, and enough to rank the layouts (the run's own fit then uses all).
    trial.sampleAngleStep = 2 * settings.sampleAngleStep;
    trial.quiet = true;
    for (std::size_t i = 0; i < layouts.size(); ++i) {
        const PatchLayout& layout = layouts[i];
        trial.layout = layout;
        double flatness = -1.0;
        try {
            const BayerImage levelled = levelledImage(prepared, trial.blackLevel);
            const SampleSet samples = collectSamples(levelled, trial, quiet);
            const FitResult fit = fitTrialChannel(samples, levelled, trial, kTrialChannel);
            const BayerImage corrected =
                applyLensShading(prepared, fit.correction, trial.blackLevel, 1);
            flatness = correctedFlatness(corrected, kTrialChannel);
        } catch (const std::bad_alloc&) {
            throw;
        } catch (...) {
            // Not usable: this layout is left out.
        }
        choice.flatness.push_back(flatness);
        if (flatness >= 0.0 && (!found || flatness < best)) {
            best = flatness;
            found = true;
            choice.layout = layout;
            choice.index = i;
        }
    }
    return choice;
}

} // namespace lsc
