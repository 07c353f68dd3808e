#pragma once
// caught(): runs a callable that must throw apan::exception and hands it back,
// so a test can check its code and both texts; runtimeError(): the text of the
// std::runtime_error a callable throws, or "" when it throws none.

#include <stdexcept>
#include <string>

#include <gtest/gtest.h>

#include "lsc/apan_exception.h"

namespace lsc_test {

template <typename F> apan::exception caught(F f) {
    try {
        f();
    } catch (const apan::exception& e) {
        return e;
    }
    ADD_FAILURE() << "no apan::exception";
    return apan::exception(0, "", "");
}

template <typename F> std::string runtimeError(F f) {
    try {
        f();
    } catch (const std::runtime_error& e) {
        return e.what();
    }
    return "";
}

} // namespace lsc_test
