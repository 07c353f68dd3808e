// Feeds arbitrary bytes to the configuration parser and prints the tree it
// leaves. Parse errors are expected; anything else (a crash, a sanitizer
// report, an unexpected exception type) is a finding.

#include <cstddef>
#include <cstdint>
#include <sstream>
#include <stdexcept>
#include <string_view>

#include "config/config_file.h"

using config::config_node;
using config::config_node_impl;
using config::parse_config_text;

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    config_node_impl root("root");
    config_node& config = root.child("config");
    try {
        parse_config_text(std::string_view(reinterpret_cast<const char*>(data), size), config);
    } catch (const std::runtime_error&) { // parse errors and their limits
    } catch (const std::out_of_range&) {  // a list longer than the index limit
    }
    std::ostringstream out;
    root.print(out);
    return 0;
}
