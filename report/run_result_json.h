#pragma once
// The machine-readable result of a run (--json): one JSON document for a
// production line's scripts, written at the end of the run, also after a
// failure. Its layout is versioned (kResultSchemaVersion) and described by
// docs/result.schema.json.

#include <string>

#include "report/run_report.h"

namespace report {

inline constexpr int kResultSchemaVersion = 1;

// The document, without a trailing line end. Every figure is the number the
// run prints (R/G with six significant digits, the luminance residual with
// two decimals, ...) or, for figures it does not print, six significant
// digits; the sizes of the outputs are read from the files.
std::string runResultJson(const RunReport& report);

// Writes it to `path` through OutputFile (never half-written). Throws
// std::runtime_error "Cannot write result file: " + path.
void writeRunResult(const std::string& path, const RunReport& report);

} // namespace report
