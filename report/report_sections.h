#pragma once
// The sections of the calibration report page, each a complete HTML
// fragment. A section whose stage was not reached says so instead of
// leaving a gap, so a failed run's page still reads as a whole.

#include <string>

#include "report/run_report.h"

namespace report {

std::string verdictSection(const RunReport& report);
std::string runSection(const RunReport& report);
std::string surfacesSection(const RunReport& report);
std::string shadingSection(const RunReport& report);
// The colour ratios before and after, with the delta ab map and statistics
// when that stage ran.
std::string colourSection(const RunReport& report);
// Empty when the fit-error check did not run.
std::string fitErrorSection(const RunReport& report);

} // namespace report
