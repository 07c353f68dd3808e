#include "lsc/lens_shading_fit.h"

#include <algorithm>
#include <atomic>
#include <cmath>
#include <cstdint>
#include <exception>
#include <optional>
#include <ostream>
#include <sstream>
#include <stdexcept>
#include <string>
#include <system_error>
#include <thread>
#include <vector>

#include "lsc/bernstein_surface.h"
#include "lsc/fit_checks.h"
#include "lsc/lsc_messages.h"
#include "lsc/patch_geometry.h"
#include "lsc/patch_surface.h"
#include "lsc/sample_deviation.h"
#include "lsc/working_image.h"

namespace lsc {

using img::BayerImage;

namespace {

constexpr double kTargetTolerance = 1e-7;
constexpr double kPatchTolerance = 1e-10;

// Quadratic surface through the wanted level of one channel: t in the centre,
// falling by the falloff towards the edges and corners.
bernsteinSurface targetSurface(std::uint32_t width, std::uint32_t height, float level,
                               float falloff, double fx, double fy, const char* name, bool quiet,
                               std::ostream& messages) {
    const double hedge = level * (1.0 - fx);
    const double vedge = level * (1.0 - fy);
    const double corner = level * (1.0 - falloff);
    const double cx = width / 2, cy = height / 2;
    const double right = width - 1.0, bottom = height - 1.0;

    bernsteinSurface surface(3, 3, 0.0, width, 0.0, height);
    surface.addSample(0, 0, corner);
    surface.addSample(0, cy, hedge);
    surface.addSample(0, bottom, corner);
    surface.addSample(cx, 0, vedge);
    surface.addSample(cx, cy, level);
    surface.addSample(cx, bottom, vedge);
    surface.addSample(right, 0, corner);
    surface.addSample(right, cy, hedge);
    surface.addSample(right, bottom, corner);
    surface.fit(kTargetTolerance);

    if (!quiet) {
        messages << lsc::msg::kTargetValue << name << "]";
        if (falloff != 0.0f)
            messages << "  center :" << surface.value(cx, cy) << " / " << level
                     << "  corner :" << surface.value(0, 0) << " / " << corner
                     << "  hedge :" << surface.value(0, cy) << " / " << hedge
                     << "  vedge :" << surface.value(cx, 0) << " / " << vedge;
        else
            messages << ":" << level;
        messages << std::endl;
    }
    return surface;
}

// One channel's fit, made apart from the others.
struct ChannelFit {
    float grid[kGridPoints] = {};
    std::string messages;
    std::exception_ptr error;
};

// Runs fitChannel(k) for the four channels on up to as many threads as the
// processor has cores (two here): the fit of one channel is a fixed cost of
// every run, independent of the image size.
template <typename Fit> void forEachChannel(const Fit& fitChannel) {
    std::atomic<int> next{0};
    auto work = [&] {
        for (int k = next++; k < kChannels; k = next++)
            fitChannel(k);
    };
    const unsigned cores = std::thread::hardware_concurrency();
    const unsigned helpers = std::min<unsigned>(cores > 1 ? cores - 1 : 0, kChannels - 1);
    std::vector<std::thread> threads;
    try {
        for (unsigned i = 0; i < helpers; ++i)
            threads.emplace_back(work);
    } catch (const std::system_error&) {
        // No thread to be had: the channels left are fitted here.
    }
    work();
    for (std::thread& thread : threads)
        thread.join();
}

[[noreturn]] void refuseGain() {
    throw std::runtime_error(lsc::msg::kZeroValue);
}

// Replaces each measured value by target / measured and, unless the gains
// stay absolute, divides each channel by its smallest gain.
void turnSamplesIntoGains(std::vector<shadingSample>& samples,
                          const std::vector<bernsteinSurface>& targets, bool absolute) {
    float smallest[kChannels] = {0, 0, 0, 0};
    bool first = true;
    for (shadingSample& s : samples) {
        for (int k = 0; k < kChannels; ++k) {
            const float measured = s.value[k];
            if (measured == 0.0f)
                refuseGain();
            const float gain = static_cast<float>(targets[k].value(s.x, s.y) / measured);
            // A non-finite gain (tiny or non-finite input) cannot be fitted either.
            if (!std::isfinite(gain))
                refuseGain();
            s.value[k] = gain;
            if (first || gain <= smallest[k])
                smallest[k] = gain;
        }
        first = false;
    }
    if (absolute || samples.empty())
        return;
    // A smallest gain below 0 would flip the sign of every gain of the
    // channel; it is refused like a zero one.
    for (int k = 0; k < kChannels; ++k)
        if (!(smallest[k] > 0.0f))
            refuseGain();
    for (shadingSample& s : samples)
        for (int k = 0; k < kChannels; ++k)
            s.value[k] /= smallest[k];
}

} // namespace

namespace {

// The run's fit (every channel, the deviation check) or, with `trialChannel`,
// the automatic layout's trial: that channel alone, its grid copied to the
// others, without the deviation check, which does not depend on the layout.
FitResult fitChannels(const SampleSet& set, const SampleOrigin& origin,
                      const ShadingSettings& settings, std::ostream& messages,
                      FitDeviations& deviationsOut, std::optional<int> trialChannel) {
    deviationsOut.measured = false;
    const WorkingImage image = workingImage(origin.image);
    const std::uint32_t w = image.width, h = image.height;
    // A patch without pixels would make the local coordinates infinite.
    const PatchLayout& layout = settings.layout;
    const PatchBreakpoints breaks =
        usablePatchBreakpoints(w, h, layout.left, layout.center, layout.top, layout.middle);

    FitResult result;
    result.correction.layout = layout;
    float* levels = result.targetLevels;
    std::copy(set.targetLevels, set.targetLevels + kChannels, levels);
    if (settings.greenBalance) {
        if (levels[1] > levels[2])
            levels[2] = levels[1];
        else
            levels[1] = levels[2];
    }

    const double halfW = w / 2, halfH = h / 2;
    const double diagonal = std::sqrt(halfW * halfW + halfH * halfH);
    const float f = settings.falloff;
    const double fx = f > 0.0f ? f * halfW / diagonal : f;
    const double fy = f > 0.0f ? f * halfH / diagonal : f;

    std::vector<bernsteinSurface> targets;
    targets.reserve(kChannels);
    for (int k = 0; k < kChannels; ++k)
        targets.push_back(
            targetSurface(w, h, levels[k], f, fx, fy, kChannelNames[k], settings.quiet, messages));

    // Judged on the measured values, before they become gains.
    const bool trial = trialChannel.has_value();
    FitDeviation deviations[kChannels];
    if (!trial)
        measureSampleDeviations(image, set.samples, settings.sampleWindow, origin.fromImage,
                                origin.fromImage ? 0.0f : settings.blackLevel, deviations);
    std::vector<shadingSample> gains = set.samples;
    turnSamplesIntoGains(gains, targets, settings.greenBalance);
    checkGainSamples(gains, w, h, settings.maxGain);

    const std::vector<double> xBreaks(breaks.x, breaks.x + 4);
    const std::vector<double> yBreaks(breaks.y, breaks.y + 4);
    // The four channels are fitted side by side (they share nothing but the
    // samples, read-only); what each has to say is kept and told in channel
    // order, so the messages and the first failure are those of one channel
    // after the other.
    ChannelFit fits[kChannels];
    forEachChannel([&](int k) {
        if (trial && k != *trialChannel)
            return;
        ChannelFit& fit = fits[k];
        std::ostringstream text;
        text.copyfmt(messages);
        try {
            patchSurface surface(3, 3, xBreaks, yBreaks);
            for (const shadingSample& s : gains)
                if (s.x < w && s.y < h)
                    surface.addValueConstraint(s.x, s.y, s.value[k]);
            surface.fit(kPatchTolerance, text);
            surface.copyToGrid(fit.grid);
        } catch (...) {
            fit.error = std::current_exception();
        }
        fit.messages = text.str();
    });
    FitDeviations measured;
    float grids[kChannels][kGridPoints];
    for (int k = 0; k < kChannels; ++k) {
        if (trial && k != *trialChannel)
            continue;
        const ChannelFit& fit = fits[k];
        if (!settings.quiet)
            messages << lsc::msg::kFittingSurface << kChannelNames[k] << std::endl;
        messages << fit.messages;
        if (fit.error)
            std::rethrow_exception(fit.error);
        std::copy(fit.grid, fit.grid + kGridPoints, grids[k]);
        measured.max[k] = static_cast<float>(deviations[k].max);
        measured.rms[k] = static_cast<float>(deviations[k].rms);
        if (settings.logFitError && !settings.quiet)
            messages << deviationLine(k, measured.max[k], measured.rms[k]) << std::endl;
    }
    if (trial)
        for (int k = 0; k < kChannels; ++k)
            std::copy(grids[*trialChannel], grids[*trialChannel] + kGridPoints, grids[k]);
    measured.measured = true;
    deviationsOut = measured;
    checkDeviationBounds(measured.rms, measured.max, settings.maxRmsError, settings.maxError);
    checkControlPoints(grids, settings.maxGain);

    float(&controlGrids)[kChannels][kGridPoints] = result.correction.controlGrids;
    for (int k = 0; k < kChannels; ++k)
        for (int i = 0; i < kGridPoints; ++i)
            controlGrids[k][i] = grids[k][i];
    if (settings.averageChannels)
        for (int i = 0; i < kGridPoints; ++i) {
            float sum = 0.0f;
            for (int k = 0; k < kChannels; ++k)
                sum += controlGrids[k][i];
            const float mean = sum * 0.25f;
            for (int k = 0; k < kChannels; ++k)
                controlGrids[k][i] = mean;
        }
    return result;
}

} // namespace

FitResult fitLensShading(const SampleSet& samples, const SampleOrigin& origin,
                         const ShadingSettings& settings, std::ostream& messages,
                         FitDeviations& deviations) {
    return fitChannels(samples, origin, settings, messages, deviations, std::nullopt);
}

FitResult fitTrialChannel(const SampleSet& samples, const BayerImage& levelled,
                          const ShadingSettings& settings, int channel) {
    ShadingSettings quiet = settings;
    quiet.quiet = true;
    quiet.logFitError = false;
    std::ostringstream ignored;
    FitDeviations unused;
    return fitChannels(samples, {levelled, true}, quiet, ignored, unused, channel);
}

} // namespace lsc
