#pragma once
// Runs build/lsc as a user would and captures what it prints.

#include <string>
#include <vector>

namespace testing_support {

struct ToolResult {
    int status = -1; // exit status; -1 when the tool did not exit normally
    std::string out; // standard output
    std::string err; // standard error
};

// Runs the tool with the arguments (not including the program name) in the
// working directory `dir` (empty: the current one). `input` is fed to standard
// input, which is then closed.
ToolResult runTool(const std::vector<std::string>& args, const std::string& dir = "",
                   const std::string& input = "");

// What starts a program of this build: empty natively; in a cross build the
// emulator and its arguments, so tests run the target's programs on the host.
const std::vector<std::string>& toolPrefix();

// The words that start the tool with `args`: toolPrefix(), the tool, `args`.
std::vector<std::string> toolCommand(const std::vector<std::string>& args);

// execvp's argument vector over `words`, which must outlive it.
std::vector<char*> argumentVector(std::vector<std::string>& words);

// toolPrefix() as the start of a shell command: each word quoted, followed by
// a space; empty natively.
std::string toolCommandPrefix();

} // namespace testing_support
