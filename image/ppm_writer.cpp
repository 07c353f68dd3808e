#include "image/ppm_writer.h"

#include <cmath>
#include <cstdint>
#include <cstring>
#include <new>
#include <string>
#include <vector>

#include "image/export_messages.h"
#include "image/image_result.h"
#include "image/output_file.h"

namespace img {

namespace {

namespace text = img::exportText;

constexpr std::uint32_t kFloatMaxValue = 65535;

std::uint32_t integerMaxValue(const ImageBuffer& image) {
    const int bits = image.bitsPerSample;
    if (bits >= 16)
        return 65535;
    return bits < 1 ? 1 : (std::uint32_t{1} << bits) - 1;
}

// A metadata value on lines of its own would end the header for any reader;
// every line of it is written as a comment.
void appendMetadataComment(std::string& header, const MetadataEntry& entry) {
    std::string block;
    text::appendMetadataBlock(block, entry);
    const std::size_t valueStart = block.find('\n') + 1;
    const std::size_t valueEnd = valueStart + std::strlen(entry.value);
    header.append(block, 0, valueStart);
    header += "# ";
    for (std::size_t i = valueStart; i < valueEnd; ++i) {
        header += block[i];
        if (block[i] == '\n')
            header += "# ";
    }
    header.append(block, valueEnd, std::string::npos);
}

std::string buildHeader(const ImageBuffer& image, std::uint32_t maxValue) {
    std::string header = image.samplesPerPixel == 1 ? "P5\n" : "P6\n";
    text::appendFormatted(header, text::kPnmNumberOfImages, image.numberOfImages);
    text::appendFormatted(header, text::kPnmSamplesPerPixel,
                          static_cast<int>(image.samplesPerPixel));
    text::appendFormatted(header, text::kPnmPixelType, pixelTypeName(image.pixelType));
    // The pattern means something only for sensor images.
    if (image.pixelType == kPixelRaw)
        text::appendFormatted(header, text::kPnmCfa, cfaPatternName(image.cfa[1]));
    text::appendFormatted(header, text::kPnmBufferType, bufferTypeName(image.bufferType));
    text::appendFormatted(header, text::kPnmDataType, dataTypeName(image.dataType));
    text::appendLevelFields(
        header, image,
        {text::kPnmBlackVal, text::kPnmWhiteVal, text::kPnmMinClip, text::kPnmMaxClip}, true);
    header += '\n';
    for (const MetadataEntry* entry = image.metadata; entry; entry = entry->next)
        appendMetadataComment(header, *entry);
    if (image.dataType == kDataReal32)
        text::appendFormatted(header, text::kPnmSizeFloat, image.width, image.height,
                              static_cast<double>(maxValue));
    else
        text::appendFormatted(header, text::kPnmSizeInteger, image.width, image.height,
                              static_cast<int>(maxValue));
    return header;
}

std::uint32_t toLevel(std::uint8_t value, std::uint32_t maxValue) {
    return value < maxValue ? value : maxValue;
}
std::uint32_t toLevel(std::uint16_t value, std::uint32_t maxValue) {
    return value < maxValue ? value : maxValue;
}
std::uint32_t toLevel(std::int32_t value, std::uint32_t maxValue) {
    if (value <= 0)
        return 0;
    return static_cast<std::uint32_t>(value) < maxValue ? static_cast<std::uint32_t>(value)
                                                        : maxValue;
}
std::uint32_t toLevel(float value, std::uint32_t maxValue) {
    if (!(value > 0.0f)) // negative or NaN
        return 0;
    const float scaled = value * static_cast<float>(maxValue) + 0.5f;
    return scaled >= static_cast<float>(maxValue) ? maxValue : static_cast<std::uint32_t>(scaled);
}

// Converts one row, interleaving planar samples on the way.
template <typename Sample>
void convertRow(const ImageBuffer& image, std::uint32_t y, std::uint32_t maxValue,
                std::uint8_t* out) {
    const auto* samples = static_cast<const Sample*>(image.data);
    const std::uint64_t width = static_cast<std::uint64_t>(image.width);
    const std::uint64_t planeSize = width * static_cast<std::uint64_t>(image.height);
    const std::uint64_t count = image.samplesPerPixel;
    const bool planar = image.bufferType == kBufferPlanar;
    const bool wide = maxValue > 255;
    for (std::uint64_t x = 0; x < width; ++x) {
        for (std::uint64_t s = 0; s < count; ++s) {
            const std::uint64_t index =
                planar ? s * planeSize + y * width + x : (y * width + x) * count + s;
            const std::uint32_t level = toLevel(samples[index], maxValue);
            if (wide)
                *out++ = static_cast<std::uint8_t>(level >> 8);
            *out++ = static_cast<std::uint8_t>(level);
        }
    }
}

void convertRow(const ImageBuffer& image, std::uint32_t y, std::uint32_t maxValue,
                std::uint8_t* out) {
    switch (image.dataType) {
    case kDataUint8:
        convertRow<std::uint8_t>(image, y, maxValue, out);
        break;
    case kDataUint16:
        convertRow<std::uint16_t>(image, y, maxValue, out);
        break;
    case kDataInt32:
        convertRow<std::int32_t>(image, y, maxValue, out);
        break;
    default:
        convertRow<float>(image, y, maxValue, out);
        break;
    }
}

} // namespace

int ppmWrite(const char* path, const ImageBuffer* image) noexcept {
    if (!image || !image->data || image->width < 1 || image->height < 1)
        return img::kSizeMismatch;
    const int count = image->samplesPerPixel;
    if ((count != 1 && count != 3) || image->pixelType == kPixelYuv422 ||
        image->pixelType == kPixelYuv420 || imageSampleBytes(image->dataType) == 0)
        return img::kUnsupported;
    if (!path)
        return img::kBadArgument;

    const std::uint32_t maxValue =
        image->dataType == kDataReal32 ? kFloatMaxValue : integerMaxValue(*image);
    const std::uint64_t rowBytes = static_cast<std::uint64_t>(image->width) *
                                   static_cast<std::uint64_t>(count) * (maxValue > 255 ? 2 : 1);
    if (rowBytes > SIZE_MAX)
        return img::kNoMemory;
    std::string header;
    std::vector<std::uint8_t> row;
    try {
        header = buildHeader(*image, maxValue);
        row.resize(static_cast<std::size_t>(rowBytes));
    } catch (const std::bad_alloc&) {
        return img::kNoMemory;
    }

    OutputFile file;
    if (!file.open(path))
        return img::kBadArgument;
    bool written = std::fwrite(header.data(), 1, header.size(), file.stream()) == header.size();
    const std::uint32_t height = static_cast<std::uint32_t>(image->height);
    for (std::uint32_t y = 0; written && y < height; ++y) {
        convertRow(*image, y, maxValue, row.data());
        written = std::fwrite(row.data(), 1, row.size(), file.stream()) == row.size();
    }
    if (!written)
        return img::kIoError;
    return file.commit() ? img::kOk : img::kIoError;
}

} // namespace img
