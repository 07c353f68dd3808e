#pragma once
// The calibration report: one self-contained HTML page about one run, read
// at the calibration station at a glance and printed on one or two A4
// pages. No scripts and nothing loaded from elsewhere: every figure is inline
// SVG drawn here. The page depends only on the report data (no clock, no
// locale), so the same run gives the same bytes.

#include <string>

#include "report/run_report.h"

namespace report {

// The whole page.
std::string runReportHtml(const RunReport& report);

// Writes the page to `path` through OutputFile, so a reader never sees half a
// page. Throws std::runtime_error "Cannot write report file: " + path when it
// cannot be created or written.
void writeRunReport(const std::string& path, const RunReport& report);

} // namespace report
