#include "tools/flatfield/flat_field.h"

#include <algorithm>
#include <cmath>
#include <cstring>
#include <limits>
#include <locale>
#include <random>
#include <sstream>
#include <stdexcept>

#include "image/hex_text.h"
#include "tools/flatfield/module_shading.h"

namespace flatfield {

namespace {

struct BayerOrder {
    const char* name;
    std::uint32_t cfa;
    std::uint32_t code; // four-character code of a container header
    int phase;
};

constexpr BayerOrder kBayerOrders[] = {
    {"RGGB", 0x23340000, 0x52474742, 0},
    {"GRBG", 0x32430000, 0x47524247, 1},
    {"GBRG", 0x34230000, 0x47425247, 2},
    {"BGGR", 0x43320000, 0x42474752, 3},
};

const BayerOrder* findOrder(std::uint32_t cfa) {
    for (const auto& order : kBayerOrders)
        if (order.cfa == cfa)
            return &order;
    return nullptr;
}

int channelOf(int phase, int x, int y) {
    return ((x + phase) & 1) + ((y + (phase >> 1)) & 1) * 2;
}

// Normal deviates from a fixed-seed Mersenne Twister through Box-Muller, so that
// a seed gives the same image whatever the standard library's distributions do.
class GaussianSource {
public:
    explicit GaussianSource(std::uint32_t seed) : engine_(seed) {}

    double next() {
        if (hasSpare_) {
            hasSpare_ = false;
            return spare_;
        }
        const double radius = std::sqrt(-2.0 * std::log(uniform()));
        const double angle = kTwoPi * uniform();
        spare_ = radius * std::sin(angle);
        hasSpare_ = true;
        return radius * std::cos(angle);
    }

    // Uniform index in 0 .. n-1 (n below 2^32).
    std::uint64_t index(std::uint64_t n) { return (std::uint64_t{engine_()} * n) >> 32; }

private:
    static constexpr double kTwoPi = 6.283185307179586476925;

    // In (0, 1]: never 0, so the logarithm stays finite.
    double uniform() { return (static_cast<double>(engine_()) + 1.0) / 4294967296.0; }

    std::mt19937 engine_;
    bool hasSpare_ = false;
    double spare_ = 0.0;
};

// Radius of a pixel from the optical centre, normalised so that the image
// corners of a centred optic lie at 1.
struct Geometry {
    double cx, cy, halfDiagonal;

    explicit Geometry(const FlatFieldShape& shape)
        : cx(shape.centerX * (shape.width - 1)), cy(shape.centerY * (shape.height - 1)),
          halfDiagonal(0.5 * std::hypot(shape.width - 1.0, shape.height - 1.0)) {}

