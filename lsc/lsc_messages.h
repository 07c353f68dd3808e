#pragma once
// Texts of the lens-shading code: solver, fit and correction messages. The
// operator and the factory scripts read these; keep them character for
// character.

namespace lsc::msg {

// Solver self-test (code 1).
inline constexpr char kSolverFailed[] = "The linear system solver failed.";
inline constexpr char kSelfTestFailure[] = "Selftest failure.";

// Under-constrained fit (code 220).
inline constexpr char kUnderConstrained[] =
    "Under constrained fit being attempted. You must specify at least as many sample points as "
    "control points.";
inline constexpr char kUnderConstrainedHint[] =
    "While it's possible to solve undercontrained linear least squares systems we don't support "
    "it.";

// Rank-deficient least squares (code 230).
inline constexpr char kRankDeficient[] = "Warning: trying to solve a rank deficient system";
inline constexpr char kRankDeficientHint[] =
    "Rank deficient matrices often occur whenyou have an ill-conditioned system of linear "
    "equations.";

// Square solve (code 231).
inline constexpr char kNotSquare[] =
    "You can only solve linear system if the 'A' matrix is square.";
inline constexpr char kNotSquareHint[] =
    "You need as many constraints as equations our the system can't be solved.";
inline constexpr char kSingular[] = "Singular or undetermined linear system.";
inline constexpr char kSingularHint[] = "Usually the rows or columns are not linear independent.";

// Solver storage that does not match the matrix (a caller's mistake).
inline constexpr char kSolverShapeMismatch[] =
    "Linear solver storage does not match the size of the coefficient matrix.";

// Gains.
inline constexpr char kZeroValue[] =
    "A value of zero in the input cannot be corrected (i.e. gained up to unity).";

// Fit checks. The deviation line reads "<channel> deviation max, rms: <max> <rms>".
inline constexpr char kDeviationLine[] = " deviation max, rms:";
inline constexpr char kRmsBoundExceeded[] = "RMS error bound exceeded.";
inline constexpr char kMaxBoundExceeded[] = "MAX error bound exceeded.";
// "Gain <value> of the <channel> channel is above lsc.max_gain (<limit>). Likely ..."
inline constexpr char kGainAbovePrefix[] = "Gain ";
inline constexpr char kGainAboveChannel[] = " of the ";
inline constexpr char kGainAboveLimit[] = " channel is above lsc.max_gain (";
inline constexpr char kGainAboveSuffix[] =
    "). Likely a dark corner, a missing diffuser or a configuration that does not match the "
    "sensor.";

// Patch lookup, written as "patch containing " x "," y " not found.".
inline constexpr char kPatchNotFoundPrefix[] = "patch containing ";
inline constexpr char kPatchNotFoundSuffix[] = " not found.";

// Sample count (lsc/sample_limit.h).
inline constexpr char kTooManySamples[] =
    "More than 250000 sample points: a fit takes at most 250000 (raise lsc.sampling_factor, or "
    "use a sample file with fewer points).";

// Progress lines.
inline constexpr char kSampleCount[] = "Number of sample points = ";
inline constexpr char kTargetValue[] = "Target value[";
inline constexpr char kFittingSurface[] = "Fitting surface : ";

// Settings and images the fit and the correction cannot work with.
inline constexpr char kBadPatchGeometry[] =
    "Patch geometry leaves a patch without pixels: the patch factors (or patch sizes) must give "
    "left and top patches of at least one pixel and leave room for the right and bottom patches.";
inline constexpr char kBadAngleStep[] = "lsc.sampling_factor must be at least 1.";
inline constexpr char kBadSampleMargin[] = "lsc.sampling_margin must not be negative.";
inline constexpr char kBadProcSamplingFactor[] = "shared.proc_sampling_factor must be at least 1.";
inline constexpr char kBadSampleWindow[] = "lsc.sample_window must be an odd number from 1 to 15.";
inline constexpr char kBadApplyStep[] = "apply_lsc.sampling_factor must be at least 1.";
inline constexpr char kNoWorkingImage[] = "No image to process for lens shading.";
inline constexpr char kNotBayerFloatImage[] =
    "Lens shading needs a single-plane floating-point Bayer image.";
inline constexpr char kImageTooSmallToCorrect[] =
    "Image is too small to correct: width and height must be at least twice "
    "apply_lsc.sampling_factor.";
inline constexpr char kImageAllocation[] = "Unable to allocate image memory.";

} // namespace lsc::msg
