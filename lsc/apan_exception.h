#pragma once
// The program's own exception: a numeric code that becomes the exit status, a
// message and a second line of explanation for the operator.

#include <exception>
#include <string>
#include <utility>

namespace apan {

class exception : public std::exception {
public:
    exception(int code, std::string message, std::string hint)
        : code_(code), message_(std::move(message)), hint_(std::move(hint)) {}

    const char* what() const noexcept override { return message_.c_str(); }
    int code() const noexcept { return code_; }
    const std::string& hint() const noexcept { return hint_; }

private:
    int code_;
    std::string message_;
    std::string hint_;
};

} // namespace apan
