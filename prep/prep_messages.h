#pragma once
// Every text the preparation and evaluation stages show the operator, in one
// place. The fixed texts are copied as the tool has always printed them.

namespace prep::msg {

// Planes, filter and down-sampling
inline constexpr char kInvalidWeaveFormat[] = "Invalid image format for Bayer interweaving.";
inline constexpr char kInvalidWeavePattern[] = "Invalid pattern size for Bayer interweaving.";
inline constexpr char kNotFloatImage[] = "Image preparation needs a floating-point image.";
inline constexpr char kNotBayerImage[] =
    "The flattened image must be a single-channel Bayer image.";
inline constexpr char kBadSamplingFactor[] = "The down-sampling factor must be at least 1.";
inline constexpr char kBadMedianSize[] = "The median filter size must be between 1 and 10.";

// Image checks
inline constexpr char kMinimumPixel[] = "Minimum pixel value = ";
inline constexpr char kMaximumPixel[] = "Maximum pixel value = ";
inline constexpr char kAveragePixel[] = "Average pixel value = ";
inline constexpr char kPixelsWithin[] = "Image pixels within specified parameters.";
inline constexpr char kPixelsNotWithin[] = "Image pixels are not within specified parameters of ";
inline constexpr char kPossibleCauses[] =
    "Some possible causes include light is not on, light in bad position, missing diffuser, "
    "poor quality flat field input image, damaged sensor, or invalid configuration for the "
    "sensor being used.";
inline constexpr char kOutOfRangeValue[] = "Out of range value: (";
inline constexpr char kPeakBelowMinimum[] =
    "Peak image pixel value below specified required minimum peak value of ";
inline constexpr char kPeakValue[] = "Peak image pixel value: ";

// Sample files
inline constexpr char kCannotOpenSampleOutput[] = "Cannot open sample output file: ";
inline constexpr char kCannotWriteSampleOutput[] = "Cannot write sample output file: ";
inline constexpr char kBadFullScale[] = "The full-scale value of a sample file must be at least 1.";
inline constexpr char kCannotOpenSampleInput[] = "Cannot open input sample file: ";
inline constexpr char kSampleInputTooLarge[] = "Input sample file is larger than 64 MiB: ";
inline constexpr char kExpectingLevels[] =
    "Expecting four maximum channel values separated by commas at the beginning of the sample "
    "file.";
inline constexpr char kExpectingDimensions[] =
    "Expecting a width, height and channel count separated by commas on the second line of the "
    "sample file.";
inline constexpr char kBadChannelCount[] = "The channel count in the sample file must be positive.";
inline constexpr char kDimensionsMismatch[] =
    "Width and height in sample file does not match input image dimensions.";
inline constexpr char kInvalidSampleFormat[] = "Invalid format in sample file.";
inline constexpr char kSampleOutsideImage[] =
    "A sample point in the sample file lies outside the image.";

// White balance and delta ab
inline constexpr char kNoCentrePixels[] =
    "The centre of the flattened image does not hold pixels of all four colour channels.";
inline constexpr char kBadChannelLevel[] =
    "A colour channel of the flattened image has no positive level; it cannot be white balanced.";
inline constexpr char kImageTooSmallForLevels[] =
    "The flattened image is too small to measure its channel levels.";
inline constexpr char kNoDeltaBlocks[] = "The delta ab block counts must be at least 1.";
inline constexpr char kDeltaBlocksTooSmall[] =
    "The flattened image is too small for the delta ab block grid.";
inline constexpr char kDeltaGridMismatch[] = "The delta ab results do not match the block grid.";
inline constexpr char kNoGreenSignal[] =
    "The flattened image has no green signal; its delta ab cannot be measured.";
inline constexpr char kCannotOpenFile[] = "Cannot open file : ";
inline constexpr char kCannotWriteFile[] = "Cannot write file : ";
inline constexpr char kDeltaAboveThreshold[] = "Maximum delta ab is greater than threshold of ";
inline constexpr char kLumaAboveThreshold[] =
    "Maximum luminance residual is greater than threshold of ";
inline constexpr char kLumaNotMeasured[] =
    "The luminance residual cannot be measured: the flattened image does not fill the delta ab "
    "block grid or holds no light.";

} // namespace prep::msg
