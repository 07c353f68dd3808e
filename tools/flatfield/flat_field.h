#pragma once
// Synthetic flat-field captures for tests, benchmarks and the example: radial
// vignetting around an optical centre, per-channel colour shading, sensor
// noise and defective pixels, in any Bayer order and bit depth. The exact
// shading that produced the samples is kept, so a test can tell how well a
// correction undoes it.

#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>
#include <vector>

namespace flatfield {

class ModuleShading;

struct FlatFieldShape {
    int width = 640;
    int height = 480;
    int bits = 10;                  // sample bit depth, 1..16
    std::uint32_t cfa = 0x23340000; // second cfa word: RGGB
    double centerLevel = 0.8;       // green level at the optical centre, fraction of full scale
    double cornerLevel = 0.5;       // green level in the corners relative to the centre, (0, 1]
    double centerX = 0.5, centerY = 0.5;             // optical centre, fraction of width and height
    double channelLevel[4] = {0.55, 1.0, 1.0, 0.65}; // R, GR, GB, B relative to green
    double colourShading = 0.08; // extra relative fall of red and rise of blue at the corners
    double noise = 0.0;          // standard deviation, fraction of full scale
    // When set, the shading measured on a real module replaces the radial
    // model (corner level, centre and colour shading are then unused), scaled
    // so that its brightest green is centerLevel.
    std::shared_ptr<const ModuleShading> module;
    // Photon-transfer noise, added to `noise`: photon shot noise of a pixel
    // whose full scale holds fullWell electrons (0: none), and read noise in
    // sample units.
    double fullWell = 0.0;
    double readNoise = 0.0;
    int defects = 0;    // hot and dead pixels, placed at random
    int blackLevel = 0; // pedestal added to every sample, in sample units
    std::uint32_t seed = 1;
};

struct FlatField {
    FlatFieldShape shape;
    std::vector<std::uint16_t> samples; // width * height, row-major
    // Sample indices (y * width + x) of the defects: hot ones at full scale, dead ones at 0.
    std::vector<std::size_t> hotPixels, deadPixels;

    // 2^bits - 1.
    std::uint32_t fullScale() const;
    // Channel (0 R, 1 GR, 2 GB, 3 B) of the pixel at (x, y) for this Bayer order.
    int channelAt(int x, int y) const;
    // The noiseless level of channel k at pixel position (x, y), fraction of full scale,
    // without the black level, before quantisation and clipping.
    double level(int channel, double x, double y) const;
    // With a module's shading: level() of every pixel's own channel, row-major.
    std::vector<float> exact;
    // Samples as fractions of full scale, (s & (2^bits - 1)) / (2^bits - 1).
    std::vector<float> normalized() const;
};

// Throws std::invalid_argument for a shape it cannot render (size, bits, cfa, levels).
FlatField makeFlatField(const FlatFieldShape& shape);

// Capture data that the raw files carry beside the pixels.
struct CaptureInfo {
    float exposureTime = 33.0f;
    float gains[4] = {1.0f, 1.0f, 1.0f, 1.0f};
    std::string serialNumber;     // text, as the camera stack writes it
    std::uint64_t sensorGuid = 0; // fixed-header file and details file only
};

// Creation time stamped into every header block: 2026-12-01 09:00 UTC, so files are reproducible.
constexpr std::uint32_t kCreationTime = 1796115600;
constexpr std::size_t kFixedHeaderSize = 298672;

// Whole files, built byte by byte in code (little-endian).
std::string kqraw2FileBytes(const FlatField& field, const CaptureInfo& capture = {});
// The serial number must be hexadecimal text of an even length up to 32 digits
// (std::invalid_argument otherwise); it lands in binary at +88.
std::string fixedHeaderFileBytes(const FlatField& field, const CaptureInfo& capture = {});
// Plain little-endian 16-bit samples, as a headerless raw file holds them.
std::string headerlessFileBytes(const FlatField& field);
// The details file that describes a headerless raw file (`image.width = 640` lines).
std::string headerlessDetailsText(const FlatField& field, const CaptureInfo& capture = {});

// Crafts containers block by block, including malformed ones, for reader tests.
class KqRawBuilder {
public:
    // The 36-byte file header block.
    KqRawBuilder& header(std::uint32_t width, std::uint32_t height, std::uint32_t bayerCode,
                         std::uint32_t bits = 10);
    // PIXELDATA: the two leading words 1 and 0, then the samples.
    KqRawBuilder& pixels(const std::vector<std::uint16_t>& samples);
    // CAPTURE: word 2, exposure time, gains at +28..+40, 56 bytes.
    KqRawBuilder& capture(float exposureTime, const float gains[4]);
    // SENSORINFO: word 1 and three length-prefixed strings.
    KqRawBuilder& sensorInfo(const std::string& first, const std::string& serial,
                             const std::string& third);
    KqRawBuilder& comment(const std::string& text);
    // Any block, with an explicit size field (which may lie) and reserved bytes.
    // The tag and the reserved bytes must be 16 bytes long (std::invalid_argument).
    KqRawBuilder& block(const std::string& tag16, const std::string& payload,
                        std::uint32_t sizeField,
                        const std::string& reserved16 = std::string(16, '\0'));
    KqRawBuilder& block(const std::string& tag16, const std::string& payload);
    KqRawBuilder& raw(const std::string& bytes); // anything, appended as is
    const std::string& bytes() const { return bytes_; }

private:
    std::string bytes_;
};

// The four-character Bayer code of a container header (0x52474742 for RGGB, ...); 0 for
// any other cfa.
std::uint32_t bayerCodeOf(std::uint32_t cfa);
// "RGGB", "GRBG", "GBRG" or "BGGR" and back; an empty text or 0 for anything else.
std::string bayerOrderName(std::uint32_t cfa);
std::uint32_t cfaOfBayerOrder(const std::string& name);

} // namespace flatfield
