#include "config/parameter_table.h"

#include <charconv>
#include <cmath>
#include <stdexcept>

#include "config/config_limits.h"
#include "config/config_messages.h"
#include "config/value_text.h"

namespace config {

namespace {

// Layout: the words "config" and "auto".
enum class Check { None, Int, OddInt, Float, Layout };

struct Parameter {
    const char* section;
    const char* key;
    const char* defaultValue;
    Check check;
    double low;
    double high;
};

// In the order the defaults are written. The colour matrix and the delta-ab
// block counts follow apply_lsc.sampling_factor; set_defaults writes them just
// before apply_lsc.luma_normalize_factor.
constexpr Parameter kTable[] = {
    {"shared", "light_source", "0", Check::Int, -1, 255},
    {"shared", "block_name", "reference", Check::None, 0, 0}, // block-name rule
    {"shared", "block_num_flag", "0", Check::Int, 0, 1},
    {"shared", "block_num", "0", Check::Int, 0, 255},
    {"shared", "program_number", "0", Check::Int, 0, 255},
    {"shared", "cfg_file_date", "", Check::None, 0, 0}, // date rule when used
    {"shared", "proc_sampling_factor", "4", Check::Int, 1, 100},
    {"shared", "bit_res", "0", Check::Int, 4, 15}, // checked only when not 0
    {"shared", "fuse_id_bytes", "0", Check::Int, 0, 16},
    {"shared", "jpeg_quality", "75", Check::Int, 0, 100},
    {"shared", "sensor_guid", "", Check::None, 0, 0},
    {"blob", "compression_res", "s3.8", Check::None, 0, 0},
    {"blob", "compression_flag", "1", Check::Int, 0, 1},
    {"blob", "log_flag", "0", Check::Int, 0, 1},
    {"blob", "write_flag", "0", Check::Int, 0, 1},
    {"raw", "legacy_format", "0", Check::None, 0, 0},
    {"proc", "black_level", "0", Check::None, 0, 0},
    {"proc", "median_filter_flag", "1", Check::Int, 0, 1},
    {"proc", "median_filter_size", "3", Check::Int, 1, 10},
    {"proc", "min_pixel_val", "50", Check::None, 0, 0},
    {"proc", "max_pixel_val", "1014", Check::None, 0, 0},
    {"proc", "peak_pixel_min", "716", Check::None, 0, 0},
    {"proc", "debug", "0", Check::Int, 0, 1},
    {"lsc", "opt_method", "0", Check::None, 0, 0},
    {"lsc", "sampling_factor", "8", Check::Int, 1, 100},
    {"lsc", "sampling_margin", "0", Check::Int, 0, 500},
    {"lsc", "left_patch_width", "-1", Check::None, 0, 0},
    {"lsc", "center_patch_width", "-1", Check::None, 0, 0},
    {"lsc", "top_patch_height", "-1", Check::None, 0, 0},
    {"lsc", "middle_patch_height", "-1", Check::None, 0, 0},
    {"lsc", "leftPatchFactor", "0.25", Check::Float, 0, 0.5},
    {"lsc", "centerPatchFactor", "0.5", Check::Float, 0, 1.0},
    {"lsc", "topPatchFactor", "0.25", Check::Float, 0, 0.5},
    {"lsc", "middlePatchFactor", "0.5", Check::Float, 0, 1.0},
    {"lsc", "imageWidth", "0", Check::None, 0, 0},
    {"lsc", "imageHeight", "0", Check::None, 0, 0},
    {"lsc", "median_filter_flag", "0", Check::None, 0, 0},
    {"lsc", "median_filter_size", "1", Check::None, 0, 0},
    {"lsc", "falloff_factor", "0", Check::Int, 0, 100},
    {"lsc", "wb_avgs_flag", "1", Check::Int, 0, 1},
    {"lsc", "log_err_flag", "0", Check::Int, 0, 1},
    {"lsc", "green_balance", "0", Check::Int, 0, 1},
    {"lsc", "max_gain", "6.0", Check::Float, 0, 1000},
    {"lsc", "max_rms_err", "0.2", Check::Float, 0, 1.0},
    {"lsc", "max_err", "0.2", Check::Float, 0, 1.0},
    {"lsc", "avg_luma", "0", Check::Int, 0, 1},
    {"lsc", "awb_avg_filter_size", "100", Check::None, 0, 0},
    {"lsc", "sample_window", "1", Check::OddInt, 1, 15},
    {"lsc", "patch_layout", "config", Check::Layout, 0, 0},
    {"apply_lsc", "max_delta_ab", "10.0", Check::Float, 0, 10},
    {"apply_lsc", "test_max_delta_ab", "0.0", Check::Float, 0, 10},
    {"apply_lsc", "sampling_factor", "4", Check::Int, 1, 100},
    {"apply_lsc", "luma_normalize_factor", "0.75", Check::Float, 0, 1.0},
    {"apply_lsc", "max_luma_residual", "0", Check::Float, 0, 100},
};

const config_node& settingOf(const config_node& config, const Parameter& parameter) {
    return config.find(parameter.section).find(parameter.key);
}

const Parameter& entry(const char* section, const char* key) {
    for (const Parameter& parameter : kTable)
        if (std::string_view(parameter.section) == section &&
            std::string_view(parameter.key) == key)
            return parameter;
    throw std::logic_error(std::string("unknown parameter ") + section + "." + key);
}

void checkEntry(const config_node& config, const Parameter& parameter) {
    const config_node& node = settingOf(config, parameter);
    if (parameter.check == Check::Float) {
        check_float_range(config, node, static_cast<float>(parameter.low),
                          static_cast<float>(parameter.high));
        return;
    }
    if (parameter.check == Check::None)
        return;
    if (parameter.check == Check::Layout) {
        const std::string value = node.as_string();
        if (value != "config" && value != "auto")
            throw std::range_error(msg::kValueSpecifiedFor + config_relative_path(config, node) +
                                   msg::kMustBeConfigOrAuto);
        return;
    }
    check_int_range(config, node, static_cast<int>(parameter.low),
                    static_cast<int>(parameter.high));
    // A window centred on a sample needs an odd size.
    if (parameter.check == Check::OddInt && node.as_int() % 2 == 0)
        throw std::range_error(msg::kValueSpecifiedFor + config_relative_path(config, node) +
                               msg::kMustBeOdd);
}

void checkBlockName(const std::string& name) {
    if (name.empty())
        throw std::range_error(msg::kEmptyBlockName);
    // Every register key starts with it; the longest must stay a valid key.
    static_assert(config::kMaxBlockNameLength == 987, "kBlockNameTooLong names the limit");
    if (name.size() > config::kMaxBlockNameLength)
        throw std::range_error(msg::kBlockNameTooLong);
    auto isLetter = [](char c) { return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z'); };
    auto isNameChar = [&](char c) {
        return isLetter(c) || (c >= '0' && c <= '9') || c == '-' || c == '_';
    };
    if (!isLetter(name.front()))
        throw std::range_error(msg::kBadBlockName);
    for (char c : name)
        if (!isNameChar(c))
            throw std::range_error(msg::kBadBlockName);
}

// Bounds as a stream writes a float by default: up to six significant digits.
std::string boundText(double bound) {
    char buffer[32];
    const auto result =
        std::to_chars(buffer, buffer + sizeof buffer, bound, std::chars_format::general, 6);
    return std::string(buffer, result.ptr);
}

[[noreturn]] void throwOutOfRange(const config_node& config, const config_node& parameter,
                                  bool tooLow, const std::string& low, const std::string& high) {
    throw std::range_error(msg::kValueSpecifiedFor + config_relative_path(config, parameter) +
                           (tooLow ? msg::kTooLow : msg::kTooHigh) + low + msg::kAnd + high + ".");
}

// Days from 1970-01-01 to year/month/day of the proleptic Gregorian calendar
// (month 1..12, any day count): plain arithmetic, valid for any year.
std::int64_t daysFromCivil(std::int64_t year, std::int64_t month, std::int64_t day) {
    year -= month <= 2;
    const std::int64_t era = (year >= 0 ? year : year - 399) / 400;
    const std::int64_t yearOfEra = year - era * 400;
    const std::int64_t dayOfYear = (153 * (month + (month > 2 ? -3 : 9)) + 2) / 5 + day - 1;
    const std::int64_t dayOfEra = yearOfEra * 365 + yearOfEra / 4 - yearOfEra / 100 + dayOfYear;
    return era * 146097 + dayOfEra - 719468;
}

std::int64_t daysInMonth(std::int64_t year, std::int64_t month) {
    static constexpr std::int64_t kDays[12] = {31, 28, 31, 30, 31, 30, 31, 31, 30, 31, 30, 31};
    const bool leap = (year % 4 == 0 && year % 100 != 0) || year % 400 == 0;
    return month == 2 && leap ? 29 : kDays[month - 1];
}

// Reads one or more digits at `pos` (at most nine, so the arithmetic below
// cannot overflow).
bool readNumber(const std::string& text, std::size_t& pos, std::int64_t& value) {
    const std::size_t start = pos;
    value = 0;
    while (pos < text.size() && text[pos] >= '0' && text[pos] <= '9' && pos - start < 9)
        value = value * 10 + (text[pos++] - '0');
    return pos > start && (pos == text.size() || text[pos] < '0' || text[pos] > '9');
}

bool readSeparator(const std::string& text, std::size_t& pos, char separator) {
    if (pos >= text.size() || text[pos] != separator)
        return false;
    ++pos;
    return true;
}

} // namespace

void set_defaults(config_node& config) {
    for (const Parameter& parameter : kTable) {
        if (std::string_view(parameter.key) == "luma_normalize_factor") {
            config_node& ccm = config.child("apply_lsc").child("ccm");
            for (std::size_t r = 0; r < 3; ++r)
                for (std::size_t c = 0; c < 3; ++c)
                    ccm.child(r).child(c).set(r == c ? "1.0" : "0.0", true);
            config_node& blocks = config.child("apply_lsc").child("delta_ab_blocks");
            blocks.child(0).set("0", true);
            blocks.child(1).set("0", true);
        }
        config.child(parameter.section).child(parameter.key).set(parameter.defaultValue, true);
    }
}

void validate(const config_node& config) {
    checkEntry(config, entry("shared", "proc_sampling_factor"));
    const Parameter& bitResolution = entry("shared", "bit_res");
    if (settingOf(config, bitResolution).as_int() != 0)
        checkEntry(config, bitResolution);
    for (const char* key :
         {"light_source", "fuse_id_bytes", "jpeg_quality", "block_num_flag", "block_num"})
        checkEntry(config, entry("shared", key));
    checkBlockName(config.find("shared").find("block_name").as_string());
    checkEntry(config, entry("shared", "program_number"));
    for (const Parameter& parameter : kTable)
        if (std::string_view(parameter.section) != "shared")
            checkEntry(config, parameter);
}

void check_int_range(const config_node& config, const config_node& parameter, int low, int high) {
    const int value = parameter.as_int();
    if (value < low || value > high)
        throwOutOfRange(config, parameter, value < low, integerText(low), integerText(high));
}

void check_float_range(const config_node& config, const config_node& parameter, float low,
                       float high) {
    const float value = parameter.as_float();
    // Written so that nan fails too: it would pass any pair of comparisons.
    if (!(value >= low && value <= high))
        throwOutOfRange(config, parameter, value < low, boundText(low), boundText(high));
}

std::string block_prefix(const config_node& root) {
    const config_node& shared = root.find("config").find("shared");
    std::string prefix = shared.find("block_name").as_string();
    if (shared.find("block_num_flag").as_bool())
        prefix += "[" + integerText(shared.find("block_num").as_int()) + "]";
    return prefix + ".";
}

// Only a date and time that exist: month 13, February 30 or 24:00 would
// otherwise become another date in the calibration data without a word.
// Years outside 0000..9999, which the date text cannot show, are refused.
std::int64_t config_date_seconds(const std::string& text) {
    std::int64_t year = 0, month = 0, day = 0, hour = 0, minute = 0;
    std::size_t pos = 0;
    const bool ok = readNumber(text, pos, year) && readSeparator(text, pos, '-') &&
                    readNumber(text, pos, month) && readSeparator(text, pos, '-') &&
                    readNumber(text, pos, day) && readSeparator(text, pos, 'T') &&
                    readNumber(text, pos, hour) && readSeparator(text, pos, ':') &&
                    readNumber(text, pos, minute) && pos == text.size();
    if (!ok || year > 9999 || month < 1 || month > 12 || day < 1 ||
        day > daysInMonth(year, month) || hour > 23 || minute > 59)
        throw std::invalid_argument(msg::kInvalidDate);
    return daysFromCivil(year, month, day) * 86400 + hour * 3600 + minute * 60;
}

} // namespace config
