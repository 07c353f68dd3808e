#pragma once
// The figures of the calibration report, each one complete inline <svg>
// element with its colour scale.

#include <cstdint>
#include <string>
#include <utility>
#include <vector>

#include "lsc/patch_geometry.h"
#include "report/report_data.h"
#include "report/report_svg.h"

namespace report {

inline constexpr char kSamplePointsId[] = "sample-points";

// The sample points (prepared-image pixels of 2 x 2 blocks) inside a width x
// height image as one path in a drawing of no size, which every gain surface
// figure then shows by reference: the points are written once, however many
// figures draw them. Empty when no point lies inside.
std::string
samplePointsDefinition(const std::vector<std::pair<std::uint32_t, std::uint32_t>>& points,
                       std::uint32_t width, std::uint32_t height);

// A gain surface over a width x height image on its aspect ratio, with the
// patch borders and, when `withSamples`, the points of samplePointsDefinition.
std::string gainSurfaceFigure(const GainSurface& surface, const ColourScale& scale,
                              const std::vector<ScaleTick>& ticks, std::uint32_t width,
                              std::uint32_t height, const lsc::PatchBreakpoints& breaks,
                              bool withSamples, const std::string& label);

// The four channels' block maps side by side on one colour scale.
std::string channelMapsFigure(const ChannelBlockMeans& means, const ColourScale& scale,
                              const std::vector<ScaleTick>& ticks, double aspect,
                              const std::string& label);

// The delta ab block grid from 0 up to the threshold or the largest value,
// blocks above the threshold outlined and the threshold marked on the scale.
std::string deltaFigure(int columns, int rows, const std::vector<float>& delta, float threshold,
                        const std::string& thresholdText, double aspect, const std::string& label);

} // namespace report
