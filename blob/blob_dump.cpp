#include "blob/blob_dump.h"

#include <algorithm>

#include "blob/blob_layout.h"

namespace blob {

using config::config_node;

namespace {

// The value text, or empty for a node that is missing or was never set.
std::string textOf(const config_node& node) {
    return node.valid() && node.initialized() ? node.as_string() : std::string();
}

// An empty value must be quoted to read back ("reference.serial_no = ;"
// would not parse).
std::string valueText(const config_node& node) {
    const std::string text = textOf(node);
    return text.empty() ? "\"\"" : text;
}

// The posture character without the single quotes a re-read dump brings.
std::string postureText(const config_node& node) {
    const std::string text = textOf(node);
    if (text.size() == 3 && text.front() == '\'' && text.back() == '\'')
        return text.substr(1, 1);
    return text;
}

// The count a block can hold, whatever the tree says.
std::size_t pairCountOf(const config_node& count) {
    const int value = count.as_int();
    return static_cast<std::size_t>(std::clamp(value, 0, static_cast<int>(kMaxFocusPairs)));
}

std::string versionText(const std::array<std::uint8_t, 3>& version) {
    return std::to_string(version[0]) + "." + std::to_string(version[1]) + "." +
           std::to_string(version[2]);
}

void writeTracking(const config_node& calibration, const std::string& prefix, std::ostream& out) {
    const config_node& serial = calibration.find("serial_no");
    const config_node& moduleSerial = calibration.find("module").find("serial_no");
    if (!serial.valid() && !moduleSerial.valid())
        return;
    out << "\n# --------------- Tracking Data block ---------------\n";
    if (serial.valid())
        out << prefix << "serial_no = " << valueText(serial) << ";\n";
    if (moduleSerial.valid())
        out << "module.serial_no = " << valueText(moduleSerial) << ";\n";
}

void writeLensShading(const config_node& calibration, const std::string& prefix,
                      const config_node& config, std::ostream& out) {
    if (!calibration.find("controlPointR").valid())
        return;
    out << "\n# -------------------- LSC block --------------------\n";
    out << "# " << prefix << "light_id = " << textOf(config.find("shared").find("light_source"))
        << ";\n";
    out << "# " << prefix
        << "compression_res = " << textOf(config.find("blob").find("compression_res")) << ";\n";
    for (const char* name : kControlPointNames) {
        const config_node& grid = calibration.find(name);
        for (std::size_t i = 0; i < kGridSide; ++i)
            for (std::size_t j = 0; j < kGridSide; ++j)
                out << prefix << name << "[" << std::to_string(i) << "][" << std::to_string(j)
                    << "] = " << textOf(grid.find(i).find(j)) << ";\n";
    }
}

void writeWhiteBalance(const config_node& calibration, const std::string& prefix,
                       const config_node& config, std::ostream& out) {
    if (!calibration.find("R").valid())
        return;
    out << "\n# -------------------- AWB block --------------------\n";
    out << prefix << "light_source = " << textOf(config.find("shared").find("light_source"))
        << ";\n";
    for (const char* name : kAwbNames)
        out << prefix << name << " = " << textOf(calibration.find(name)) << ";\n";
}

void writeFocus(const config_node& calibration, std::ostream& out) {
    const config_node& sets = calibration.find("module").find("af").find("set");
    for (std::size_t i = 0; sets.find(i).find("posture").valid(); ++i) {
        const config_node& set = sets.find(i);
        const std::string head = "module.af.set[" + std::to_string(i) + "]";
        out << "\n# -------------------- Focus Calibration block --------------------\n";
        out << head << ".posture = '" << postureText(set.find("posture")) << "';\n";
        for (const char* name : {"macro", "hyper", "inf", "settle_time", "hysteresis"})
            out << head << "." << name << " = " << textOf(set.find(name)) << ";\n";
        // A dump read back has no num_pairs; its pairs are all there is.
        const config_node& pairs = set.find("FDN_dist_pair");
        const config_node& count = set.find("num_pairs");
        const std::size_t pairCount = count.valid() ? pairCountOf(count) : pairs.size();
        for (std::size_t k = 0; k < pairCount; ++k)
            out << head << ".FDN_dist_pair[" << std::to_string(k) << "] = { "
                << textOf(pairs.find(k).find(std::size_t{0})) << ", "
                << textOf(pairs.find(k).find(std::size_t{1})) << " };\n";
    }
}

} // namespace

void writeCalibrationText(const config_node& calibration, const std::string& prefix,
                          const config_node& config, const std::string& toolName,
                          const std::string& toolVersionText, const BlobVersions& versions,
                          std::ostream& out) {
    out << "# " << toolName << " version " << toolVersionText
        << ", binary calibration data as text\n";
    out << "# blob.version = " << versionText(versions.blob) << ";\n";
    out << "global.configType            = 1;\n";
    out << "global.configVersion         = 0x0100;\n";
    writeTracking(calibration, prefix, out);
    writeLensShading(calibration, prefix, config, out);
    writeWhiteBalance(calibration, prefix, config, out);
    writeFocus(calibration, out);
    out << "\n# ------------- Calibration Tool block --------------\n";
    out << "# shared.program_number = " << textOf(config.find("shared").find("program_number"))
        << ";\n";
    out << "# tool.version = " << versionText(versions.tool) << ";\n";
    out << "# shared.cfg_file_date = " << textOf(config.find("shared").find("cfg_file_date"))
        << ";\n";
    out.flush();
}

} // namespace blob
