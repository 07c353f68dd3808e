#include "driver/failure_text.h"

#include "driver/driver_messages.h"
#include "driver/notice.h"
#include "lsc/apan_exception.h"

#include <new>
#include <string>

namespace {

FailureText error(const std::string& text) {
    return {1, msg::kErrorPrefix + text, false};
}

} // namespace

FailureText describeFailure(std::exception_ptr failure) {
    try {
        std::rethrow_exception(failure);
    } catch (const notice& text) {
        return {0, text.what(), false};
    } catch (const apan::exception& e) {
        return {e.code(), "ERROR(" + std::to_string(e.code()) + "): " + e.what() + "\n" + e.hint(),
                false};
    } catch (const std::bad_alloc&) {
        return {1, msg::kNoMemory, true};
    } catch (const std::string& text) {
        return error(text);
    } catch (const char* text) {
        return error(text);
    } catch (const std::exception& e) {
        return error(e.what());
    } catch (...) {
        return error(msg::kUnknownError);
    }
}
