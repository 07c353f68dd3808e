#pragma once
// The calibration register file: register assignments in configuration file
// syntax (patch geometry, fixed-point patch steps, white-balance levels, the
// module serial number and four 10 x 10 control-point grids).

#include <string>

#include "config/config_node.h"
#include "image/bayer_image.h"
#include "lsc/fit_result.h"

namespace config {

// Builds the whole text first, so that a geometry or value the file cannot
// hold is refused before anything is written, then writes it through a
// temporary file renamed into place. `blockName` prefixes every register;
// `controlPointInfix` (empty or ".ctrlPoints[<n>]") goes between it and the
// control-point names; `commandLineText` is the run's arguments, each followed
// by a blank. Throws std::runtime_error for a geometry that leaves a patch
// smaller than 2 pixels, a non-finite control point or target level, a serial
// number holding a double quote, and any failure to create or write the file.
// Returns the text as written: whatever reads the calibration back in this
// run takes it from here, never from the path, which another process or a
// device (/dev/null, a pipe) may answer differently.
std::string write_register_file(const std::string& path, const config_node& config,
                                const std::string& blockName, const std::string& controlPointInfix,
                                const std::string& commandLineText, const lsc::FitResult& fit,
                                const img::BayerImage& image);

// The text alone (same checks, nothing written).
std::string register_file_text(const config_node& config, const std::string& blockName,
                               const std::string& controlPointInfix,
                               const std::string& commandLineText, const lsc::FitResult& fit,
                               const img::BayerImage& image);

} // namespace config
