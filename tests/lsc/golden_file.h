#pragma once
// Compares a formatted output with its kept copy under tests/data/; with
// LSC_GOLDEN_UPDATE=1 in the environment it rewrites the copy instead.

#include <cstdlib>
#include <fstream>
#include <sstream>
#include <string>

#include <gtest/gtest.h>

namespace lsc_test {

inline void expectGolden(const std::string& name, const std::string& text) {
    const std::string path = std::string(LSC_SOURCE_DIR) + "/tests/data/" + name;
    if (std::getenv("LSC_GOLDEN_UPDATE")) {
        std::ofstream(path, std::ios::binary) << text;
        return;
    }
    std::ifstream in(path, std::ios::binary);
    std::stringstream kept;
    kept << in.rdbuf();
    if (kept.str() == text)
        return;
    // Name the first line that differs rather than printing whole pages.
    std::istringstream want(kept.str()), got(text);
    std::string a, b;
    for (int line = 1;; ++line) {
        const bool moreA = static_cast<bool>(std::getline(want, a));
        const bool moreB = static_cast<bool>(std::getline(got, b));
        if (a != b || moreA != moreB || !moreA) {
            ADD_FAILURE() << path << ", line " << line << ":\nkept: " << a << "\ngot:  " << b;
            return;
        }
    }
}

} // namespace lsc_test
