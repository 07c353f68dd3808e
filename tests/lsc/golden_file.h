#pragma once
// Compares a formatted output with its reviewed copy under tests/data/; with
// LSC_GOLDEN_UPDATE=1 in the environment it rewrites the copy instead (then
// `git diff tests/data` shows what changed).

#include <algorithm>
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
    std::stringstream in;
    in << std::ifstream(path, std::ios::binary).rdbuf();
    const std::string kept = in.str();
    const auto at = std::mismatch(text.begin(), text.end(), kept.begin(), kept.end()).first;
    const std::size_t differs = static_cast<std::size_t>(at - text.begin());
    EXPECT_TRUE(kept == text) << path << " differs from byte " << differs << ": "
                              << text.substr(differs > 40 ? differs - 40 : 0, 120);
}

} // namespace lsc_test
