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
// The second line of the help text, naming what every calibration run needs.
inline constexpr char kUsageLine[] =
    "Usage: lsc --config FILE --input FILE --calibrate FILE [options]";

// Top-level error report
inline constexpr char kErrorPrefix[] = "ERROR: ";
inline constexpr char kNoMemory[] = "ERROR: Cannot allocate memory.";
inline constexpr char kUnknownError[] = "Unknown error.";
inline constexpr char kInfoFileWrite[] = "ERROR: Unable to write information file.";

// Info file
inline constexpr char kInfoFileOpen[] = "Unable to output information file.";
inline constexpr char kInfoFileOpenHint[] = "Likely a file protection issue.";

// Pipeline
inline constexpr char kMedianTooLarge[] =
    "The value of proc.median_filter_size in the configuration file is too large.";
inline constexpr char kUnknownBayerOrder[] =
    "Unknown Bayer order in the input image: its Bayer code is none of RGGB, GRBG, GBRG and "
    "BGGR.";
inline constexpr char kNoInput[] = "An input flat field image must be specified.";
inline constexpr char kDimensionsPrefix[] = "Input image dimensions (";
inline constexpr char kDimensionsMiddle[] = ") do not match expected dimensions for sensor (";
inline constexpr char kPixelsWithin[] = "Image pixels within specified parameters.";
inline constexpr char kNoGreenSignal[] =
    "The green channels have no signal; the colour balance cannot be measured.";
inline constexpr char kIdentityMismatch[] =
    "WARNING - Not all output image pixels match input image pixels.";

// Binary calibration data
inline constexpr char kAutoLayoutNeedsFactors[] =
    "lsc.patch_layout = auto chooses patch factors; it cannot be used with patch sizes in pixels "
    "(lsc.left_patch_width and the others).";
inline constexpr char kBinaryNeedsCalibrate[] =
    "Binary calibration data (--binary) can only be built with a calibration register file "
    "(--calibrate).";
inline constexpr char kAutofocusNeedsBinary[] =
    "Autofocus calibration data (--autofocus) can only be included in binary calibration data "
    "(--binary).";
inline constexpr char kCannotStoreBinary[] = "Cannot store binary calibration file.";
inline constexpr char kCannotWriteDump[] =
    "Cannot write the text of the binary calibration data to standard output.";

// Headerless raw input
inline constexpr char kDetailsUnreadable[] = "Unable to read headerless raw image details file.";
inline constexpr char kDetailsUnreadableHint[] =
    "Likely incorrect file name of headerless raw image details file specified.";
inline constexpr char kSerialOdd[] = "Serial number must be an even number of characters: ";
inline constexpr char kSerialTooLong[] = "Serial number cannot be more than 32 characters long: ";
inline constexpr char kSerialNotHex[] = "Serial number must consist of hexadecimal digits only: ";
inline constexpr char kSerialHint[] =
    "Likely incorrect serial number entered in headerless raw details file.";
inline constexpr char kRawOpen[] = "Unable to open image file: ";
inline constexpr char kRawOpenHint[] = "Likely file protection issues or the file doesn't exist.";
inline constexpr char kRawShortRow[] = "Unable to read raw scan line.";
inline constexpr char kRawShortRowHint[] =
    "The number of bytes read in headerless raw file did not match the scan line size. File "
    "likely truncated.";
inline constexpr char kRawTooLong[] = "Invalid headerless raw file configuration.";
inline constexpr char kRawTooLongHint[] =
    "The number of pixels in the headerless raw file did not match the image size specified in "
    "the headerless raw configuration file.";

} // namespace msg
