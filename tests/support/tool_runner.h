#pragma once
// Runs build/lsc as a user would and captures what it prints.

#include <string>
#include <vector>

#include <sys/types.h>

namespace testing_support {

struct ToolResult {
    int status = -1; // exit status; -1 when the tool did not exit normally
    std::string out; // standard output
    std::string err; // standard error
};

// Runs the tool with the arguments (not including the program name) in the
// working directory `dir` (empty: the current one). `input` is fed to standard
// input, which is then closed. A `maxFileBytes` above 0 lets no file grow
// beyond it, as on a nearly full disk (a write past it fails with EFBIG);
// standard output and error are pipes, which the limit does not touch.
ToolResult runTool(const std::vector<std::string>& args, const std::string& dir = "",
                   const std::string& input = "", long maxFileBytes = 0);

// Starts the tool in `dir` with its standard streams on /dev/null; returns its
// process id. exitStatus() waits for it: its exit status, -1 when it did not
// exit normally.
pid_t startTool(const std::vector<std::string>& args, const std::string& dir);
int exitStatus(pid_t pid);

// The whitespace-separated words of `text`, as a command line's arguments.
std::vector<std::string> words(const std::string& text);

// What starts a program of this build: empty natively; in a cross build the
// emulator and its arguments, so tests run the target's programs on the host.
const std::vector<std::string>& toolPrefix();

// toolPrefix() as the start of a shell command: each word quoted, followed by
// a space; empty natively.
std::string toolCommandPrefix();

} // namespace testing_support
