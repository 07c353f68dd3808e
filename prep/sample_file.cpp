#include "prep/sample_file.h"

#include <algorithm>
#include <cstdio>
#include <iterator>
#include <memory>
#include <stdexcept>

#include "image/file_ptr.h"
#include "image/output_file.h"
#include "lsc/sample_limit.h"
#include "prep/image_checks.h"
#include "prep/number_line.h"
#include "prep/prep_image.h"
#include "prep/prep_messages.h"

namespace prep {

using img::BayerImage;
using img::OutputFile;

using lsc::kChannels;
using lsc::SampleSet;
using lsc::shadingSample;
namespace {

// min(trunc(0.5 + v * S), S), with anything below zero (or not a number) as 0.
std::uint32_t toUnits(float value, std::uint32_t fullScale) {
    const double units = 0.5 + static_cast<double>(value * static_cast<float>(fullScale));
    if (!(units >= 0.0))
        return 0;
    return units >= fullScale ? fullScale : static_cast<std::uint32_t>(units);
}

void checkScale(const SampleFileScale& scale) {
    if (scale.samplingFactor < 1)
        throw std::invalid_argument(msg::kBadSamplingFactor);
    if (scale.fullScale < 1)
        throw std::invalid_argument(msg::kBadFullScale);
}

// Hands out the lines of a text that hold more than blanks, without their
// line ends.
class LineSource {
public:
    explicit LineSource(std::string_view text) : text_(text) {}
    bool next(std::string_view& line) {
        while (pos_ < text_.size()) {
            std::size_t end = text_.find('\n', pos_);
            if (end == std::string_view::npos)
                end = text_.size();
            line = text_.substr(pos_, end - pos_);
            pos_ = end + 1;
            if (line.find_first_not_of(" \t\r\v\f") != std::string_view::npos)
                return true;
        }
        return false;
    }

private:
    std::string_view text_;
    std::size_t pos_ = 0;
};

// Far more than the samples of any sensor; a device such as /dev/zero named
// as the sample file would otherwise be read until memory runs out.
constexpr std::size_t kMaxSampleFileBytes = std::size_t{64} << 20;

enum class ReadResult { kOk, kUnreadable, kTooLarge };

// The whole file, refused when it cannot be opened or read or is too large.
ReadResult readWholeFile(const std::string& path, std::string& text) {
    img::FilePtr file(std::fopen(path.c_str(), "rb"));
    if (!file)
        return ReadResult::kUnreadable;
    char block[65536];
    std::size_t got;
    while ((got = std::fread(block, 1, sizeof block, file.get())) > 0) {
        if (text.size() + got > kMaxSampleFileBytes)
            return ReadResult::kTooLarge;
        text.append(block, got);
    }
    return std::ferror(file.get()) == 0 ? ReadResult::kOk : ReadResult::kUnreadable;
}

} // namespace

std::uint16_t sampleFullScale(int bits) {
    return static_cast<std::uint16_t>(fullScale(bits));
}

std::string formatSampleFile(const float (&targetLevels)[kChannels],
                             const std::vector<shadingSample>& samples, std::int32_t width,
                             std::int32_t height, const SampleFileScale& scale) {
    checkScale(scale);
    const std::int64_t factor = scale.samplingFactor;
    std::string text;
    for (int k = 0; k < kChannels; ++k) {
        text += std::to_string(toUnits(targetLevels[k], scale.fullScale));
        text += k + 1 < kChannels ? ',' : '\n';
    }
    text += std::to_string(width * factor) + ',' + std::to_string(height * factor) + ",4\n";
    for (const shadingSample& sample : samples) {
        text += std::to_string(sample.x * factor) + ',' + std::to_string(sample.y * factor);
        for (float value : sample.value)
            text += ',' + std::to_string(toUnits(value, scale.fullScale));
        text += '\n';
    }
    return text;
}

SampleSet parseSampleFile(std::string_view text, std::int32_t width, std::int32_t height,
                          const SampleFileScale& scale) {
    checkScale(scale);
    const float fullScale = static_cast<float>(scale.fullScale);
    const std::int32_t factor = scale.samplingFactor;
    LineSource lines(text);
    std::string_view line;
    SampleSet set;

    {
        const bool present = lines.next(line);
        NumberLine levels(line);
        std::int32_t values[kChannels];
        for (int k = 0; k < kChannels; ++k) {
            if (k > 0)
                levels.expect(',');
            values[k] = levels.integer();
        }
        levels.expectEnd();
        if (!present || !levels.ok())
            throw std::runtime_error(msg::kExpectingLevels);
        for (int k = 0; k < kChannels; ++k)
            set.targetLevels[k] = static_cast<float>(values[k]) / fullScale;
    }
    {
        const bool present = lines.next(line);
        NumberLine size(line);
        const std::int32_t fileWidth = size.integer();
        size.expect(',');
        const std::int32_t fileHeight = size.integer();
        size.expect(',');
        const std::int32_t channels = size.integer();
        size.expectEnd();
        if (!present || !size.ok())
            throw std::runtime_error(msg::kExpectingDimensions);
        if (channels < 1)
            throw std::runtime_error(msg::kBadChannelCount);
        if (fileWidth / factor != width || fileHeight / factor != height)
            throw std::runtime_error(msg::kDimensionsMismatch);
    }
    while (lines.next(line)) {
        NumberLine record(line);
        const std::int32_t x = record.integer();
        record.expect(',');
        const std::int32_t y = record.integer();
        shadingSample sample{};
        for (float& value : sample.value) {
            record.expect(',');
            value = record.decimal() / fullScale;
        }
        record.expectEnd();
        if (!record.ok())
            throw std::runtime_error(msg::kInvalidSampleFormat);
        if (x < 0 || y < 0 || x / factor >= width || y / factor >= height)
            throw std::runtime_error(msg::kSampleOutsideImage);
        sample.x = static_cast<std::uint32_t>(x / factor);
        sample.y = static_cast<std::uint32_t>(y / factor);
        set.samples.push_back(sample);
        lsc::checkSampleCount(set.samples.size());
    }
    return set;
}

void writeSampleFile(const std::string& path, const SampleSet& set, const BayerImage& image,
                     const SampleFileScale& scale) {
    requireFloatImage(image);
    const std::string text =
        formatSampleFile(set.targetLevels, set.samples, image.width(), image.height(), scale);
    OutputFile file;
    if (!file.open(path))
        throw std::runtime_error(msg::kCannotOpenSampleOutput + path);
    if (std::fwrite(text.data(), 1, text.size(), file.stream()) != text.size() || !file.commit())
        throw std::runtime_error(msg::kCannotWriteSampleOutput + path);
}

SampleSet readSampleFile(const std::string& path, const BayerImage& image,
                         const SampleFileScale& scale) {
    requireFloatImage(image);
    std::string text;
    const ReadResult read = readWholeFile(path, text);
    if (read == ReadResult::kTooLarge)
        throw std::runtime_error(msg::kSampleInputTooLarge + path);
    if (read != ReadResult::kOk)
        throw std::runtime_error(msg::kCannotOpenSampleInput + path);
    return parseSampleFile(text, image.width(), image.height(), scale);
}

} // namespace prep
