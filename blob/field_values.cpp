#include "blob/field_values.h"

#include <stdexcept>

#include "blob/blob_layout.h"
#include "blob/blob_messages.h"
#include "config/value_text.h"
#include "image/hex_text.h"

namespace blob {

using config::config_node;
using config::config_relative_path;
using config::integerText;

namespace {

[[noreturn]] void refuse(const config_node& config, const config_node& node,
                         const std::string& why) {
    throw std::runtime_error(msg::kValueFor + config_relative_path(config, node) + why);
}

// Whole-text decimal with optional sign; false when malformed. Magnitudes
// beyond 64 bits saturate, which the range check then refuses.
bool parseWhole(const std::string& text, std::int64_t& value) {
    std::size_t pos = 0;
    bool negative = false;
    if (pos < text.size() && (text[pos] == '-' || text[pos] == '+'))
        negative = text[pos++] == '-';
    if (pos == text.size())
        return false;
    constexpr std::uint64_t kSaturated = std::uint64_t{1} << 62;
    std::uint64_t magnitude = 0;
    for (; pos < text.size(); ++pos) {
        if (text[pos] < '0' || text[pos] > '9')
            return false;
        if (magnitude < kSaturated)
            magnitude = magnitude * 10 + static_cast<std::uint64_t>(text[pos] - '0');
    }
    if (magnitude > kSaturated)
        magnitude = kSaturated;
    value = negative ? -static_cast<std::int64_t>(magnitude) : static_cast<std::int64_t>(magnitude);
    return true;
}

} // namespace

std::int64_t fieldValue(const config_node& config, const config_node& node, std::int64_t low,
                        std::int64_t high) {
    std::int64_t value = 0;
    if (!parseWhole(node.as_string(), value))
        refuse(config, node, msg::kNotWholeNumber);
    if (value < low || value > high)
        refuse(config, node,
               msg::kDoesNotFitStart + integerText(low) + " and " + integerText(high) + ".");
    return value;
}

const config_node& requiredChild(const config_node& config, const config_node& parent,
                                 const std::string& name) {
    const config_node& child = parent.find(name);
    if (!child.valid())
        throw std::runtime_error(msg::kMissingValue + config_relative_path(config, parent) + "." +
                                 name + ".");
    return child;
}

const config_node& requiredChild(const config_node& config, const config_node& parent,
                                 std::size_t index) {
    const config_node& child = parent.find(index);
    if (!child.valid())
        throw std::runtime_error(msg::kMissingValue + config_relative_path(config, parent) + "[" +
                                 std::to_string(index) + "].");
    return child;
}

std::string unquoted(const std::string& text) {
    if (text.size() >= 2 && text.front() == '"' && text.back() == '"')
        return text.substr(1, text.size() - 2);
    return text;
}

std::vector<std::uint8_t> serialBytes(const config_node& config, const config_node& node) {
    const std::string text = unquoted(node.as_string());
    if (text.size() % 2 != 0)
        refuse(config, node, msg::kInvalidSerial);
    if (text.size() / 2 > kMaxSerialBytes)
        refuse(config, node, msg::kSerialTooLong);
    std::vector<std::uint8_t> bytes;
    bytes.reserve(text.size() / 2);
    for (std::size_t i = 0; i < text.size(); i += 2) {
        const int high = img::hexDigit(text[i]);
        const int low = img::hexDigit(text[i + 1]);
        if (high < 0 || low < 0)
            refuse(config, node, msg::kInvalidSerial);
        bytes.push_back(static_cast<std::uint8_t>(high * 16 + low));
    }
    return bytes;
}

char postureCharacter(const config_node& config, const config_node& node) {
    const std::string& text = node.as_string();
    if (text.size() == 3 && text.front() == '\'' && text.back() == '\'')
        return text[1];
    if (text.empty())
        refuse(config, node, msg::kEmptyPosture);
    // The block holds one character: the rest of a longer text would be lost.
    if (text.size() != 1)
        refuse(config, node, msg::kLongPosture);
    return text[0];
}

} // namespace blob
