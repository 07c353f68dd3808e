#pragma once
// How whatever ended a run is reported: the text, where it goes and the exit
// status. One place, so the printed error and the report's verdict agree.

#include <exception>
#include <string>

namespace driver {

// Detail lines (what and where) stand under the error's text, indented so.
inline constexpr char kDetailIndent[] = "  ";

struct FailureText {
    int status = 1;
    std::string text;           // the lines to print, without the final line end
    bool standardError = false; // printed on standard error, not the message stream
};

// `failure` must hold an exception. A `notice` gives status 0 and its text.
// An error that carries an ErrorDetail gets it as one more, indented line.
FailureText describeFailure(std::exception_ptr failure);

} // namespace driver
