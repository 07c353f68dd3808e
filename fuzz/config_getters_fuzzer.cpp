// Stores arbitrary text under an arbitrary path (the first line of the input)
// and reads it back through every typed getter, the range checks and the date
// conversion. Checks that numbers written by the writers' helpers read back
// to the same value.

#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <stdexcept>
#include <string>

#include <boost/lexical_cast/bad_lexical_cast.hpp>

#include "config/config_node.h"
#include "config/parameter_table.h"
#include "config/value_text.h"

using namespace config;

namespace {

template <typename Action> void tolerate(Action action) {
    try {
        action();
    } catch (const boost::bad_lexical_cast&) {
    } catch (const std::invalid_argument&) {
    } catch (const std::out_of_range&) {
    } catch (const std::range_error&) {
    }
}

void checkRoundTrips(const config_node& node) {
    tolerate([&] {
        const int value = node.as_int();
        std::int32_t again = 0;
        if (!parseIntegerText(integerText(value), again) || again != value)
            std::abort();
        if (node.as_uint8() != static_cast<unsigned char>(value & 0xFF))
            std::abort();
        if (node.as_bool() != (value != 0))
            std::abort();
    });
    tolerate([&] {
        const float value = node.as_float();
        float again = 0.0f;
        if (!parseFloatText(doubleText(value), again))
            std::abort();
        if (std::isnan(value) ? !std::isnan(again) : std::memcmp(&again, &value, sizeof value) != 0)
            std::abort();
    });
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    const std::string input(reinterpret_cast<const char*>(data), size);
    const std::size_t lineEnd = input.find('\n');
    const std::string path = input.substr(0, lineEnd);
    const std::string value = lineEnd == std::string::npos ? "" : input.substr(lineEnd + 1);

    config_node_impl root("root");
    config_node& config = root.child("config");
    tolerate([&] {
        config_node& node = config.child_path(path);
        node.set(value);
        if (&config.find_path(path) != &node)
            std::abort();
        checkRoundTrips(node);
        tolerate([&] { check_int_range(config, node, -5, 5); });
        tolerate([&] { check_float_range(config, node, 0.0f, 1.0f); });
        tolerate([&] { node.as_string(); });
    });
    tolerate([&] { config_date_seconds(value); });
    tolerate([&] { config.find_path(value).valid(); });
    return 0;
}
