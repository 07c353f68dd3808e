#pragma once

namespace img {

// Result codes of the image library. Every procedural function returns one of
// these (or reports it through an out parameter); none of them throws.

constexpr int kOk = 0;
constexpr int kBadArgument = -1; // bad argument, or the file cannot be opened
constexpr int kIoError = -2;     // read or write error
constexpr int kNoMemory = -3;
constexpr int kWrongFormat = -4;  // not the expected format
constexpr int kSizeMismatch = -5; // missing data or size mismatch
constexpr int kUnsupported = -6;  // unsupported combination
constexpr int kRawBadContainer =
    -21; // container without header/pixel block, fixed-header file of wrong size
constexpr int kRawBadNkraw = -22;  // NKRAW file of the wrong size
constexpr int kRawBadLayout = -23; // interactive raw layout does not match the file
constexpr int kImageTooLarge =
    -24; // declared image beyond the sample memory limit (sample_memory.h)

} // namespace img
