#pragma once
// Every text the binary calibration data code reports or prints.

namespace blob::msg {

// Reading
inline constexpr char kCorrupt[] = "Binary calibration data is corrupt.";
inline constexpr char kCorruptOrTruncated[] = "Binary calibration data is corrupt or truncated.";
inline constexpr char kBadMagic[] = "Magic number does not match.";
inline constexpr char kWrongVersion[] = "Wrong blob version.";
inline constexpr char kLightSourceMismatch[] = "Two different light sources in lens shading data.";
inline constexpr char kBadDigest[] = "Bad CRC value";
inline constexpr char kUnknownBlock[] = "Unknown header type found.";
inline constexpr char kInvalidDate[] = "Invalid config file date: "; // + the number
inline constexpr char kCodeTooWideToRead[] =
    "Compressed data values larger than 32 bits are not supported.";

inline constexpr char kDigestFailed[] = "MD5 digest could not be computed.";

// Value code
inline constexpr char kInvalidFormat[] = "invalid float encoding format";

// Writing
inline constexpr char kInvalidDateSetting[] =
    "Invalid value for shared.cfg_file_date attribute (must be YYYY-MM-DDTHH:MM).";
inline constexpr char kNoDateWarning[] =
    "WARNING: No shared.cfg_file_date attribute specified in config file.";
inline constexpr char kOnlyCompressed[] = "Only compressed LSC data is supported.";
inline constexpr char kInvalidCompressionFormat[] =
    "Invalid compression format in configuration file.";
inline constexpr char kCodeTooWide[] =
    "Compressed data values larger than 16 bits are not supported.";
inline constexpr char kPointCountNotSupported[] =
    "Specifying the number of control points is not is not supported.";
inline constexpr char kValueOutOfRangeStart[] = "Lens shading value ("; // + value
inline constexpr char kValueOutOfRangeEnd[] =
    ") is outside of the range allowed for the lensShading.compression_res value specified in "
    "the configuration file.\n"
    "Possible reasons include poor calibration image, invalid configuration file, or "
    "configuration file values that do not match the sensor being used.\n";
inline constexpr char kToleranceExceeded[] =
    "Compressed float value difference from original is beyond acceptable tolerance.\n";

// Writing: values the fields cannot hold. Each starts "Value for " + path.
inline constexpr char kValueFor[] = "Value for ";
inline constexpr char kMissingValue[] = "Missing value for "; // + path + "."
inline constexpr char kNotWholeNumber[] = " is not a whole number.";
inline constexpr char kDoesNotFitStart[] =
    " does not fit in the binary calibration data, value must be between "; // lo " and " hi "."
inline constexpr char kInvalidSerial[] =
    " is not a valid serial number, it must be an even number of hexadecimal digits.";
inline constexpr char kSerialTooLong[] = " is too long for the binary calibration data.";
inline constexpr char kTooManyPairs[] =
    " has more than 255 pairs, more than the binary calibration data can hold.";
inline constexpr char kEmptyPosture[] = " is empty, a posture character is needed.";
inline constexpr char kLongPosture[] = " must be a single posture character.";
inline constexpr char kNotAPair[] = " must hold two values, a pair of focus distances.";
inline constexpr char kTooLarge[] =
    "Binary calibration data too large: block offsets must stay below 64 KiB.";

} // namespace blob::msg
