#include "blob/blob_parser.h"

#include <algorithm>
#include <stdexcept>
#include <string>
#include <vector>

#include "blob/bit_packing.h"
#include "blob/blob_layout.h"
#include "blob/blob_messages.h"
#include "blob/byte_reader.h"
#include "blob/md5.h"
#include "blob/utc_date_text.h"
#include "blob/value_code.h"
#include "config/value_text.h"

namespace blob {

using config::config_node;
using config::doubleText;
using config::integerText;

namespace {

[[noreturn]] void fail(const char* message) {
    throw std::runtime_error(message);
}

void store(config_node& node, const std::string& text) {
    node.set(text, false);
}

// A light source as a block stores it: 8 bits in the lens-shading block, 16
// in the white-balance block. The configuration's -1 ("none") has all bits
// set in either width.
struct StoredLightSource {
    std::uint16_t value;
    unsigned bits;

    std::int64_t setting() const { return bits == 16 && value == 0xFFFF ? -1 : value; }
};

bool sameLightSource(const StoredLightSource& a, const StoredLightSource& b) {
    if (a.bits == b.bits)
        return a.value == b.value;
    const StoredLightSource& narrow = a.bits < b.bits ? a : b;
    const StoredLightSource& wide = a.bits < b.bits ? b : a;
    return wide.value == narrow.value || (wide.value == 0xFFFF && narrow.value == 0xFF);
}

class BlobParser {
public:
    BlobParser(const std::uint8_t* data, std::size_t size, config_node& calibration,
               config_node& config)
        : data_(data), size_(size), calibration_(calibration), config_(config) {}

    BlobVersions parse();

private:
    // A reader over the blob from `offset` to its end; the block's reads
    // then fail once they pass the end of the blob.
    ByteReader blockAt(std::size_t offset) const {
        return ByteReader(data_ + offset, size_ - offset);
    }
    void countBlockBytes(std::uint64_t count);
    void requireComplete(const ByteReader& block) const {
        if (!block.ok())
            fail(msg::kCorruptOrTruncated);
    }
    void checkLightSource(const StoredLightSource& light);

    void readTracking(std::size_t offset);
    void readTool(std::size_t offset);
    void readLensShading(std::size_t offset);
    void readWhiteBalance(std::size_t offset);
    void readFocus(std::size_t offset);
    void checkDigest(std::size_t offset) const;

