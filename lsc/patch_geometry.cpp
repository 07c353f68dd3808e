#include "lsc/patch_geometry.h"

#include <cmath>
#include <limits>
#include <stdexcept>

#include "lsc/lsc_messages.h"

namespace lsc {

namespace {

// Truncates toward zero into 0..limit; NaN and negative products give 0, so a
// nonsensical fraction can never turn into an out-of-range conversion.
std::uint64_t truncateUnsigned(double value, std::uint64_t limit) {
    if (!(value > 0.0))
        return 0;
    if (value >= static_cast<double>(limit))
        return limit;
    return static_cast<std::uint64_t>(value);
}

// floor() into a signed 64-bit range that any later subtraction survives.
std::int64_t floorSigned(double value) {
    constexpr double kLimit = 4.0e18;
    if (std::isnan(value))
        return 0;
    if (value >= kLimit)
        return static_cast<std::int64_t>(kLimit);
    if (value <= -kLimit)
        return -static_cast<std::int64_t>(kLimit);
    return static_cast<std::int64_t>(std::floor(value));
}

// (0, first, first + second, size) with the sums saturated at 2^32 - 1: an
// oversized first or second patch stays visible as a breakpoint at or past
// the end instead of wrapping around to a small number.
void breakpoints(std::uint32_t size, double firstFraction, double secondFraction,
                 std::uint32_t out[4]) {
    constexpr std::uint64_t kMax = std::numeric_limits<std::uint32_t>::max();
    const std::uint64_t first = truncateUnsigned(size * firstFraction, kMax);
    const std::uint64_t second = truncateUnsigned(size * secondFraction + 0.5, kMax);
    const std::uint64_t both = first + second < kMax ? first + second : kMax;
    out[0] = 0;
    out[1] = static_cast<std::uint32_t>(first);
    out[2] = static_cast<std::uint32_t>(both);
    out[3] = size;
}

} // namespace

PatchBreakpoints patchBreakpoints(std::uint32_t width, std::uint32_t height, double leftFraction,
                                  double centerFraction, double topFraction,
                                  double middleFraction) {
    PatchBreakpoints result{};
    breakpoints(width, leftFraction, centerFraction, result.x);
    breakpoints(height, topFraction, middleFraction, result.y);
    return result;
}

ExportedPatchSizes exportedPatchSizes(std::uint32_t width, std::uint32_t height,
                                      double leftFraction, double centerFraction,
                                      double topFraction, double middleFraction) {
    ExportedPatchSizes sizes{};
    sizes.left = floorSigned(0.5 + width * leftFraction);
    sizes.center = floorSigned(width * centerFraction);
    sizes.right = static_cast<std::int64_t>(width) - sizes.center - sizes.left;
    sizes.top = floorSigned(0.5 + height * topFraction);
    sizes.middle = floorSigned(height * middleFraction);
    sizes.bottom = static_cast<std::int64_t>(height) - sizes.middle - sizes.top;
    return sizes;
}

PatchStep patchStep(std::int64_t size) {
    // A patch of no pixels has no finite step; both registers are left 0
    // rather than converting an infinite or negative number.
    if (size < 1)
        return {0, 0};
    const double step = 4.0 * (1.0 / (static_cast<double>(size) * 0.5));
    const double whole = std::floor(step);
    // The integer field holds 3 bits: a 1-pixel patch (step 8) wraps to 0, and
    // the fraction is taken from the step itself so it stays below 2^32.
    const std::uint32_t msb = static_cast<std::uint32_t>(whole) & 7u;
    const std::uint32_t lsb = static_cast<std::uint32_t>(std::floor((step - whole) * 4294967296.0));
    return {msb, lsb};
}

bool patchGeometryUsable(const PatchBreakpoints& breaks) {
    for (const std::uint32_t* line : {breaks.x, breaks.y})
        if (!(line[0] < line[1] && line[1] < line[2] && line[2] < line[3]))
            return false;
    return true;
}

PatchBreakpoints usablePatchBreakpoints(std::uint32_t width, std::uint32_t height,
                                        double leftFraction, double centerFraction,
                                        double topFraction, double middleFraction) {
    const PatchBreakpoints breaks =
        patchBreakpoints(width, height, leftFraction, centerFraction, topFraction, middleFraction);
    if (!patchGeometryUsable(breaks))
        throw std::runtime_error(lsc::msg::kBadPatchGeometry);
    return breaks;
}

} // namespace lsc
