#pragma once
// An error that carries one more line for the operator: where it happened and
// why (the file and the system's reason, the key and its text, the line of a
// file). The error's own text stays exactly as it is; the top of the run
// prints the detail indented on the line after it.

#include <string>
#include <utility>

namespace img {

class ErrorDetail {
public:
    explicit ErrorDetail(std::string detail) : detail_(std::move(detail)) {}
    virtual ~ErrorDetail() = default;
    const std::string& detail() const noexcept { return detail_; }

private:
    std::string detail_;
};

// `Base` with a detail line: still caught as `Base` wherever it was before.
template <class Base> class DetailedError : public Base, public ErrorDetail {
public:
    template <class... Args>
    explicit DetailedError(std::string detail, Args&&... args)
        : Base(std::forward<Args>(args)...), ErrorDetail(std::move(detail)) {}
};

// "<path>: <the system's text for errno>".
std::string systemReason(const std::string& path, int error);

} // namespace img
