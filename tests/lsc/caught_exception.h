#pragma once
// Runs a callable that must throw apan::exception and hands the exception
// back, so a test can check its code and both texts.

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

} // namespace lsc_test
