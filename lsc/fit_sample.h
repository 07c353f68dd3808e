#pragma once

namespace lsc {

// One constraint of a surface fit: a position in pixels and the value (or
// derivative) the surface should have there.

// Kinds of constraint a fit can hold, by name; only value constraints are
// produced by the calibration.
inline constexpr const char* kConstraintKindNames[4] = {"value", "du", "dv", "curvature"};

struct fitSample {
    double x; // pixel column
    double y; // pixel row
    double value;
    double weight = static_cast<float>(1e-7); // carried along, not read by any fit
};

} // namespace lsc
