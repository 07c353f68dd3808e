#pragma once
// Texts the run driver prints, exactly as operators and station scripts see them.

namespace msg {

// Command line
inline constexpr char kNeedConfig[] = "ERROR: Configuration file must be specified.";
inline constexpr char kNeedInputOrSamples[] =
    "ERROR: Input image file or input sample file must be specified.";
inline constexpr char kNeedInputForOutSamples[] =
    "ERROR: Input image file must be specified when storing samples.";
inline constexpr char kNeedCalibrateOrOutSamples[] =
    "ERROR: Must specify either an output calibration register file or output sample file.";
inline constexpr char kUseHelp[] = "Use --help to print out all the options.";

// Top-level error report
inline constexpr char kErrorPrefix[] = "ERROR: ";
inline constexpr char kNoMemory[] = "ERROR: Cannot allocate memory.";
inline constexpr char kUnknownError[] = "Unknown error.";
inline constexpr char kInfoFileWrite[] = "ERROR: Unable to write information file.";

// Info file
inline constexpr char kInfoFileOpen[] = "Unable to output information file.";
inline constexpr char kInfoFileOpenHint[] = "Likely a file protection issue.";

} // namespace msg
