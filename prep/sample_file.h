#pragma once
// Sample files: the four target levels, the image size and one line per
// sample point, as comma-separated decimal numbers:
//
//   levels      "R,GR,GB,B"                 whole units of full scale S
//   size        "width,height,channels"     full-resolution pixels; the writer writes 4 channels
//   samples     "x,y,R,GR,GB,B"             full-resolution pixels; values in units of S
//
// The fit works on the prepared image, which is the full-resolution image
// reduced by the preparation sampling factor f. The writer multiplies the size
// and the coordinates by f and the reader divides them by f, so a file written
// by one run reads back in a run with the same settings; the reader checks the
// size against the prepared image. Levels and values are written in units of
// S and read back as fractions of full scale (divided by S), the units the fit
// and the register file use.

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "image/bayer_image.h"
#include "lsc/shading_sample.h"

namespace prep {

// S for a bit depth: 2^bits - 1 kept to 16 bits.
std::uint16_t sampleFullScale(int bits);

struct SampleFileScale {
    std::uint32_t fullScale = 0; // S; at least 1
    int samplingFactor = 1;      // f; at least 1
};

// The text of a sample file for a prepared image of width x height pixels.
std::string formatSampleFile(const float (&targetLevels)[lsc::kChannels],
                             const std::vector<lsc::shadingSample>& samples, std::int32_t width,
                             std::int32_t height, const SampleFileScale& scale);

// Parses a sample file for a prepared image of width x height pixels. Throws
// std::runtime_error with the message of the first problem; blank lines are
// skipped, blanks before a number and at the end of a line are allowed.
lsc::SampleSet parseSampleFile(std::string_view text, std::int32_t width, std::int32_t height,
                               const SampleFileScale& scale);

// The target levels and samples of `set` for `image` (the image they were
// taken from; its size is written). Written through OutputFile; throws
// std::runtime_error "Cannot open sample output file: " + path, or a write
// error naming the path.
void writeSampleFile(const std::string& path, const lsc::SampleSet& set,
                     const img::BayerImage& image, const SampleFileScale& scale);

// The target levels and samples of the file, for the prepared `image`.
// Throws std::runtime_error "Cannot open input sample file: " + path, or the
// parser's message.
lsc::SampleSet readSampleFile(const std::string& path, const img::BayerImage& image,
                              const SampleFileScale& scale);

} // namespace prep
