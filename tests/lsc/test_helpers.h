#pragma once
// Helpers of the lens-shading, driver and report tests. caught(): runs a
// callable that must throw apan::exception and hands it back, so a test can
// check its code and both texts; runtimeError(): the text of the
// std::runtime_error a callable throws, or "" when it throws none;
// expectGolden(): compares a formatted output with its reviewed copy under
// tests/data/, or with LSC_GOLDEN_UPDATE=1 in the environment rewrites the copy
// (then `git diff tests/data` shows what changed).

#include <algorithm>
#include <cstdlib>
#include <fstream>
#include <sstream>
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

inline void expectGolden(const std::string& name, const std::string& text) {
    const std::string path = std::string(LSC_SOURCE_DIR) + "/tests/data/" + name;
    if (std::getenv("LSC_GOLDEN_UPDATE")) {
        std::ofstream(path, std::ios::binary) << text;
        return;
    }
    std::stringstream in;
    in << std::ifstream(path, std::ios::binary).rdbuf();
    const std::string kept = in.str();
    const auto at = std::mismatch(text.begin(), text.end(), kept.begin(), kept.end()).first;
    const std::size_t differs = static_cast<std::size_t>(at - text.begin());
    EXPECT_TRUE(kept == text) << path << " differs from byte " << differs << ": "
                              << text.substr(differs > 40 ? differs - 40 : 0, 120);
}

} // namespace lsc_test
