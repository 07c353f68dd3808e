#include "image/bmp_writer.h"

#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <memory>

#include "image/image_result.h"
#include "image/output_file.h"

namespace img {

namespace {

constexpr std::uint32_t kFileHeaderSize = 14;
constexpr std::uint32_t kInfoHeaderSize = 40;
constexpr std::uint32_t kPaletteSize = 256 * 4;

struct FreeDeleter {
    void operator()(void* block) const noexcept { std::free(block); }
};

void storeLe16(std::uint8_t* at, std::uint32_t value) {
    at[0] = static_cast<std::uint8_t>(value);
    at[1] = static_cast<std::uint8_t>(value >> 8);
}

void storeLe32(std::uint8_t* at, std::uint32_t value) {
    storeLe16(at, value & 0xFFFF);
    storeLe16(at + 2, value >> 16);
}

// File header, info header and (for grey images) the palette, in one block.
void buildHeader(std::uint8_t* header, const ImageBuffer* image, std::uint32_t fileSize,
                 std::uint32_t dataOffset) {
    std::memset(header, 0, dataOffset);
    header[0] = 'B';
    header[1] = 'M';
    storeLe32(header + 2, fileSize);
    storeLe32(header + 10, dataOffset);
    std::uint8_t* info = header + kFileHeaderSize;
    storeLe32(info, kInfoHeaderSize);
    storeLe32(info + 4, static_cast<std::uint32_t>(image->width));
    storeLe32(info + 8, static_cast<std::uint32_t>(image->height));
    storeLe16(info + 12, 1);
    storeLe16(info + 14, 8u * image->samplesPerPixel);
    if (image->samplesPerPixel == 1) {
        std::uint8_t* palette = info + kInfoHeaderSize;
        for (int i = 0; i < 256; ++i) {
            const auto grey = static_cast<std::uint8_t>(i);
            palette[4 * i] = palette[4 * i + 1] = palette[4 * i + 2] = grey;
        }
    }
}

void fillRow(std::uint8_t* row, const std::uint8_t* source, std::size_t width, int samples) {
    if (samples == 1) {
        std::memcpy(row, source, width);
        return;
    }
    for (std::size_t x = 0; x < width; ++x) {
        row[3 * x] = source[3 * x + 2];
        row[3 * x + 1] = source[3 * x + 1];
        row[3 * x + 2] = source[3 * x];
    }
}

} // namespace

int bmpWrite(const char* path, const ImageBuffer* image) noexcept {
    if (!image || !image->data || image->width < 1 || image->height < 1)
        return img::kSizeMismatch;
    const int samples = image->samplesPerPixel;
    if (image->dataType != kDataUint8 || (samples != 1 && samples != 3))
        return img::kUnsupported;
    if (!path)
        return img::kBadArgument;

    const std::uint32_t dataOffset =
        kFileHeaderSize + kInfoHeaderSize + (samples == 1 ? kPaletteSize : 0);
    const std::uint64_t width = static_cast<std::uint64_t>(image->width);
    const std::uint64_t rowBytes = width * static_cast<std::uint64_t>(samples);
    const std::uint64_t paddedRow = (rowBytes + 3) & ~std::uint64_t{3};
    const std::uint64_t fileSize =
        dataOffset + static_cast<std::uint64_t>(image->height) * paddedRow;
    // The size field has 32 bits: a larger bitmap could not be read back.
    if (fileSize > UINT32_MAX)
        return img::kUnsupported;

    std::uint8_t header[kFileHeaderSize + kInfoHeaderSize + kPaletteSize];
    buildHeader(header, image, static_cast<std::uint32_t>(fileSize), dataOffset);

    // Zeroed once: the padding bytes at the end stay zero for every row.
    const std::unique_ptr<std::uint8_t, FreeDeleter> rowBuffer(
        static_cast<std::uint8_t*>(std::calloc(static_cast<std::size_t>(paddedRow), 1)));
    std::uint8_t* row = rowBuffer.get();
    if (!row)
        return img::kNoMemory;
    OutputFile file;
    if (!file.open(path))
        return img::kBadArgument;
    bool written = std::fwrite(header, 1, dataOffset, file.stream()) == dataOffset;
    const auto* pixels = static_cast<const std::uint8_t*>(image->data);
    for (std::int32_t y = image->height - 1; written && y >= 0; --y) {
        fillRow(row, pixels + static_cast<std::uint64_t>(y) * rowBytes,
                static_cast<std::size_t>(width), samples);
        written =
            std::fwrite(row, 1, static_cast<std::size_t>(paddedRow), file.stream()) == paddedRow;
    }
    if (!written)
        return img::kIoError;
    return file.commit() ? img::kOk : img::kIoError;
}

} // namespace img
