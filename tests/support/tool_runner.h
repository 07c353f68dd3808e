#pragma once
// Runs build/lsc as a user would and captures what it prints.

#include <string>
#include <vector>

namespace testing_support {

struct ToolResult {
    int status = -1;  // exit status; -1 when the tool did not exit normally
    std::string out;  // standard output
    std::string err;  // standard error
};

// Runs the tool with the arguments (not including the program name) in the
// working directory `dir` (empty: the current one). `input` is fed to standard
// input, which is then closed.
ToolResult runTool(const std::vector<std::string>& args, const std::string& dir = "",
                   const std::string& input = "");

} // namespace testing_support
