#include "driver/failure_text.h"

#include <new>
#include <string>

#include "driver/driver_messages.h"
#include "driver/notice.h"
#include "image/error_detail.h"
#include "lsc/apan_exception.h"

namespace driver {

using img::ErrorDetail;

namespace {

FailureText error(const std::string& text) {
    return {1, msg::kErrorPrefix + text, false};
}

// The detail line, indented, after the whole of the error's own text. A text
// that ends with its own line end is printed with the empty line that end
// makes; the detail comes after it, so the error's lines stay as they were.
FailureText withDetail(FailureText failure, const std::exception& e) {
    if (const auto* detail = dynamic_cast<const ErrorDetail*>(&e))
        failure.text += std::string("\n") + kDetailIndent + detail->detail();
    return failure;
}

} // namespace

FailureText describeFailure(std::exception_ptr failure) {
    try {
        std::rethrow_exception(failure);
    } catch (const notice& text) {
        return {0, text.what(), false};
    } catch (const apan::exception& e) {
        return withDetail({e.code(),
                           "ERROR(" + std::to_string(e.code()) + "): " + e.what() + "\n" + e.hint(),
                           false},
                          e);
    } catch (const std::bad_alloc&) {
        return {1, msg::kNoMemory, true};
    } catch (const std::string& text) {
        return error(text);
    } catch (const char* text) {
        return error(text);
    } catch (const std::exception& e) {
        return withDetail(error(e.what()), e);
    } catch (...) {
        return error(msg::kUnknownError);
    }
}

} // namespace driver
