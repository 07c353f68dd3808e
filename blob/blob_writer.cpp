#include "blob/blob_writer.h"

#include <cmath>
#include <limits>
#include <locale>
#include <sstream>
#include <stdexcept>
#include <string>

#include "blob/bit_packing.h"
#include "blob/blob_layout.h"
#include "blob/blob_messages.h"
#include "blob/byte_writer.h"
#include "blob/field_values.h"
#include "blob/md5.h"
#include "blob/value_code.h"
#include "config/parameter_table.h"

namespace blob {

using config::config_date_seconds;
using config::config_node;
using config::config_relative_path;

namespace {

constexpr std::int64_t kMaxU8 = 0xFF;
constexpr std::int64_t kMaxU16 = 0xFFFF;
constexpr std::int64_t kMaxU32 = 0xFFFFFFFF;
// shared.light_source: -1 (none) is stored with all bits set.
constexpr std::int64_t kNoLightSource = -1;

struct Block {
    std::uint16_t type;
    std::vector<std::uint8_t> bytes;
};

// The first serial number that is not empty: the register file's, else the
// autofocus file's. Empty when there is none.
std::vector<std::uint8_t> serialNumber(const BlobSources& in) {
    for (const config_node* node :
         {&in.registers.find("serial_no"), &in.module.find("serial_no")}) {
        if (!node->valid())
            continue;
        std::vector<std::uint8_t> bytes = serialBytes(in.config, *node);
        if (!bytes.empty())
            return bytes;
    }
    return {};
}

Block trackingBlock(const std::vector<std::uint8_t>& serial) {
    Block block{kTrackingBlock, {}};
    ByteWriter out(block.bytes);
    out.u16(static_cast<std::uint16_t>(kTrackingLengthSize + serial.size()));
    out.bytes(serial.data(), serial.size());
    return block;
}

std::uint64_t configurationDate(const config_node& config, std::ostream& warnings) {
    const config_node& date = config.find("shared").find("cfg_file_date");
    if (!date.valid() || date.as_string().empty()) {
        warnings << msg::kNoDateWarning << std::endl;
        return 0;
    }
    std::int64_t seconds = 0;
    try {
        seconds = config_date_seconds(date.as_string());
    } catch (const std::invalid_argument&) {
        throw std::runtime_error(msg::kInvalidDateSetting);
    }
    return static_cast<std::uint64_t>(seconds); // two's complement before 1970
}

Block toolBlock(const BlobSources& in, const ToolVersion& version, std::ostream& warnings) {
    const std::uint64_t date = configurationDate(in.config, warnings);
    const auto program =
        fieldValue(in.config, in.config.find("shared").find("program_number"), 0, kMaxU8);
    Block block{kToolBlock, {}};
    ByteWriter out(block.bytes);
    out.u8(static_cast<std::uint8_t>(kToolBlockSize));
    for (std::uint8_t part : version)
        out.u8(part);
    out.u64(date);
    out.u8(static_cast<std::uint8_t>(program));
    return block;
}

std::int64_t lightSource(const config_node& config) {
    return fieldValue(config, config.find("shared").find("light_source"), kNoLightSource, kMaxU8);
}

ValueFormat compressionFormat(const config_node& config) {
    const config_node& settings = config.find("blob");
    if (!settings.find("compression_flag").as_bool())
        throw std::runtime_error(msg::kOnlyCompressed);
    ValueFormat format;
    try {
        format = parseValueFormat(settings.find("compression_res").as_string());
    } catch (const std::invalid_argument&) {
        throw std::runtime_error(msg::kInvalidCompressionFormat);
    }
    if (format.intBits + format.fracBits > 15)
        throw std::runtime_error(msg::kCodeTooWide);
    if (settings.find("ctrlPointsCount").valid())
        throw std::runtime_error(msg::kPointCountNotSupported);
    return format;
}

std::string numberText(float value) {
    std::ostringstream text;
    text.imbue(std::locale::classic());
    text << value;
    return text.str();
}

std::uint32_t controlPointCode(float value, const ValueFormat& format) {
    const double maximum = valueFormatMaximum(format);
    if (!(std::fabs(value) <= maximum)) // NaN is outside every range
        throw std::range_error(msg::kValueOutOfRangeStart + numberText(value) +
                               msg::kValueOutOfRangeEnd);
    const std::uint32_t code = encodeValue(value, format);
    if (std::fabs(decodeValue(code, format) - value) > valueFormatStep(format))
        throw std::range_error(msg::kToleranceExceeded);
    return code;
}

Block lscBlock(const BlobSources& in) {
    const ValueFormat format = compressionFormat(in.config);
    const std::int64_t light = lightSource(in.config);
    std::vector<std::uint32_t> codes;
    codes.reserve(kLscCodeCount);
    for (const char* name : kControlPointNames) {
        const config_node& grid = in.controlPoints.find(name);
        for (std::size_t i = 0; i < kGridSide; ++i)
            for (std::size_t j = 0; j < kGridSide; ++j)
                codes.push_back(controlPointCode(grid.find(i).find(j).as_float(), format));
    }
    Block block{kLscBlock, {}};
    ByteWriter out(block.bytes);
    out.u8(static_cast<std::uint8_t>(light));
    out.u8(static_cast<std::uint8_t>(format.intBits));
    out.u8(static_cast<std::uint8_t>(format.fracBits));
    out.u8(0);
    packCodes(codes, format.codeBits(), block.bytes);
    return block;
}

Block awbBlock(const BlobSources& in) {
    Block block{kAwbBlock, {}};
    ByteWriter out(block.bytes);
    out.u16(static_cast<std::uint16_t>(lightSource(in.config)));
    for (const char* name : kAwbNames)
        out.u16(static_cast<std::uint16_t>(
            fieldValue(in.config, requiredChild(in.config, in.registers, name), 0, kMaxU16)));
    return block;
}

// num_pairs when given; else the number of FDN_dist_pair entries, since the
// text dump leaves num_pairs out and must read back to the same blocks.
std::size_t focusPairCount(const config_node& config, const config_node& set) {
    const config_node& given = set.find("num_pairs");
    if (given.valid())
        return static_cast<std::size_t>(fieldValue(config, given, 0, kMaxFocusPairs));
    const config_node& pairs = set.find("FDN_dist_pair");
    if (pairs.size() > kMaxFocusPairs)
        throw std::runtime_error(msg::kValueFor + config_relative_path(config, pairs) +
                                 msg::kTooManyPairs);
    return pairs.size();
}

Block focusBlock(const config_node& config, const config_node& set) {
    Block block{kFocusBlock, {}};
    ByteWriter out(block.bytes);
    out.u8(static_cast<std::uint8_t>(postureCharacter(config, set.find("posture"))));
    for (const char* name : {"macro", "hyper", "inf"})
        out.u32(static_cast<std::uint32_t>(
            fieldValue(config, requiredChild(config, set, name), 0, kMaxU32)));
    for (const char* name : {"settle_time", "hysteresis"})
        out.u16(static_cast<std::uint16_t>(
            fieldValue(config, requiredChild(config, set, name), 0, kMaxU16)));
    const std::size_t count = focusPairCount(config, set);
    out.u8(static_cast<std::uint8_t>(count));
    const config_node& pairs = set.find("FDN_dist_pair");
    for (std::size_t k = 0; k < count; ++k) {
        const config_node& pair = requiredChild(config, pairs, k);
        // A third value would be dropped without a word.
        if (pair.size() > 2)
            throw std::runtime_error(msg::kValueFor + config_relative_path(config, pair) +
                                     msg::kNotAPair);
        for (std::size_t half = 0; half < 2; ++half)
            out.u32(static_cast<std::uint32_t>(
                fieldValue(config, requiredChild(config, pair, half), 0, kMaxU32)));
    }
    return block;
}

std::vector<std::uint8_t> assemble(const std::vector<Block>& blocks) {
    const std::size_t entries = blocks.size() + 1; // and the digest
    std::vector<std::size_t> offsets;
    offsets.reserve(entries);
    std::uint64_t offset = kHeaderSize + std::uint64_t{kTableEntrySize} * entries;
    for (const Block& block : blocks) {
        offsets.push_back(static_cast<std::size_t>(offset));
        offset += block.bytes.size();
    }
    if (offset > kMaxOffset) // the digest's offset is the largest
        throw std::runtime_error(msg::kTooLarge);

    std::vector<std::uint8_t> bytes;
    bytes.reserve(static_cast<std::size_t>(offset) + kDigestSize);
    ByteWriter out(bytes);
    out.u32(kMagic);
    out.u8(kVersion);
    out.u8(kMinorVersion);
    out.u16(0);
    for (std::size_t i = 0; i < blocks.size(); ++i) {
        out.u16(blocks[i].type);
        out.u16(static_cast<std::uint16_t>(offsets[i]));
    }
    out.u16(kDigestBlock);
    out.u16(static_cast<std::uint16_t>(offset));
    for (const Block& block : blocks)
        out.bytes(block.bytes.data(), block.bytes.size());
    const Md5Digest digest = md5(bytes.data(), bytes.size());
    out.bytes(digest.data(), digest.size());
    return bytes;
}

} // namespace

std::vector<std::uint8_t> generateBlob(const BlobSources& sources, const ToolVersion& toolVersion,
                                       std::ostream& warnings) {
    std::vector<Block> blocks;
    const std::vector<std::uint8_t> serial = serialNumber(sources);
    if (!serial.empty())
        blocks.push_back(trackingBlock(serial));
    blocks.push_back(toolBlock(sources, toolVersion, warnings));
    if (sources.controlPoints.find("controlPointR").valid())
        blocks.push_back(lscBlock(sources));
    if (sources.registers.find("R").valid())
        blocks.push_back(awbBlock(sources));
    const config_node& sets = sources.module.find("af").find("set");
    for (std::size_t i = 0; sets.find(i).find("posture").valid(); ++i)
        blocks.push_back(focusBlock(sources.config, sets.find(i)));
    return assemble(blocks);
}

} // namespace blob
