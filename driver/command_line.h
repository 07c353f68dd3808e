#pragma once
// The two option groups, their parsing and the checks on their combination.

#include <ostream>
#include <string>
#include <vector>

#include <boost/program_options/variables_map.hpp>

namespace driver {

// Frames of one capture that --input may name, averaged before preparation.
constexpr std::size_t kMaxInputFrames = 16;

class CommandLine {
public:
    // Parses the arguments and runs, in order: the second parse without --kq,
    // --version, --help and the combination checks. Version, help and a failed
    // combination check are raised as `notice`; parser errors pass through.
    // Help writes the version line to `out`; combination errors go to `err`.
    static CommandLine parse(int argc, const char* const argv[], std::ostream& out,
                             std::ostream& err);

    // The value of a file option; empty when it was not given. For --input,
    // which may be given several times, the first.
    std::string value(const char* name) const;
    // Every value of an option, in command-line order (--input: the frames).
    std::vector<std::string> values(const char* name) const;
    // True when a flag (or any option) was given.
    bool given(const char* name) const { return map_.count(name) == 1; }

    // The arguments after the program name, each followed by one blank.
    const std::string& argumentsText() const { return arguments_; }

private:
    boost::program_options::variables_map map_;
    std::string arguments_;
};

} // namespace driver
