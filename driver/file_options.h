#pragma once
// Checks, before any work, that no output of a run names a file the run reads
// or another output: a factory script that mistypes one name must not lose a
// capture, a configuration or a finished calibration.

#include "driver/command_line.h"

namespace driver {

// Throws std::runtime_error
//   "Output --<a> names the same file as input --<b>: <path>"
//   "Output --<a> names the same file as output --<b>: <path>"
// for the first such pair (an existing file: same device and inode, through
// links of either kind; a file still to be made: the same resolved directory
// and name). Devices and pipes (/dev/stdout, /dev/null, a FIFO) and the file
// standard output or error already writes to are streams, not stored files:
// any number of options may name them. "--log -" is standard output.
void checkOutputsReplaceNothing(const CommandLine& line);

} // namespace driver
