#include "driver/stage_timer.h"

namespace driver {

StageTimer startStageTimer() {
    StageTimer timer;
    timer.start = timer.last = std::clock();
    return timer;
}

void timerLine(StageTimer& timer, const char* label, std::ostream& out) {
    if (!timer.enabled)
        return;
    const std::clock_t now = std::clock();
    out << label;
    out.precision(3);
    out << static_cast<float>(now - timer.last) / 1000000.0f << " sec" << std::endl;
    timer.last = now;
}

} // namespace driver
