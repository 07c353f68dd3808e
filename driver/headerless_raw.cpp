#include "driver/headerless_raw.h"

#include <cstdio>
#include <limits>
#include <memory>
#include <sstream>
#include <stdexcept>
#include <vector>

#include <boost/iostreams/filtering_stream.hpp>
#include <boost/program_options.hpp>

#include "config/strip_comments.h"
#include "driver/driver_messages.h"
#include "image/file_ptr.h"
#include "image/hex_text.h"
#include "image/image_buffer.h"
#include "lsc/apan_exception.h"
#include "prep/mosaic_stream.h"

#include <sys/stat.h>

namespace driver {

using img::BayerImage;
using img::kCfaBggr;
using img::kCfaGbrg;
using img::kCfaGrbg;
using img::kCfaRggb;

using config::strip_comments;

namespace po = boost::program_options;

namespace {

// Width and height are read as wide signed numbers: the unsigned parse of the
// option library would turn "-1" into 4294967295.
using WideInt = long long;

po::options_description detailsOptions() {
    po::options_description options("Details");
    options.add_options()("image.height", po::value<WideInt>(), "Image height in pixels.")(
        "image.width", po::value<WideInt>(), "Image width in pixels.")(
        "image.bit_res", po::value<WideInt>(), "Image depth in bits per pixel.")(
        "image.bayer_order", po::value<std::string>()->default_value("RGGB"),
        "Image Bayer order (pixel color pattern).")("image.exp_time",
                                                    po::value<float>()->default_value(100.0f),
                                                    "Image exposure time in milliseconds.")(
        "image.gain", po::value<float>()->default_value(1.0f),
        "Image gain.")("image.sensor_guid", po::value<std::string>()->default_value(""),
                       "Sensor GUID of the imager module (model identifier, not a serial number).")(
        "image.serial_no", po::value<std::string>()->default_value(""),
        "Serial number of the imager module.");
    return options;
}

bool isHex(const std::string& text) {
    for (char c : text)
        if (img::hexDigit(c) < 0)
            return false;
    return true;
}

// The sensor is at most 65535 pixels on a side: the container stores sizes
// as 32-bit words, the image record as signed 32-bit, and the pixel count
// must stay addressable on a 32-bit host.
constexpr WideInt kMaxSide = 65535;

std::uint32_t dimension(const po::variables_map& map, const char* name) {
    if (!map.count(name))
        throw std::runtime_error(std::string("Missing ") + name +
                                 " in headerless raw details file.");
    const WideInt value = map[name].as<WideInt>();
    if (value < 1 || value > kMaxSide)
        throw std::range_error(std::string("Invalid ") + name + " value " + std::to_string(value) +
                               " in headerless raw details file (must be 1 to 65535).");
    return static_cast<std::uint32_t>(value);
}

std::uint32_t cfaOf(const std::string& order) {
    if (order == "RGGB")
        return kCfaRggb;
    if (order == "GRBG")
        return kCfaGrbg;
    if (order == "BGGR")
        return kCfaBggr;
    if (order == "GBRG")
        return kCfaGbrg;
    throw std::invalid_argument("Invalid image.bayer_order value '" + order +
                                "' in headerless raw details file.");
}

void checkSerial(const std::string& serial) {
    if (serial.size() % 2 != 0)
        throw apan::exception(263, msg::kSerialOdd + serial, msg::kSerialHint);
    if (serial.size() > 32)
        throw apan::exception(262, msg::kSerialTooLong + serial, msg::kSerialHint);
    // The serial is stored as bytes, two hexadecimal digits each.
    if (!isHex(serial))
        throw apan::exception(263, msg::kSerialNotHex + serial, msg::kSerialHint);
}

bool isDirectory(std::FILE* file) {
    struct stat info;
    return fstat(fileno(file), &info) == 0 && S_ISDIR(info.st_mode);
}

// A details file holds a handful of lines; anything longer than this is not
// one (a device such as /dev/zero would otherwise be read without end).
constexpr std::size_t kMaxDetailsBytes = 1 << 20;

// The whole details file, or false when it cannot be opened or read (a
// directory, a read error, no end within kMaxDetailsBytes).
bool readDetailsText(const std::string& path, std::string& text) {
    img::FilePtr file(std::fopen(path.c_str(), "rb"));
    if (!file || isDirectory(file.get()))
        return false;
    char chunk[4096];
    std::size_t n;
    while ((n = std::fread(chunk, 1, sizeof chunk, file.get())) > 0) {
        if (text.size() + n > kMaxDetailsBytes)
            return false;
        text.append(chunk, n);
    }
    return !std::ferror(file.get());
}

} // namespace

HeaderlessRawDetails parseHeaderlessDetails(std::istream& text, std::uint16_t defaultBits) {
    po::variables_map map;
    po::store(po::parse_config_file(text, detailsOptions()), map);
    po::notify(map);

    HeaderlessRawDetails details;
    details.height = dimension(map, "image.height");
    details.width = dimension(map, "image.width");
    details.exposureTime = map["image.exp_time"].as<float>();
    details.gain = map["image.gain"].as<float>();
    details.serialNumber = map["image.serial_no"].as<std::string>();
    details.sensorGuid = map["image.sensor_guid"].as<std::string>();
    const std::string order = map["image.bayer_order"].as<std::string>();

    checkSerial(details.serialNumber);
    details.cfa = cfaOf(order);

    WideInt bits = defaultBits;
    if (map.count("image.bit_res"))
        bits = map["image.bit_res"].as<WideInt>();
    // 0 bits would divide 0 by 0, more than 16 cannot hold a 16-bit sample.
    if (bits < 1 || bits > 16)
        throw std::range_error("Invalid image.bit_res value " + std::to_string(bits) +
                               " in headerless raw details file (must be 1 to 16).");
    details.bits = static_cast<std::uint16_t>(bits);
    return details;
}

bool loadHeaderlessRaw(BayerImage& target, const std::string& rawPath, std::uint16_t defaultBits,
                       const std::string& detailsPath, bool fixedHeader,
                       const prep::MosaicPreparation* preparation, BayerImage* prepared,
                       prep::SampleStatistics* inputStatistics, img::MosaicRowSink* rows) {
    namespace io = boost::iostreams;
    std::string detailsText;
    if (!readDetailsText(detailsPath, detailsText))
        throw apan::exception(264, msg::kDetailsUnreadable, msg::kDetailsUnreadableHint);
    std::istringstream detailsSource(detailsText);
    io::filtering_istream details;
    details.push(strip_comments(';'));
    details.push(strip_comments('#'));
    details.push(detailsSource);
    const HeaderlessRawDetails d = parseHeaderlessDetails(details, defaultBits);
    // The GUID is a model name (IMX219) to a container; only the fixed
    // header stores it, as a 64-bit number.
    if (fixedHeader && !d.sensorGuid.empty() && !img::isHexGuid(d.sensorGuid))
        throw std::invalid_argument("Invalid image.sensor_guid value '" + d.sensorGuid +
                                    "' in headerless raw details file (with raw.legacy_format = 1 "
                                    "it must be 1 to 16 hexadecimal digits).");

    img::FilePtr file(std::fopen(rawPath.c_str(), "rb"));
    // A directory opens for reading but holds no samples.
    if (!file || isDirectory(file.get()))
        throw apan::exception(210, msg::kRawOpen + rawPath, msg::kRawOpenHint);

    // The file's size is known before anything is allocated: a details file
    // that promises more pixels than the file holds fails as a short read.
    const std::uint64_t rowBytes = std::uint64_t{d.width} * 2;
    const std::uint64_t expected = rowBytes * d.height;
    struct stat info;
    if (fstat(fileno(file.get()), &info) == 0 && S_ISREG(info.st_mode) &&
        static_cast<std::uint64_t>(info.st_size) < expected)
        throw apan::exception(202, msg::kRawShortRow, msg::kRawShortRowHint);

    const auto width = static_cast<std::int32_t>(d.width);
    const auto height = static_cast<std::int32_t>(d.height);
    const bool streamed =
        preparation && prepared && prep::MosaicStream::accepts(width, height, *preparation);
    target.createFromHeaderless(width, height, d.bits, d.cfa, d.exposureTime, d.gain,
                                d.serialNumber, d.sensorGuid, fixedHeader, !streamed);
    std::unique_ptr<prep::MosaicStream> stream;
    const std::uint32_t mask = (1u << d.bits) - 1;
    if (streamed) {
        stream = std::make_unique<prep::MosaicStream>(width, height, *preparation);
        if (inputStatistics)
            stream->measureSamples(mask);
        if (rows)
            rows->start(width, height);
    }

    const float scale = static_cast<float>(mask);
    std::vector<unsigned char> row(static_cast<std::size_t>(rowBytes));
    std::vector<std::uint16_t> samples(streamed ? d.width : 0);
    float* out = target.pixels();
    for (std::uint32_t y = 0; y < d.height; ++y) {
        if (std::fread(row.data(), 1, row.size(), file.get()) != row.size())
            throw apan::exception(202, msg::kRawShortRow, msg::kRawShortRowHint);
        if (streamed) {
            for (std::uint32_t x = 0; x < d.width; ++x)
                samples[x] = static_cast<std::uint16_t>(
                    (row[2 * x] | (std::uint32_t{row[2 * x + 1]} << 8)) & mask);
            stream->addRow(samples.data());
            if (rows)
                rows->addRow(samples.data());
            continue;
        }
        for (std::uint32_t x = 0; x < d.width; ++x) {
            const std::uint32_t sample = row[2 * x] | (std::uint32_t{row[2 * x + 1]} << 8);
            *out++ = static_cast<float>(sample & mask) / scale;
        }
    }
    if (std::fgetc(file.get()) != EOF)
        throw apan::exception(202, msg::kRawTooLong, msg::kRawTooLongHint);
    if (streamed) {
        *prepared = stream->finish(d.bits, 0, d.cfa);
        if (inputStatistics)
            *inputStatistics = stream->statistics();
    }
    return streamed;
}

} // namespace driver
