#pragma once
// The autofocus file of --autofocus: it adds autofocus data to the binary
// calibration data and nothing else. The serial number, light source, white
// balance and control points come from this run's register file and
// configuration; a file that would change one of them is refused.

#include <string>

#include "config/config_node.h"

namespace driver {

// Reads the file at `path` and adds its settings to `config` (the "config"
// node that already holds the register file). Settings under "module."
// (module.af.set[...], module.serial_no) are autofocus data; any other
// setting must repeat the value `config` holds, else std::runtime_error
// "The autofocus file may only add autofocus data (module.*); it sets <key>,
// which would change the calibration data." Nothing is added then. Read
// errors as read_config_file.
void readAutofocusFile(const std::string& path, config::config_node& config);

} // namespace driver
