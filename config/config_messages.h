#pragma once
// Texts of the configuration subsystem, exactly as operators and station
// scripts see them.

namespace config::msg {

// Configuration tree
inline constexpr char kNoneHasNoValue[] = "None node does not have a value";
inline constexpr char kNotInitializedPrefix[] = "Parameter ";
inline constexpr char kNotInitializedSuffix[] = " not initialized";
inline constexpr char kIndexTooLargePrefix[] = "Index ";
inline constexpr char kIndexTooLargeMiddle[] = " of ";
inline constexpr char kIndexTooLargeSuffix[] = " is too large, the largest allowed index is 65535.";
inline constexpr char kBadPathPrefix[] = "Invalid configuration path: ";
inline constexpr char kPathTooLongPrefix[] = "Configuration path longer than 1024 characters: ";
inline constexpr char kPathTooManyEntriesPrefix[] =
    "Configuration path would add more than 262144 new entries: ";

// Configuration file
inline constexpr char kCannotOpenConfig[] = "Unable to open configuration file.";
inline constexpr char kConfigTooLarge[] = "Configuration file is larger than 64 MiB.";
inline constexpr char kParseStopped[] = "Failed to parse configuration file parameters.";
inline constexpr char kStoppedAt[] = "Stopped at: ";
inline constexpr char kParseExpecting[] =
    "Failed to parse configuration file parameters, expecting ";
inline constexpr char kKeyTooLong[] =
    "Failed to parse configuration file parameters, key longer than 1024 characters:";
inline constexpr char kKeyIndexTooLarge[] =
    "Failed to parse configuration file parameters, index larger than 65535:";
inline constexpr char kTooManyEntries[] =
    "Failed to parse configuration file parameters, more than 262144 new entries:";

// Parameter table
inline constexpr char kValueSpecifiedFor[] = "Value specified for ";
inline constexpr char kTooLow[] = " is too low, value must be between ";
inline constexpr char kTooHigh[] = " is too high, value must be between ";
inline constexpr char kAnd[] = " and ";
inline constexpr char kMustBeOdd[] = " must be odd.";
inline constexpr char kMustBeConfigOrAuto[] = " must be config or auto.";
inline constexpr char kEmptyBlockName[] = "Empty string not allowed for shared.block_name.";
inline constexpr char kBadBlockName[] =
    "Value for shared.block_name may only consist of letters, digits, dashes, and underscores "
    "and must start with a letter.";
inline constexpr char kBlockNameTooLong[] =
    "Value for shared.block_name may be at most 987 characters long.";
inline constexpr char kInvalidDate[] = "Invalid ISO 8601 date value (must be YYYY-MM-DDTHH:MM).";

// Fit settings
inline constexpr char kDeltaAbBlocksNotTwo[] =
    "apply_lsc.delta_ab_blocks must hold two values: the block columns and rows.";
inline constexpr char kNoDeltaAbBlocksPrefix[] = "The image size (";
inline constexpr char kNoDeltaAbBlocksSuffix[] =
    ") gives no usable delta ab block counts; set apply_lsc.delta_ab_blocks in the configuration "
    "file.";
inline constexpr char kZeroBitDepth[] =
    "The image bit depth is 0; set shared.bit_res in the configuration file.";

// Calibration register file
inline constexpr char kCannotWriteCalibration[] =
    "Unable to open output calibration file, possible invalid output path or output filename "
    "specified.";
inline constexpr char kBadExportedGeometryPrefix[] = "Patch geometry of the ";
inline constexpr char kBadExportedGeometryMiddle[] = " image gives patch sizes ";
inline constexpr char kBadExportedGeometrySuffix[] =
    "; every patch must be at least 2 pixels wide and high.";
inline constexpr char kNonFiniteControlPointPrefix[] = "Control point ";
inline constexpr char kNonFiniteControlPointSuffix[] = " is not a finite number: ";
inline constexpr char kNonFiniteLevelPrefix[] = "Target level of the ";
inline constexpr char kNonFiniteLevelSuffix[] = " channel is not a finite number.";
inline constexpr char kQuoteInSerial[] =
    "The module serial number contains a double quote and cannot be written to the calibration "
    "file.";

// Patch geometry check of calibration data
inline constexpr char kImageNotSet[] = "Input image not set before call to readConfigParam";
inline constexpr char kMissingPatchSizes[] =
    "Missing some patch size information from calibration file.";
inline constexpr char kConfigWithoutLegacyDataWithLegacy[] =
    "Unsupported use of configuration file without legacy patch boundaries and calibration data "
    "with legacy patch boundaries.";
inline constexpr char kConfigWithLegacyDataWithout[] =
    "Unsupported use of configuration file with legacy patch boundaries and calibration data "
    "without legacy patch boundaries.";
inline constexpr char kMismatchMiddle[] = " from input data does not match lsc.";
inline constexpr char kMismatchSuffix[] = " in configuration file.";
inline constexpr char kDimensionsPrefix[] = "Input image dimensions (";
inline constexpr char kDimensionsMiddle[] = ") do not match expected dimensions for sensor (";
inline constexpr char kDimensionsSuffix[] = ").";

} // namespace config::msg
