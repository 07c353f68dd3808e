#pragma once
// The run driver's state and its stages, in their fixed order.

#include "driver/command_line.h"
#include "driver/stage_timer.h"

#include <boost/date_time/posix_time/ptime.hpp>

class Pipeline {
public:
    Pipeline();
    // Runs every stage once; returns the exit status of a completed run.
    // Anything that ends the run early is thrown.
    int run(int argc, const char* const argv[]);

private:
    boost::posix_time::ptime startTime_;
    StageTimer timer_;
    CommandLine commandLine_;
};
