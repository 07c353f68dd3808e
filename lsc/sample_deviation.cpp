#include "lsc/sample_deviation.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <limits>

#include "image/bayer_phase.h"
#include "lsc/sample_window.h"

namespace lsc {

namespace {

constexpr double kInfinity = std::numeric_limits<double>::infinity();

// Where the median window of the block at p (even) is centred once clipped
// at the border of an axis of `size` pixels, as windowMedians clips it.
double windowCentre(std::int64_t p, std::int64_t size, int window) {
    const std::int64_t reach = 2 * (window / 2);
    const std::int64_t first = std::max<std::int64_t>(0, p - reach);
    const std::int64_t last = std::min<std::int64_t>((size & ~1) - 2, p + reach);
    return 0.5 * static_cast<double>(first + last);
}

// The three points, in order along the axis, of the second difference at
// position p of an axis of `size` pixels (last block at size - 2): p in the
// middle where both sides have room, else p and two points beyond it on the
// side that has; false when neither has.
bool stencil(std::int64_t p, std::int64_t size, std::int64_t d, std::int64_t points[3],
             int* sample) {
    const std::int64_t last = size - 2;
    if (p - d >= 0 && p + d <= last) {
        points[0] = p - d, points[1] = p, points[2] = p + d, *sample = 1;
    } else if (p + 2 * d <= last) {
        points[0] = p, points[1] = p + d, points[2] = p + 2 * d, *sample = 0;
    } else if (p - 2 * d >= 0) {
        points[0] = p - 2 * d, points[1] = p - d, points[2] = p, *sample = 2;
    } else {
        return false;
    }
    return true;
}

// The second difference of the logarithm of the levels v0, v1, v2 at the
// window centres t0 < t1 < t2, for unequal spacing: the sample's departure
// from the line through the other two points, doubled when the sample is the
// middle point (as f0 - 2 f1 + f2 doubles a spike in the middle of an even
// stencil). A NaN or an infinity counts as infinite.
double bend(const double t[3], const float v[3], int sample) {
    double f[3];
    for (int i = 0; i < 3; ++i)
        f[i] = v[i] > 0.0f ? std::log(double(v[i])) : -kInfinity;
    double value;
    if (sample == 1) {
        const double line = f[0] + (f[2] - f[0]) * (t[1] - t[0]) / (t[2] - t[0]);
        value = 2.0 * std::fabs(f[1] - line);
    } else {
        const int near = 1, far = sample == 0 ? 2 : 0;
        const double line =
            f[near] + (f[near] - f[far]) * (t[sample] - t[near]) / (t[near] - t[far]);
        value = std::fabs(f[sample] - line);
    }
    return std::isfinite(value) ? value : kInfinity;
}

} // namespace

void measureSampleDeviations(const WorkingImage& image, const std::vector<shadingSample>& samples,
                             int sampleWindow, bool samplesFromImage, float blackLevel,
                             FitDeviation deviations[kChannels]) {
    const int window = std::max(kCheckWindow, sampleWindow);
    const int phase = img::bayerPhase(image.cfa);
    auto medianLevels = [&](std::int64_t x, std::int64_t y, float levels[kChannels]) {
        windowMedians(image, phase, std::uint32_t(x) & ~1u, std::uint32_t(y) & ~1u, window, levels);
        for (int k = 0; k < kChannels; ++k)
            levels[k] = std::max(0.0f, levels[k] - blackLevel);
    };
    const std::int64_t width = image.width, height = image.height;
    // Neighbours' windows just clear of the sample's (2 x window pixels wide).
    const std::int64_t d =
        std::max<std::int64_t>(static_cast<std::int64_t>(0.03 * static_cast<double>(width)),
                               2 * window) &
        ~1;

    double sumOfSquares[kChannels] = {0, 0, 0, 0};
    std::size_t count = 0;
    for (int k = 0; k < kChannels; ++k)
        deviations[k] = FitDeviation{};
    for (const shadingSample& s : samples) {
        if (s.x + 1 >= image.width || s.y + 1 >= image.height)
            continue;
        ++count;
        float centre[kChannels];
        medianLevels(s.x, s.y, centre);
        // Robust levels at the three points along x (row s.y) and along y
        // (column s.x), and where their windows are centred.
        std::int64_t xs[3] = {0, 0, 0}, ys[3] = {0, 0, 0};
        int sampleX = 0, sampleY = 0;
        double tx[3], ty[3];
        float alongX[kChannels][3], alongY[kChannels][3];
        const bool haveX = stencil(s.x, width, d, xs, &sampleX);
        const bool haveY = stencil(s.y, height, d, ys, &sampleY);
        for (int i = 0; i < 3; ++i) {
            float levels[kChannels];
            if (haveX) {
                medianLevels(xs[i], s.y, levels);
                tx[i] = windowCentre(xs[i], width, window);
                for (int k = 0; k < kChannels; ++k)
                    alongX[k][i] = levels[k];
            }
            if (haveY) {
                medianLevels(s.x, ys[i], levels);
                ty[i] = windowCentre(ys[i], height, window);
                for (int k = 0; k < kChannels; ++k)
                    alongY[k][i] = levels[k];
            }
        }
        for (int k = 0; k < kChannels; ++k) {
            double worst = 0.0;
            if (samplesFromImage) {
                worst = std::fabs(std::log(double(s.value[k]) / centre[k]));
                if (!std::isfinite(worst))
                    worst = kInfinity;
            }
            if (haveX)
                worst = std::max(worst, bend(tx, alongX[k], sampleX));
            if (haveY)
                worst = std::max(worst, bend(ty, alongY[k], sampleY));
            // Written so that a NaN becomes the maximum.
            if (!(worst <= deviations[k].max))
                deviations[k].max = worst;
            sumOfSquares[k] += worst * worst;
        }
    }
    if (count > 0)
        for (int k = 0; k < kChannels; ++k)
            deviations[k].rms = std::sqrt(sumOfSquares[k] / static_cast<double>(count));
}

} // namespace lsc
