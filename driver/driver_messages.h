#pragma once

namespace driver {

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
inline constexpr char kTooManyFramesPrefix[] = "At most ";
inline constexpr char kTooManyFramesMiddle[] = " input frames can be averaged; --input is given ";
inline constexpr char kTooManyFramesSuffix[] = " times.";
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

// Stages: the failing one is named in the report and the run result
inline constexpr char kStageReadingTheConfiguration[] = "Reading the configuration";
inline constexpr char kStageLoadingTheInputImage[] = "Loading the input image";
inline constexpr char kStageCheckingTheInputImage[] = "Checking the input image";
inline constexpr char kStagePreparingTheImage[] = "Preparing the image";
inline constexpr char kStageCheckingThePreparedImage[] = "Checking the prepared image";
inline constexpr char kStageChoosingThePatchLayout[] = "Choosing the patch layout";
inline constexpr char kStageObtainingTheSamples[] = "Obtaining the samples";
inline constexpr char kStageFittingTheLensShadingSurface[] = "Fitting the lens shading surface";
inline constexpr char kStageWritingTheCalibrationRegisterFile[] =
    "Writing the calibration register file";
inline constexpr char kStageBinaryCalibrationData[] = "Binary calibration data";
inline constexpr char kStageCorrectingTheLensShading[] = "Correcting the lens shading";
inline constexpr char kStageWhiteBalance[] = "White balance";
inline constexpr char kStageDeltaAb[] = "Delta ab";
inline constexpr char kStageLuminanceResidual[] = "Luminance residual";
inline constexpr char kStageWritingTheFlattenedImages[] = "Writing the flattened images";
inline constexpr char kStageWritingTheCheckImage[] = "Writing the check image";

// Progress lines
inline constexpr char kProgressWritingCalibrationReport[] = "Writing calibration report.";
inline constexpr char kProgressWritingRunResult[] = "Writing run result.";
inline constexpr char kProgressInputImageData[] = "Input image data:";
inline constexpr char kProgressPreprocessedImageData[] = "Preprocessed image data:";
inline constexpr char kProgressPerformingIdentityTest[] = "Performing identity test.";
inline constexpr char kProgressCreateSamplesFromImage[] = "Create samples from image.";
inline constexpr char kProgressLoadingSamplePointsFromFile[] = "Loading sample points from file.";
inline constexpr char kProgressComputingLensShadingSurface[] = "Computing lens shading surface.";
inline constexpr char kProgressXTestModeSpecified[] = "X test mode specified.";
inline constexpr char kProgressGeneratingConfigurationFile[] = "Generating configuration file.";
inline constexpr char kProgressReadingCalibrationData[] = "Reading calibration data.";
inline constexpr char kProgressReadingAutofocusCalibrationData[] =
    "Reading autofocus calibration data.";
inline constexpr char kProgressGeneratingBinaryCalibrationData[] =
    "Generating binary calibration data.";
inline constexpr char kProgressReadingBinaryCalibrationData[] = "Reading binary calibration data.";
inline constexpr char kProgressStartCorrectingLensShading[] = "Start correcting lens shading.";
inline constexpr char kProgressPerformingWhiteBalancing[] = "Performing white balancing.";
inline constexpr char kProgressCalculatingDeltaAB[] = "Calculating deltaAB.";
inline constexpr char kProgressWritingDeltaAbData[] = "Writing delta ab data.";
inline constexpr char kProgressWritingFullResolutionCheckImage[] =
    "Writing full-resolution check image.";
inline constexpr char kProgressCompleted[] = "Completed.";
inline constexpr char kProgressSavingRawInputFileInJpegFormat[] =
    "Saving raw input file in jpeg format.";
inline constexpr char kProgressSavingRawInputFileInBmpFormat[] =
    "Saving raw input file in bmp format.";
inline constexpr char kProgressWritingFlattenedImage[] = "Writing flattened image.";
inline constexpr char kProgressWritingFlattenedJpegImage[] = "Writing flattened jpeg image.";
inline constexpr char kProgressWritingFlattenedBmpImage[] = "Writing flattened bmp image.";

// Timer lines (--debug)
inline constexpr char kTimerReadingConfiguration[] = "Reading configuration: ";
inline constexpr char kTimerProcessesConfiguration[] = "Processes configuration: ";
inline constexpr char kTimerImageLoadTime[] = "Image load time: ";
inline constexpr char kTimerImageInspectionTime[] = "Image inspection time: ";
inline constexpr char kTimerBayerDeinterweaveTime[] = "Bayer deinterweave time: ";
inline constexpr char kTimerMedianFilterAndDownSamplingTime[] =
    "Median filter and down sampling time: ";
inline constexpr char kTimerBayerInterweaveTime[] = "Bayer interweave time: ";
inline constexpr char kTimerImageCheckingTime[] = "Image checking time: ";
inline constexpr char kTimerLensShadingCalculationTime[] = "Lens shading calculation time: ";
inline constexpr char kTimerReadCalibrationTime[] = "Read calibration time: ";
inline constexpr char kTimerBinaryDataConstructionTime[] = "Binary data construction time: ";
inline constexpr char kTimerBinaryDataSaveTime[] = "Binary data save time: ";
inline constexpr char kTimerBinaryDataReadingTime[] = "Binary data reading time: ";
inline constexpr char kTimerBinaryDataParsingTime[] = "Binary data parsing time: ";
inline constexpr char kTimerBinaryDataTransferTime[] = "Binary data transfer time: ";
inline constexpr char kTimerApplyLensShadingTime[] = "Apply lens shading time: ";
inline constexpr char kTimerWhiteBalanceTime[] = "White balance time: ";
inline constexpr char kTimerCalculateDeltaAbTime[] = "Calculate delta ab time: ";
inline constexpr char kTimerPatchLayoutTime[] = "Patch layout time: ";
inline constexpr char kTimerCheckImageSaveTime[] = "Check image save time: ";
inline constexpr char kTimerJPEGImageSaveTime[] = "JPEG image save time: ";
inline constexpr char kTimerBMPImageSaveTime[] = "BMP image save time: ";
inline constexpr char kTimerFlattenedRawImageSaveTime[] = "Flattened raw image save time: ";
inline constexpr char kTimerFlattenedJPEGImageSaveTime[] = "Flattened JPEG image save time: ";
inline constexpr char kTimerFlattenedBMPImageSaveTime[] = "Flattened BMP image save time: ";

// Parts of progress lines, each followed by a figure
inline constexpr char kRedRatio[] = "R/G: ";
inline constexpr char kBlueRatio[] = "B/G: ";
inline constexpr char kMeasuredLabel[] = "Measured ";
inline constexpr char kFlattenedMeasuredLabel[] = "Flattened image measured ";
inline constexpr char kStartLabel[] = "Start: ";
inline constexpr char kExecutionTimeLabel[] = "Execution time:";
inline constexpr char kInputFileLabel[] = "Input file: ";
inline constexpr char kFramesAveragedLabel[] = "Input frames averaged: ";
inline constexpr char kPreprocessedFileLabel[] = "Preprocessed image file: ";
inline constexpr char kExposureTimeLabel[] = "Exposure time = ";
inline constexpr char kSensorGainPrefix[] = "Sensor gain = { ";
inline constexpr char kListSeparator[] = ", ";
inline constexpr char kSensorGainSuffix[] = " }";
inline constexpr char kDeltaBlocksLabel[] = "Delta ab blocks: ";
inline constexpr char kBlocksBy[] = " x ";
inline constexpr char kMaximumDeltaLabel[] = "Maximum delta ab: ";
inline constexpr char kMaximumLumaLabel[] = "Maximum luminance residual: ";
inline constexpr char kPerCent[] = " %";
inline constexpr char kPatchLayoutLabel[] = "Patch layout: ";
inline constexpr char kPatchLayoutCandidatesPrefix[] = " (the flattest of ";
inline constexpr char kPatchLayoutCandidatesSuffix[] = ")";
inline constexpr char kProgressXTestSurface[] =
    "Forcing lens shading surface to produce an X shaped color distortion.";
inline constexpr char kBitDepthDiffersPrefix[] = "WARNING - Bit depth of input image (";
inline constexpr char kBitDepthDiffersMiddle[] =
    ") is different than bit depth specified by shared.bit_res (";
inline constexpr char kBitDepthDiffersSuffix[] = ").";
inline constexpr char kBadSensorGuidPrefix[] = "Invalid shared.sensor_guid value '";
inline constexpr char kBadSensorGuidSuffix[] =
    "' (a fixed-header raw image stores it as 1 to 16 hexadecimal digits).";

// Warnings, printed after kWarningPrefix and kept for the report and the result
inline constexpr char kWarningPrefix[] = "WARNING: ";
inline constexpr char kPedestalPrefix[] =
    "The noise of the capture shows a black level of at least ";
inline constexpr char kPedestalMiddle[] = ", but proc.black_level is ";
inline constexpr char kPedestalSuffix[] =
    ": the pedestal left in the samples under-corrects the corners.";
inline constexpr char kXTestWarning[] =
    "X-test run: the register file holds a test surface that distorts the colours on purpose, "
    "not a calibration of this module.";

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

} // namespace driver
