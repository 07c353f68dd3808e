#include "lsc/sample_collection.h"

#include <cmath>
#include <cstdint>
#include <ostream>
#include <stdexcept>
#include <utility>
#include <vector>

#include "image/bayer_phase.h"
#include "lsc/lsc_messages.h"
#include "lsc/patch_geometry.h"
#include "lsc/sample_limit.h"
#include "lsc/sample_window.h"
#include "lsc/target_levels.h"
#include "lsc/working_image.h"

namespace lsc {

using img::BayerImage;

namespace {

constexpr float kDegreesToRadians = 0.017453292f;

// Reads the 2x2 blocks of the sample positions; positions are signed so that
// lines computed left of the margin or the image never wrap around.
class SampleTaker {
public:
    SampleTaker(const WorkingImage& image, std::int64_t margin, int window,
                std::vector<shadingSample>& out)
        : image_(image), margin_(margin), window_(window), phase_(img::bayerPhase(image.cfa)),
          out_(out) {}

    std::int64_t margin() const { return margin_; }
    bool insideX(std::int64_t x) const { return margin_ <= x && x < image_.width - margin_; }
    bool insideY(std::int64_t y) const { return margin_ <= y && y < image_.height - margin_; }

    void take(std::int64_t x, std::int64_t y) {
        if (!insideX(x) || !insideY(y))
            return;
        const std::uint32_t bx = static_cast<std::uint32_t>(x) & ~1u;
        const std::uint32_t by = static_cast<std::uint32_t>(y) & ~1u;
        // On an odd-sized image the last even row or column has no partner:
        // such a block would read past the image, so it is not taken.
        if (bx + 1 >= image_.width || by + 1 >= image_.height)
            return;
        shadingSample sample{bx, by, {0, 0, 0, 0}};
        if (window_ > 1)
            windowMedians(image_, phase_, bx, by, window_, sample.value);
        else
            for (std::uint32_t dy = 0; dy < 2; ++dy)
                for (std::uint32_t dx = 0; dx < 2; ++dx)
                    sample.value[img::bayerChannel(dx, dy, phase_)] =
                        image_.pixels[static_cast<std::size_t>(by + dy) * image_.width + bx + dx];
        out_.push_back(sample);
    }

private:
    const WorkingImage& image_;
    std::int64_t margin_;
    int window_;
    int phase_;
    std::vector<shadingSample>& out_;
};

void removeBlackLevel(const WorkingImage& image, float blackLevel) {
    float* p = image.pixels;
    float* const end = p + static_cast<std::size_t>(image.width) * image.height;
    for (; p != end; ++p) {
        const float v = *p - blackLevel;
        *p = v < 0.0f ? 0.0f : v > 1.0f ? 1.0f : v;
    }
}

// Angles -90, -90 + step, ... up to and including the first one >= 90,
// which is used as 90; offset = half-extent * (sin + 1), rounded half away from zero.
template <typename F> void forEachSineOffset(int angleStep, float halfExtent, F f) {
    for (std::int64_t angle = -90;; angle += angleStep) {
        const float degrees = static_cast<float>(angle < 90 ? angle : 90);
        const float sine = std::sin(degrees * kDegreesToRadians);
        f(static_cast<std::int64_t>(std::llround(halfExtent * (sine + 1.0f))));
        if (angle >= 90)
            break;
    }
}

void takeSineGrid(SampleTaker& taker, const WorkingImage& image, int angleStep) {
    const std::int64_t m = taker.margin();
    const float hx = static_cast<float>(static_cast<std::int64_t>(image.width / 2) - m);
    const float hy = static_cast<float>(static_cast<std::int64_t>(image.height / 2) - m);
    forEachSineOffset(angleStep, hx, [&](std::int64_t dx) {
        forEachSineOffset(angleStep, hy, [&](std::int64_t dy) { taker.take(m + dx, m + dy); });
    });
}

// Columns and rows just inside each patch border, sampled every fifth of
// the top (for columns) or left (for rows) patch size.
void takeBorderLines(SampleTaker& taker, const WorkingImage& image,
                     const PatchBreakpoints& breaks) {
    const std::int64_t m = taker.margin();
    const std::int64_t w = image.width, h = image.height;
    const std::int64_t left = breaks.x[1], leftCentre = breaks.x[2];
    const std::int64_t top = breaks.y[1], topMiddle = breaks.y[2];
    // A patch under 5 pixels would give a step of 0 and an endless line: the
    // step is at least 1 pixel.
    const std::int64_t yStep = top / 5 > 0 ? top / 5 : 1;
    const std::int64_t xStep = left / 5 > 0 ? left / 5 : 1;

    const std::int64_t xLines[] = {m + 3,          left - 3,       left + 3,
                                   leftCentre - 3, leftCentre + 3, w - m - 3};
    const std::int64_t yLines[] = {m + 3,         top - 3,       top + 3,
                                   topMiddle - 3, topMiddle + 3, h - m - 3};
    for (std::int64_t x : xLines)
        if (taker.insideX(x))
            for (std::int64_t y = m; y < h - m; y += yStep)
                taker.take(x, y);
    for (std::int64_t y : yLines)
        if (taker.insideY(y))
            for (std::int64_t x = m; x < w - m; x += xStep)
                taker.take(x, y);
}

} // namespace

BayerImage levelledImage(const BayerImage& prepared, float blackLevel) {
    workingImage(prepared);
    BayerImage levelled;
    levelled.copy(prepared);
    removeBlackLevel(workingImage(levelled), blackLevel);
    return levelled;
}

SampleSet collectSamples(const BayerImage& levelled, const ShadingSettings& settings,
                         std::ostream& messages) {
    const WorkingImage image = workingImage(levelled);
    // The angle step is lsc.sampling_factor: 0 would never reach 90 degrees.
    if (settings.sampleAngleStep < 1)
        throw std::runtime_error(lsc::msg::kBadAngleStep);
    if (settings.sampleMargin < 0)
        throw std::runtime_error(lsc::msg::kBadSampleMargin);
    if (settings.procSamplingFactor < 1)
        throw std::runtime_error(lsc::msg::kBadProcSamplingFactor);
    if (!sampleWindowUsable(settings.sampleWindow))
        throw std::runtime_error(lsc::msg::kBadSampleWindow);

    // A per-mille of the width, used on both axes: on a wide image it can
    // pass half the height, and then the rows simply yield no samples.
    const std::int64_t margin = static_cast<std::int64_t>(
        static_cast<std::uint64_t>(settings.sampleMargin) * image.width / 1000);
    const PatchLayout& layout = settings.layout;
    const PatchBreakpoints breaks = patchBreakpoints(image.width, image.height, layout.left,
                                                     layout.center, layout.top, layout.middle);

    SampleSet set;
    SampleTaker taker(image, margin, settings.sampleWindow, set.samples);
    takeSineGrid(taker, image, settings.sampleAngleStep);
    takeBorderLines(taker, image, breaks);
    lsc::checkSampleCount(set.samples.size());

    const int filter = settings.awbFilterSize / (2 * settings.procSamplingFactor);
    const int windowSize = filter > 0 ? (filter & ~1) | 1 : 1;
    targetLevelsOf(image, windowSize, set.targetLevels);

    if (!settings.quiet)
        messages << lsc::msg::kSampleCount << set.samples.size() << std::endl;
    return set;
}

} // namespace lsc
