#pragma once
// The delta ab files and the acceptance threshold.

#include <string>

#include "prep/delta_ab.h"

namespace prep {

// The delta file: one line per block row, every value with five decimals
// followed by ",", and an empty line at the end.
std::string formatDeltaFile(const DeltaAbResult& result);
// "meanChroma, maxDelta, deltaStdDev" with six significant digits, and a line feed.
std::string formatStatsFile(const DeltaAbResult& result);

// Both written through OutputFile. A file that cannot be created throws the
// std::string "Cannot open file : " + path; a failed write throws
// "Cannot write file : " + path, also as a std::string.
void writeDeltaFile(const std::string& path, const DeltaAbResult& result);
void writeStatsFile(const std::string& path, const DeltaAbResult& result);

// Throws std::range_error when maxDelta is above the threshold (or not a
// number); a value equal to the threshold passes.
void checkDeltaThreshold(float maxDelta, float threshold);

} // namespace prep
