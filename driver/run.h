#pragma once

namespace driver {

// The program: runs every stage and turns whatever ends the run into the
// printed report and the exit status.
[[nodiscard]] int runProgram(int argc, const char* const argv[]);

} // namespace driver
