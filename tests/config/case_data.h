#pragma once
// Case tables (JSON) and golden outputs of the config and prep tests, kept
// under tests/data/. LSC_GOLDEN_UPDATE=1 rewrites the golden files from the
// current build instead of comparing; every diff of them is reviewed.

#include <cstdlib>
#include <fstream>
#include <sstream>
#include <stdexcept>
#include <string>

#include <gtest/gtest.h>

#include <nlohmann/json.hpp>

namespace case_data {

inline std::string path(const std::string& name) {
    return std::string(LSC_SOURCE_DIR) + "/tests/data/" + name;
}

inline nlohmann::json table(const std::string& name) {
    std::ifstream in(path(name));
    EXPECT_TRUE(in) << path(name);
    return nlohmann::json::parse(in);
}

inline void expectGolden(const std::string& name, const std::string& actual) {
    const char* update = std::getenv("LSC_GOLDEN_UPDATE");
    if (update && std::string(update) == "1") {
        std::ofstream(path(name), std::ios::binary) << actual;
        return;
    }
    std::ifstream in(path(name), std::ios::binary);
    std::ostringstream expected;
    expected << in.rdbuf();
    EXPECT_EQ(actual, expected.str()) << "golden file " << path(name);
}

// Runs `run` on every case of a table and compares the transcript (each case
// followed by its result) with a golden file.
template <typename Run>
void expectTranscript(const std::string& table, const std::string& golden, Run run) {
    std::string transcript;
    for (const nlohmann::json& entry : case_data::table(table))
        transcript += "=== " + entry.dump() + "\n" + run(entry) + "\n";
    expectGolden(golden, transcript);
}

// The message of what `action` throws, or `none`.
template <typename Action> std::string errorOf(Action action, const std::string& none = "") {
    try {
        action();
    } catch (const std::exception& e) {
        return e.what();
    } catch (const std::string& text) {
        return text;
    }
    return none;
}

// A number of a table; JSON has no NaN or infinity: "nan", "inf", "-inf".
inline float number(const nlohmann::json& value) {
    return value.is_string() ? std::stof(value.get<std::string>()) : value.get<float>();
}

// What `action` returns, or the kind and message of what it throws.
template <typename Action> std::string outcomeOf(Action action) {
    try {
        return action();
    } catch (const std::invalid_argument& e) {
        return std::string("invalid argument: ") + e.what();
    } catch (const std::out_of_range& e) {
        return std::string("out of range: ") + e.what();
    } catch (const std::range_error& e) {
        return std::string("range error: ") + e.what();
    } catch (const std::exception& e) {
        return std::string("error: ") + e.what();
    }
}

} // namespace case_data
