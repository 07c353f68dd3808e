#pragma once
// Processor time per stage, printed only in debug mode.

#include <ctime>
#include <ostream>

namespace driver {

struct StageTimer {
    std::clock_t start = 0;
    std::clock_t last = 0;
    bool enabled = true;
};

StageTimer startStageTimer();

// In debug mode writes label, the processor seconds since the previous timer
// line (3 significant digits, or 3 decimals once the stream is in fixed
// notation) and " sec" as one line, then restarts the interval. Disabled, it
// does nothing at all.
void timerLine(StageTimer& timer, const char* label, std::ostream& out);

} // namespace driver