    double radiusSquared(double x, double y) const {
        if (halfDiagonal <= 0.0)
            return 0.0; // a single pixel has no falloff
        const double dx = (x - cx) / halfDiagonal, dy = (y - cy) / halfDiagonal;
        return dx * dx + dy * dy;
    }
};

// cos^4 law of a thin lens, 1 / (1 + k^2 r^2)^2, with k chosen so that r = 1
// falls to the corner level.
double vignetting(double cornerLevel, double r2) {
    const double k2 = 1.0 / std::sqrt(cornerLevel) - 1.0;
    const double t = 1.0 + k2 * r2;
    return 1.0 / (t * t);
}

double shadedLevel(const FlatFieldShape& shape, int channel, double r2) {
    double colour = 1.0;
    if (channel == 0)
        colour = 1.0 - shape.colourShading * r2;
    else if (channel == 3)
        colour = 1.0 + shape.colourShading * r2;
    return shape.centerLevel * shape.channelLevel[channel] * colour *
           vignetting(shape.cornerLevel, r2);
}

// Images beyond this are a mistake in a test, not a capture.
constexpr std::uint64_t kMaxPixels = std::uint64_t{1} << 28;

void validate(const FlatFieldShape& shape) {
    if (shape.width <= 0 || shape.height <= 0 ||
        std::uint64_t(shape.width) * std::uint64_t(shape.height) > kMaxPixels)
        throw std::invalid_argument("flat field: width and height must be positive and sane");
    if (shape.bits < 1 || shape.bits > 16)
        throw std::invalid_argument("flat field: bits must be 1..16");
    if (!findOrder(shape.cfa))
        throw std::invalid_argument("flat field: cfa is not one of the four Bayer orders");
    if (!(shape.cornerLevel > 0.0 && shape.cornerLevel <= 1.0))
        throw std::invalid_argument("flat field: corner level must lie in (0, 1]");
    if (!(shape.noise >= 0.0) || shape.defects < 0 || !(shape.fullWell >= 0.0) ||
        !(shape.readNoise >= 0.0))
        throw std::invalid_argument("flat field: noise and defects must not be negative");
}

void placeDefects(FlatField& field, GaussianSource& random) {
    const std::size_t count = field.samples.size();
    const std::size_t wanted = std::min<std::size_t>(std::size_t(field.shape.defects), count);
    std::vector<bool> taken(count, false);
    for (std::size_t i = 0; i < wanted; ++i) {
        std::size_t at;
        do {
            at = std::size_t(random.index(count));
        } while (taken[at]);
        taken[at] = true;
        const bool hot = i % 2 == 0;
        field.samples[at] = hot ? std::uint16_t(field.fullScale()) : 0;
        (hot ? field.hotPixels : field.deadPixels).push_back(at);
    }
}

void putU32(std::string& bytes, std::size_t at, std::uint32_t value) {
    for (int i = 0; i < 4; ++i)
        bytes[at + i] = char((value >> (8 * i)) & 0xFF);
}

void appendU32(std::string& bytes, std::uint32_t value) {
    bytes.append(4, '\0');
    putU32(bytes, bytes.size() - 4, value);
}

std::uint32_t floatBits(float value) {
    std::uint32_t bits;
    std::memcpy(&bits, &value, sizeof bits);
    return bits;
}

void appendString(std::string& bytes, const std::string& text) {
    appendU32(bytes, std::uint32_t(text.size()));
    bytes += text;
}

void appendSamples(std::string& bytes, const std::vector<std::uint16_t>& samples) {
    const std::size_t start = bytes.size();
    bytes.resize(start + 2 * samples.size());
    for (std::size_t i = 0; i < samples.size(); ++i) {
        bytes[start + 2 * i] = char(samples[i] & 0xFF);
        bytes[start + 2 * i + 1] = char(samples[i] >> 8);
    }
}

std::string serialBytes(const std::string& text) {
    if (text.size() % 2 != 0 || text.size() > 32)
        throw std::invalid_argument("serial number: up to 32 hexadecimal digits, even count");
    std::string bytes;
    for (std::size_t i = 0; i < text.size(); i += 2) {
        const int high = img::hexDigit(text[i]), low = img::hexDigit(text[i + 1]);
        if (high < 0 || low < 0)
            throw std::invalid_argument("serial number: not hexadecimal: " + text);
        bytes += char(high * 16 + low);
    }
    return bytes;
}

} // namespace

std::uint32_t FlatField::fullScale() const {
    return (std::uint32_t{1} << shape.bits) - 1;
}

int FlatField::channelAt(int x, int y) const {
    const BayerOrder* order = findOrder(shape.cfa);
    return channelOf(order ? order->phase : 0, x, y);
}

double FlatField::level(int channel, double x, double y) const {
    if (shape.module)
        return shape.centerLevel *
               shape.module->at(channel, x + 0.5, y + 0.5, shape.width, shape.height);
    return shadedLevel(shape, channel, Geometry(shape).radiusSquared(x, y));
}

std::vector<float> FlatField::normalized() const {
    const std::uint32_t scale = fullScale();
    std::vector<float> values(samples.size());
    for (std::size_t i = 0; i < samples.size(); ++i)
        values[i] = float(samples[i] & scale) / float(scale);
    return values;
}

FlatField makeFlatField(const FlatFieldShape& shape) {
    validate(shape);
    FlatField field;
    field.shape = shape;
    field.samples.resize(std::size_t(shape.width) * std::size_t(shape.height));
    const Geometry geometry(shape);
    const double scale = field.fullScale();
    GaussianSource random(shape.seed);
    const int phase = findOrder(shape.cfa)->phase;
    if (shape.module) {
        const std::vector<double> shading = shape.module->mosaic(shape.width, shape.height, phase);
        field.exact.resize(shading.size());
        for (std::size_t i = 0; i < shading.size(); ++i)
            field.exact[i] = float(shape.centerLevel * shading[i]);
    }
    std::size_t at = 0;
    for (int y = 0; y < shape.height; ++y) {
        for (int x = 0; x < shape.width; ++x) {
            double value = shape.module ? double(field.exact[at])
                                        : shadedLevel(shape, channelOf(phase, x, y),
                                                      geometry.radiusSquared(x, y));
            if (shape.noise > 0.0)
                value += shape.noise * random.next();
            // Shot noise: sqrt(electrons) electrons, in fractions of full scale.
            if (shape.fullWell > 0.0)
                value += std::sqrt(std::max(value, 0.0) / shape.fullWell) * random.next();
            if (shape.readNoise > 0.0)
                value += shape.readNoise / scale * random.next();
            value = std::floor(value * scale + 0.5) + shape.blackLevel;
            field.samples[at++] = std::uint16_t(std::clamp(value, 0.0, scale));
        }
    }
    placeDefects(field, random);
    return field;
}

std::string kqraw2FileBytes(const FlatField& field, const CaptureInfo& capture) {
    return KqRawBuilder()
        .header(std::uint32_t(field.shape.width), std::uint32_t(field.shape.height),
                bayerCodeOf(field.shape.cfa), std::uint32_t(field.shape.bits))
        .pixels(field.samples)
        .capture(capture.exposureTime, capture.gains)
        .sensorInfo("", capture.serialNumber, "")
        .bytes();
}

std::string fixedHeaderFileBytes(const FlatField& field, const CaptureInfo& capture) {
    std::string bytes(kFixedHeaderSize, '\0');
    putU32(bytes, 0, 1); // format version
    putU32(bytes, 4, 1); // header revision: exposure time as float at +36
    putU32(bytes, 8, std::uint32_t(field.shape.width));
    putU32(bytes, 12, std::uint32_t(field.shape.height));
    putU32(bytes, 16, bayerCodeOf(field.shape.cfa));
    putU32(bytes, 24, std::uint32_t(capture.sensorGuid));
    putU32(bytes, 28, std::uint32_t(capture.sensorGuid >> 32));
    putU32(bytes, 32, std::uint32_t(std::llround(double(capture.exposureTime) * 65536.0)));
    putU32(bytes, 36, floatBits(capture.exposureTime));
    for (int k = 0; k < 4; ++k)
        putU32(bytes, 68 + 4 * std::size_t(k), floatBits(capture.gains[k]));
    const std::string serial = serialBytes(capture.serialNumber);
    bytes.replace(88, serial.size(), serial);
    putU32(bytes, 104, 0xDEADBEEF);
    putU32(bytes, kFixedHeaderSize - 4, 0xCAFEFEED);
    appendSamples(bytes, field.samples);
    return bytes;
}

std::string headerlessFileBytes(const FlatField& field) {
    std::string bytes;
    appendSamples(bytes, field.samples);
    return bytes;
}

std::string headerlessDetailsText(const FlatField& field, const CaptureInfo& capture) {
    std::ostringstream text;
    text.imbue(std::locale::classic());
    text.precision(9);
    text << "image.width = " << field.shape.width << "\n"
         << "image.height = " << field.shape.height << "\n"
         << "image.bit_res = " << field.shape.bits << "\n"
         << "image.bayer_order = " << bayerOrderName(field.shape.cfa) << "\n"
         << "image.exp_time = " << capture.exposureTime << "\n"
         << "image.gain = " << capture.gains[0] << "\n";
    if (capture.sensorGuid != 0)
        text << "image.sensor_guid = " << std::hex << capture.sensorGuid << std::dec << "\n";
    if (!capture.serialNumber.empty())
        text << "image.serial_no = " << capture.serialNumber << "\n";
    return text.str();
}

KqRawBuilder& KqRawBuilder::header(std::uint32_t width, std::uint32_t height,
                                   std::uint32_t bayerCode, std::uint32_t bits) {
    std::string payload;
    for (std::uint32_t word : {width, height, bayerCode, bits, 1u, 1u, kCreationTime, 0u, 0u})
        appendU32(payload, word);
    return block("KQRAWFILE_111107", payload);
}

KqRawBuilder& KqRawBuilder::pixels(const std::vector<std::uint16_t>& samples) {
    std::string payload;
    appendU32(payload, 1);
    appendU32(payload, 0);
    appendSamples(payload, samples);
    return block("PIXELDATA_111107", payload);
}

KqRawBuilder& KqRawBuilder::capture(float exposureTime, const float gains[4]) {
    std::string payload(56, '\0');
    putU32(payload, 0, 2);
    putU32(payload, 4, floatBits(exposureTime));
    for (int k = 0; k < 4; ++k)
        putU32(payload, 28 + 4 * std::size_t(k), floatBits(gains[k]));
    return block("CAPTURE___120118", payload);
}

KqRawBuilder& KqRawBuilder::sensorInfo(const std::string& first, const std::string& serial,
                                       const std::string& third) {
    std::string payload;
    appendU32(payload, 1);
    for (const std::string* text : {&first, &serial, &third})
        appendString(payload, *text);
    return block("SENSORINFO120131", payload);
}

KqRawBuilder& KqRawBuilder::comment(const std::string& text) {
    std::string payload;
    appendString(payload, text);
    return block("COMMENT___120131", payload);
}

KqRawBuilder& KqRawBuilder::block(const std::string& tag16, const std::string& payload,
                                  std::uint32_t sizeField, const std::string& reserved16) {
    if (tag16.size() != 16 || reserved16.size() != 16)
        throw std::invalid_argument("block tag and reserved bytes must be 16 bytes: " + tag16);
    bytes_ += tag16;
    bytes_ += reserved16;
    appendU32(bytes_, sizeField);
    bytes_ += payload;
    return *this;
}

KqRawBuilder& KqRawBuilder::block(const std::string& tag16, const std::string& payload) {
    if (payload.size() > std::numeric_limits<std::uint32_t>::max())
        throw std::invalid_argument("block payload does not fit a size field");
    return block(tag16, payload, std::uint32_t(payload.size()));
}

KqRawBuilder& KqRawBuilder::raw(const std::string& bytes) {
    bytes_ += bytes;
    return *this;
}

std::uint32_t bayerCodeOf(std::uint32_t cfa) {
    const BayerOrder* order = findOrder(cfa);
    return order ? order->code : 0;
}

std::string bayerOrderName(std::uint32_t cfa) {
    const BayerOrder* order = findOrder(cfa);
    return order ? order->name : "";
}

std::uint32_t cfaOfBayerOrder(const std::string& name) {
    for (const auto& order : kBayerOrders)
        if (name == order.name)
            return order.cfa;
    return 0;
}

} // namespace flatfield
