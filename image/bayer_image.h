#pragma once
// The driver's image object: owns one ImageBuffer whose samples are REAL32,
// normalised so that 1.0 is the sensor's full scale, and turns the image
// library's result codes into exceptions (std::runtime_error with a fixed text).

#include <cstdint>
#include <string>

#include "image/image_buffer.h"
#include "image/image_result.h"

namespace img {

// Throws "Cannot read kqraw image." (or the image-too-large message for that
// result) with a detail line naming `path` and the reason: the system's when
// the file does not open or read, else what the raw reader's `result` says.
[[noreturn]] void throwCannotReadCapture(const std::string& path, int result);

class BayerImage {
public:
    BayerImage() = default;
    BayerImage(BayerImage&&) noexcept = default;
    BayerImage& operator=(BayerImage&&) noexcept = default;

    // Reads a raw file (fixed-header, chunked container, NKRAW, or a dump
    // whose layout is asked on the console) and normalises each sample s to
    // (s & (2^bits - 1)) / (2^bits - 1) in one pass. On failure the object
    // holds no image.
    void read(const std::string& path);
    // The same for an image that a raw reader made (UINT8 or UINT16 samples,
    // read(path) ends here). Null: "Cannot read kqraw image.".
    void adoptRaw(ImagePtr raw, int readResult = img::kOk);
    // Only the dimensions, depth, pattern, levels and metadata of a raw
    // reader's image: a capture whose samples went elsewhere (a preparation
    // that reads them as a stream). The object then holds no samples.
    void adoptHeader(const ImageBuffer& raw);
    bool hasSamples() const { return buffer_ && buffer_->data; }

    // A new sensor image for headerless raw data; the capture data go into a
    // KQRAW fixed header (fixedHeader) or a KQRAW2 container. Without
    // `withSamples` it holds none (the samples go to a stream).
    void createFromHeaderless(std::int32_t width, std::int32_t height, std::uint16_t bits,
                              std::uint32_t cfa, float exposureTime, float gain,
                              const std::string& serialNumber, const std::string& sensorGuid,
                              bool fixedHeader, bool withSamples = true);

    // A new image with the template's bitsPerSample, numberOfImages and data
    // type and the given geometry; metadata copied from the template.
    void createLike(const BayerImage& templateImage, std::int32_t width, std::int32_t height,
                    std::uint16_t samplesPerPixel, std::uint32_t cfa0, std::uint32_t cfa1,
                    std::uint32_t pixelType, std::uint32_t bufferType);

    void copy(const BayerImage& source);         // pixels and metadata
    void copyMetadata(const BayerImage& source); // metadata and raw header only

    // Rounds the samples back to the bit depth and writes them in the file
    // type the image carries: KQRAW2, KQRAW (also for an NKRAW image, whose
    // capture data are translated) or, for a dump read by layout, FIXRAW.
    void storeKqraw(const std::string& path) const;
    void storeJpeg(const std::string& path, int quality) const;
    void storeBmp(const std::string& path) const;

    float exposureTime() const;
    float channelGain(int channel) const;
    // The module serial number. KQRAW2: the SENSORINFO serial string, cut to
    // maxLength characters unless maxLength is 0. KQRAW: maxLength / 2 bytes
    // of the 16-byte binary field (all 16 at most) as lowercase hex digits.
    std::string serialNumber(std::size_t maxLength) const;
    // True when the image carries a fixed header, the one raw header with a
    // sensor GUID field.
    bool hasFixedHeader() const;
    // KQRAW only: the text read as a hexadecimal number into the header.
    void setSensorGuid(const std::string& guidHex);
    bool samePixels(const BayerImage& other) const;

    // Takes ownership of a buffer (the previous one is released).
    void reset(ImageBuffer* buffer = nullptr) { buffer_.reset(buffer); }
    bool empty() const { return !buffer_; }
    ImageBuffer* buffer() { return buffer_.get(); }
    const ImageBuffer* buffer() const { return buffer_.get(); }

    std::int32_t width() const { return buffer_->width; }
    std::int32_t height() const { return buffer_->height; }
    std::uint16_t bitsPerSample() const { return buffer_->bitsPerSample; }
    std::uint16_t channels() const { return buffer_->samplesPerPixel; }
    std::uint32_t cfa() const { return buffer_->cfa[1]; }
    float* pixels() { return static_cast<float*>(buffer_->data); }
    const float* pixels() const { return static_cast<const float*>(buffer_->data); }

private:
    ImagePtr buffer_;
};

} // namespace img
