#include "config/register_file.h"

#include <algorithm>
#include <charconv>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <stdexcept>

#include "config/config_messages.h"
#include "config/value_text.h"
#include "image/output_file.h"
#include "lsc/patch_geometry.h"

namespace config {

using img::BayerImage;
using img::OutputFile;

using lsc::ExportedPatchSizes;
using lsc::exportedPatchSizes;
using lsc::FitResult;
using lsc::kChannelNames;
using lsc::kChannels;
using lsc::kGridPoints;
using lsc::PatchStep;
using lsc::patchStep;

namespace {

constexpr const char* kChannelRegisters[kChannels] = {"R", "GR", "GB", "B"};

std::string generalText(double value, int precision) {
    char buffer[40];
    const auto result =
        std::to_chars(buffer, buffer + sizeof buffer, value, std::chars_format::general, precision);
    return std::string(buffer, result.ptr);
}

std::string hexText(std::uint32_t value) {
    char buffer[12];
    const auto result = std::to_chars(buffer, buffer + sizeof buffer, value, 16);
    return std::string(buffer, result.ptr);
}

class RegisterText {
public:
    explicit RegisterText(const std::string& blockName) : prefix_(blockName + ".") {}

    void line(const std::string& text) { text_ += text + "\n"; }
    // `name` is padded by the caller so that the "=" signs line up.
    void assign(const std::string& name, const std::string& value) {
        text_ += prefix_ + name + "= " + value + ";\n";
    }
    const std::string& text() const { return text_; }

private:
    std::string prefix_;
    std::string text_;
};

// Every patch needs a finite step: a size of 0 or less has none, and a size
// of 1 gives a step of 8, which the 3-bit integer field cannot hold.
void checkExportedSizes(const ExportedPatchSizes& s, std::int32_t width, std::int32_t height) {
    if (std::min({s.left, s.center, s.right, s.top, s.middle, s.bottom}) >= 2)
        return;
    throw std::runtime_error(
        msg::kBadExportedGeometryPrefix + integerText(width) + "x" + integerText(height) +
        msg::kBadExportedGeometryMiddle + integerText(s.left) + ", " + integerText(s.center) +
        ", " + integerText(s.right) + " x " + integerText(s.top) + ", " + integerText(s.middle) +
        ", " + integerText(s.bottom) + msg::kBadExportedGeometrySuffix);
}

void writeGeometry(RegisterText& out, const config_node& lsc, const ExportedPatchSizes& sizes,
                   const FitResult& fit, std::int32_t width, std::int32_t height) {
    if (!lsc.find("left_patch_width").is_default() && lsc.find("leftPatchFactor").is_default()) {
        out.assign("leftPatchWidth       ", integerText(sizes.left));
        out.assign("centerPatchWidth     ", integerText(sizes.center));
        out.assign("topPatchHeight       ", integerText(sizes.top));
        out.assign("middlePatchHeight    ", integerText(sizes.middle));
        return;
    }
    out.assign("imageWidth           ", integerText(width));
    out.assign("imageHeight          ", integerText(height));
    out.assign("leftPatchFactor      ", generalText(fit.correction.layout.left, 6));
    out.assign("centerPatchFactor    ", generalText(fit.correction.layout.center, 6));
    out.assign("topPatchFactor       ", generalText(fit.correction.layout.top, 6));
    out.assign("middlePatchFactor    ", generalText(fit.correction.layout.middle, 6));
}

// A level is clamped to the full scale before it is cut to the 16-bit register,
// so that a gain above 1 at 16 bits (or an image deeper than 16 bits) cannot
// wrap around to a small number; negative targets give 0.
std::uint32_t whiteBalanceLevel(float target, std::uint32_t fullScale, int channel) {
    if (!std::isfinite(target))
        throw std::runtime_error(msg::kNonFiniteLevelPrefix + std::string(kChannelNames[channel]) +
                                 msg::kNonFiniteLevelSuffix);
    const float level = std::floor(0.5f + static_cast<float>(fullScale) * target);
    const std::uint32_t limit = std::min<std::uint32_t>(fullScale, 0xFFFFu);
    if (!(level > 0.0f))
        return 0;
    return level >= static_cast<float>(limit) ? limit : static_cast<std::uint32_t>(level);
}

void writeWhiteBalance(RegisterText& out, const config_node& config, const FitResult& fit,
                       const BayerImage& image) {
    int bits = config.find("shared").find("bit_res").as_int() & 0xFFFF;
    if (bits == 0)
        bits = image.bitsPerSample();
    const std::uint32_t fullScale = bits >= 32 ? 0xFFFFFFFFu : (1u << bits) - 1u;
    std::uint32_t level[kChannels];
    for (int channel = 0; channel < kChannels; ++channel)
        level[channel] = whiteBalanceLevel(fit.targetLevels[channel], fullScale, channel);
    out.assign("GR                   ", integerText(level[1]));
    out.assign("R                    ", integerText(level[0]));
    out.assign("B                    ", integerText(level[3]));
    out.assign("GB                   ", integerText(level[2]));
}

bool isPlainToken(const std::string& text) {
    return !text.empty() && std::all_of(text.begin(), text.end(), [](char c) {
        return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || (c >= '0' && c <= '9') ||
               c == '_' || c == '/' || c == '\\' || c == ':' || c == '-' || c == '.';
    });
}

// Bare when the configuration reader takes it as a plain value; otherwise
// quoted, so that an empty or unusual serial number still reads back.
std::string serialValue(const std::string& serial) {
    if (isPlainToken(serial))
        return serial;
    if (serial.find('"') != std::string::npos)
        throw std::runtime_error(msg::kQuoteInSerial);
    return "\"" + serial + "\"";
}

void writeDeltas(RegisterText& out, const ExportedPatchSizes& sizes) {
    const struct {
        const char* msbName;
        const char* lsbName;
        std::int64_t size;
    } deltas[] = {
        {"leftPatchDeltaUMSB   ", "leftPatchDeltaULSB   ", sizes.left},
        {"centerPatchDeltaUMSB ", "centerPatchDeltaULSB ", sizes.center},
        {"rightPatchDeltaUMSB  ", "rightPatchDeltaULSB  ", sizes.right},
        {"topPatchDeltaVMSB    ", "topPatchDeltaVLSB    ", sizes.top},
        {"middlePatchDeltaVMSB ", "middlePatchDeltaVLSB ", sizes.middle},
        {"bottomPatchDeltaVMSB ", "bottomPatchDeltaVLSB ", sizes.bottom},
    };
    for (const auto& delta : deltas) {
        const PatchStep step = patchStep(delta.size);
        out.assign(delta.msbName, "0x" + hexText(step.msb));
        out.assign(delta.lsbName, "0x" + hexText(step.lsb));
    }
}

void writeControlPoints(RegisterText& out, const std::string& infix, const FitResult& fit) {
    for (int channel = 0; channel < kChannels; ++channel) {
        for (int n = 0; n < kGridPoints; ++n) {
            const std::string name = infix + ".controlPoint" + kChannelRegisters[channel] + "[" +
                                     integerText(n / 10) + "][" + integerText(n % 10) + "]";
            const double value = fit.correction.controlGrids[channel][n];
            const std::string text = generalText(value, 12);
            if (!std::isfinite(value))
                throw std::runtime_error(msg::kNonFiniteControlPointPrefix +
                                         name.substr(infix.size() + 1) +
                                         msg::kNonFiniteControlPointSuffix + text);
            // An infix starts with its own "." and the prefix already ends in one.
            out.assign(name.substr(1) + "  ", text);
        }
    }
}

// A line break inside an argument would end the comment line and put the
// rest of the argument into the file as settings.
std::string singleLine(std::string text) {
    std::replace(text.begin(), text.end(), '\n', ' ');
    std::replace(text.begin(), text.end(), '\r', ' ');
    return text;
}

} // namespace

std::string register_file_text(const config_node& config, const std::string& blockName,
                               const std::string& controlPointInfix,
                               const std::string& commandLineText, const FitResult& fit,
                               const BayerImage& image) {
    const std::int32_t width = image.width();
    const std::int32_t height = image.height();
    const ExportedPatchSizes sizes =
        exportedPatchSizes(static_cast<std::uint32_t>(width), static_cast<std::uint32_t>(height),
                           fit.correction.layout.left, fit.correction.layout.center,
                           fit.correction.layout.top, fit.correction.layout.middle);
    checkExportedSizes(sizes, width, height);
    const config_node& shared = config.find("shared");

    RegisterText out(blockName);
    out.line("#############################################");
    out.line("# Command line: vignetteFit " + singleLine(commandLineText));
    out.line("global.configType            = 1;");
    out.line("global.configVersion         = 0x0100;");
    writeGeometry(out, config.find("lsc"), sizes, fit, width, height);
    const int lightSource = shared.find("light_source").as_int();
    if (lightSource >= 0)
        out.assign("light_source         ", integerText(lightSource));
    if (config.find("lsc").find("wb_avgs_flag").as_bool())
        writeWhiteBalance(out, config, fit, image);
    const int fuseIdBytes = shared.find("fuse_id_bytes").as_int();
    out.assign(
        "serial_no            ",
        serialValue(image.serialNumber(2 * static_cast<std::size_t>(std::max(fuseIdBytes, 0)))));
    writeDeltas(out, sizes);
    writeControlPoints(out, controlPointInfix, fit);
    return out.text();
}

std::string write_register_file(const std::string& path, const config_node& config,
                                const std::string& blockName, const std::string& controlPointInfix,
                                const std::string& commandLineText, const FitResult& fit,
                                const BayerImage& image) {
    const std::string text =
        register_file_text(config, blockName, controlPointInfix, commandLineText, fit, image);
    OutputFile file;
    if (!file.open(path))
        throw std::runtime_error(msg::kCannotWriteCalibration);
    const bool written = std::fwrite(text.data(), 1, text.size(), file.stream()) == text.size();
    if (!written || !file.commit())
        throw std::runtime_error(msg::kCannotWriteCalibration);
    return text;
}

} // namespace config
