#include <functional>
#include <stdexcept>
#include <string>

#include <gtest/gtest.h>

#include "blob/field_values.h"

namespace blob {

using config::config_node;
using config::config_node_impl;
namespace {

class FieldValues : public ::testing::Test {
protected:
    config_node& set(const std::string& path, const std::string& value) {
        config_node& node = config.child_path(path);
        node.set(value);
        return node;
    }
    std::string failure(const std::function<void()>& action) {
        try {
            action();
        } catch (const std::runtime_error& e) {
            return e.what();
        }
        return "(no error)";
    }

    config_node_impl root{"root"};
    config_node& config = root.child("config");
};

TEST_F(FieldValues, ReadsWholeNumbersInRange) {
    EXPECT_EQ(fieldValue(config, set("module.af.set[0].macro", "4294967295"), 0, 4294967295),
              4294967295);
    EXPECT_EQ(fieldValue(config, set("shared.light_source", "-1"), -1, 255), -1);
    EXPECT_EQ(fieldValue(config, set("shared.program_number", "+7"), 0, 255), 7);
}

TEST_F(FieldValues, RefusesValuesWiderThanTheField) {
    const config_node& settle = set("module.af.set[1].settle_time", "65536");
    EXPECT_EQ(failure([&] { fieldValue(config, settle, 0, 65535); }),
              "Value for module.af.set[1].settle_time does not fit in the binary calibration "
              "data, value must be between 0 and 65535.");
    const config_node& macro = set("module.af.set[0].macro", "-1");
    EXPECT_EQ(failure([&] { fieldValue(config, macro, 0, 4294967295); }),
              "Value for module.af.set[0].macro does not fit in the binary calibration data, "
              "value must be between 0 and 4294967295.");
    const config_node& huge = set("module.af.set[0].inf", "99999999999999999999999");
    EXPECT_NE(failure([&] { fieldValue(config, huge, 0, 4294967295); }).find("does not fit"),
              std::string::npos);
}

TEST_F(FieldValues, RefusesTextsThatAreNotWholeNumbers) {
    for (const char* text : {"1.5", "", "-", "12a", " 1", "0x10"}) {
        const config_node& node = set("reference.R", text);
        EXPECT_EQ(failure([&] { fieldValue(config, node, 0, 65535); }),
                  "Value for reference.R is not a whole number.")
            << text;
    }
}

TEST_F(FieldValues, MissingNodeRaisesTheTreeError) {
    EXPECT_THROW(fieldValue(config, config.find("reference").find("R"), 0, 65535),
                 std::invalid_argument);
}

TEST_F(FieldValues, SerialTextBecomesBytes) {
    EXPECT_EQ(serialBytes(config, set("reference.serial_no", "0a1B")),
              (std::vector<std::uint8_t>{0x0A, 0x1B}));
    EXPECT_EQ(serialBytes(config, set("reference.serial_no", "\"ff00\"")),
              (std::vector<std::uint8_t>{0xFF, 0x00}));
    EXPECT_TRUE(serialBytes(config, set("reference.serial_no", "\"\"")).empty());
    EXPECT_TRUE(serialBytes(config, set("reference.serial_no", "")).empty());
}

TEST_F(FieldValues, SerialWithOddLengthOrOtherCharactersIsRefused) {
    for (const char* text : {"0a1", "0g", "\"12 34\"", "zz", "\"", "-1"}) {
        const config_node& node = set("reference.serial_no", text);
        EXPECT_EQ(failure([&] { serialBytes(config, node); }),
                  "Value for reference.serial_no is not a valid serial number, it must be an "
                  "even number of hexadecimal digits.")
            << text;
    }
}

TEST_F(FieldValues, SerialLongerThanTheTrackingBlockIsRefused) {
    const config_node& node = set("module.serial_no", std::string(2 * 65534, 'a'));
    EXPECT_EQ(failure([&] { serialBytes(config, node); }),
              "Value for module.serial_no is too long for the binary calibration data.");
    EXPECT_EQ(serialBytes(config, set("module.serial_no", std::string(2 * 65533, 'a'))).size(),
              65533u);
}

TEST_F(FieldValues, PostureIsTheCharacterBetweenQuotes) {
    EXPECT_EQ(postureCharacter(config, set("module.af.set[0].posture", "'H'")), 'H');
    EXPECT_EQ(postureCharacter(config, set("module.af.set[0].posture", "V")), 'V');
    EXPECT_EQ(postureCharacter(config, set("module.af.set[0].posture", "' '")), ' ');
    const config_node& empty = set("module.af.set[0].posture", "");
    EXPECT_EQ(failure([&] { postureCharacter(config, empty); }),
              "Value for module.af.set[0].posture is empty, a posture character is needed.");
    // The block holds one character: the rest would be lost.
    for (const char* text : {"Up", "'HV'"}) {
        const config_node& longer = set("module.af.set[0].posture", text);
        EXPECT_EQ(failure([&] { postureCharacter(config, longer); }),
                  "Value for module.af.set[0].posture must be a single posture character.")
            << text;
    }
}

} // namespace
} // namespace blob
