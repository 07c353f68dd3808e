#pragma once
// Writes calibration data read from a blob as text in the configuration file
// syntax, so that it can be read again as a register file or autofocus file.
// Settings that are not calibration values (light source, value format, tool
// block) are written as comments.

#include <ostream>
#include <string>

#include "blob/blob_parser.h"
#include "config/config_node.h"

namespace blob {

// `calibration` and `config` as parseBlob filled them; `prefix` is the
// register-name prefix of the lens-shading and white-balance values
// ("reference."). The stream is flushed at the end; the caller checks its
// state.
void writeCalibrationText(const config::config_node& calibration, const std::string& prefix,
                          const config::config_node& config, const std::string& toolName,
                          const std::string& toolVersionText, const BlobVersions& versions,
                          std::ostream& out);

} // namespace blob