    const std::uint8_t* data_;
    std::size_t size_;
    config_node& calibration_;
    config_node& config_;
    BlobVersions versions_;
    std::size_t focusSets_ = 0;
    std::uint64_t blockBytes_ = 0;
    bool haveLightSource_ = false;
    StoredLightSource lightSource_{0, 0};
};

BlobVersions BlobParser::parse() {
    if (size_ < kHeaderSize)
        fail(msg::kCorruptOrTruncated);
    ByteReader header(data_, size_);
    if (header.u32() != kMagic)
        fail(msg::kBadMagic);
    if (header.u8() != kVersion)
        fail(msg::kWrongVersion);
    versions_.blob = {data_[4], data_[5], data_[6]};

    for (std::size_t entry = kHeaderSize;; entry += kTableEntrySize) {
        if (!rangeInside(entry, kTableEntrySize, size_))
            fail(msg::kCorruptOrTruncated);
        ByteReader fields(data_ + entry, kTableEntrySize);
        const std::uint16_t type = fields.u16();
        const std::size_t offset = fields.u16();
        if (offset < entry + kTableEntrySize)
            fail(msg::kCorrupt);
        if (offset > size_)
            fail(msg::kCorruptOrTruncated);
        switch (type) {
        case kLscBlock:
            readLensShading(offset);
            break;
        case kAwbBlock:
            readWhiteBalance(offset);
            break;
        case kFocusBlock:
            readFocus(offset);
            break;
        case kTrackingBlock:
            readTracking(offset);
            break;
        case kToolBlock:
            readTool(offset);
            break;
        case kDigestBlock:
            checkDigest(offset);
            return versions_;
        default:
            fail(msg::kUnknownBlock);
        }
    }
}

// Blocks written by the tool never share bytes, so together they cannot be
// larger than the blob. Refusing more keeps a small blob whose table points
// many times at one large block from building a huge tree.
void BlobParser::countBlockBytes(std::uint64_t count) {
    blockBytes_ += count;
    if (blockBytes_ > size_)
        fail(msg::kCorrupt);
}

void BlobParser::checkLightSource(const StoredLightSource& light) {
    if (haveLightSource_) {
        if (!sameLightSource(lightSource_, light))
            fail(msg::kLightSourceMismatch);
        if (light.bits <= lightSource_.bits)
            return; // a wider field tells -1 from 255; keep its reading
    }
    haveLightSource_ = true;
    lightSource_ = light;
    store(config_["shared"]["light_source"], integerText(light.setting()));
}

void BlobParser::readTracking(std::size_t offset) {
    ByteReader block = blockAt(offset);
    const std::uint16_t length = block.u16();
    requireComplete(block);
    if (length < kTrackingLengthSize) // the length counts itself
        fail(msg::kCorrupt);
    const std::uint8_t* serial = block.bytes(length - kTrackingLengthSize);
    requireComplete(block);
    countBlockBytes(length);
    static const char kHex[] = "0123456789abcdef";
    std::string text;
    text.reserve(2 * (length - kTrackingLengthSize));
    for (std::size_t i = 0; i + kTrackingLengthSize < length; ++i) {
        text += kHex[serial[i] >> 4];
        text += kHex[serial[i] & 0xF];
    }
    store(calibration_["serial_no"], text);
}

void BlobParser::readTool(std::size_t offset) {
    ByteReader block = blockAt(offset);
    block.u8(); // the block size, not checked
    const std::array<std::uint8_t, 3> version = {block.u8(), block.u8(), block.u8()};
    const auto seconds = static_cast<std::int64_t>(block.u64());
    const std::uint8_t program = block.u8();
    requireComplete(block);
    countBlockBytes(kToolBlockSize);
    // All 64 bits of the date count: dropping the high half would turn a
    // date after 2038 into a wrong one.
    const std::optional<std::string> date = utcDateText(seconds);
    if (!date)
        throw std::runtime_error(msg::kInvalidDate + integerText(seconds));
    versions_.tool = version;
    store(config_["shared"]["cfg_file_date"], *date);
    store(config_["shared"]["program_number"], integerText(program));
}

void BlobParser::readLensShading(std::size_t offset) {
    ByteReader block = blockAt(offset);
    const StoredLightSource light{block.u8(), 8};
    ValueFormat format;
    format.intBits = block.u8();
    format.fracBits = block.u8();
    block.u8();
    requireComplete(block);
    if (format.codeBits() > kMaxCodeBits)
        fail(msg::kCodeTooWideToRead);
    const std::uint64_t packed = packedSize(kLscCodeCount, format.codeBits());
    const std::uint8_t* data = block.bytes(static_cast<std::size_t>(packed));
    requireComplete(block);
    countBlockBytes(kLscHeaderSize + packed);
    std::vector<std::uint32_t> codes;
    // The block holds `packed` bytes (checked above): the codes are all there.
    if (!unpackCodes(data, static_cast<std::size_t>(packed), format.codeBits(), kLscCodeCount,
                     codes))
        fail(msg::kCorruptOrTruncated);

    checkLightSource(light);
    store(config_["blob"]["compression_res"], valueFormatText(format));
    std::size_t next = 0;
    for (const char* name : kControlPointNames) {
        config_node& grid = calibration_[name];
        for (std::size_t i = 0; i < kGridSide; ++i)
            for (std::size_t j = 0; j < kGridSide; ++j)
                store(grid[i][j], doubleText(decodeValue(codes[next++], format)));
    }
}

void BlobParser::readWhiteBalance(std::size_t offset) {
    ByteReader block = blockAt(offset);
    const StoredLightSource light{block.u16(), 16};
    std::uint16_t averages[4];
    for (std::uint16_t& average : averages)
        average = block.u16();
    requireComplete(block);
    countBlockBytes(kAwbBlockSize);
    checkLightSource(light);
    for (std::size_t i = 0; i < 4; ++i)
        store(calibration_[kAwbNames[i]], integerText(averages[i]));
}

void BlobParser::readFocus(std::size_t offset) {
    // Minor versions before the wide layout hold 16-bit values.
    const bool wide = versions_.blob[1] >= kWideFocusMinorVersion;
    ByteReader block = blockAt(offset);
    const auto value = [&] { return wide ? block.u32() : std::uint32_t{block.u16()}; };
    const char posture = static_cast<char>(block.u8());
    const std::uint32_t macro = value(), hyper = value(), inf = value();
    const std::uint16_t settle = block.u16(), hysteresis = block.u16();
    const std::uint8_t count = block.u8();
    requireComplete(block);
    std::vector<std::uint32_t> pairs(2 * std::size_t{count});
    for (std::uint32_t& half : pairs)
        half = value();
    requireComplete(block);
    countBlockBytes(wide ? kWideFocusHeaderSize + kWideFocusPairSize * count
                         : kNarrowFocusHeaderSize + kNarrowFocusPairSize * count);

    config_node& set = calibration_["module"]["af"]["set"][focusSets_++];
    store(set["posture"], std::string(1, posture));
    store(set["macro"], integerText(macro));
    store(set["hyper"], integerText(hyper));
    store(set["inf"], integerText(inf));
    store(set["settle_time"], integerText(settle));
    store(set["hysteresis"], integerText(hysteresis));
    store(set["num_pairs"], integerText(count));
    config_node& pairNodes = set["FDN_dist_pair"];
    for (std::size_t k = 0; k < count; ++k) {
        store(pairNodes[k][std::size_t{0}], integerText(pairs[2 * k]));
        store(pairNodes[k][std::size_t{1}], integerText(pairs[2 * k + 1]));
    }
}

void BlobParser::checkDigest(std::size_t offset) const {
    if (!rangeInside(offset, kDigestSize, size_))
        fail(msg::kCorruptOrTruncated);
    const Md5Digest digest = md5(data_, offset);
    if (!std::equal(digest.begin(), digest.end(), data_ + offset))
        fail(msg::kBadDigest);
}

} // namespace

BlobVersions parseBlob(const std::uint8_t* data, std::size_t size, config_node& calibration,
                       config_node& config) {
    return BlobParser(data, size, calibration, config).parse();
}

} // namespace blob
