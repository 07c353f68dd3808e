// Parsing speed of the configuration reader on a large file, and of printing
// the tree it builds.

#include <sstream>
#include <string>

#include <benchmark/benchmark.h>

#include "config/config_file.h"
#include "config/parameter_table.h"

using config::config_node;
using config::config_node_impl;
using config::parse_config_text;
using config::set_defaults;

namespace {

// 10,000 lines in the shapes real files use: scalars, lists, indexed keys,
// comments and blank lines.
std::string largeConfiguration() {
    std::string text;
    for (int i = 0; i < 10000; ++i) {
        const std::string n = std::to_string(i);
        switch (i % 5) {
        case 0:
            text += "section" + std::to_string(i % 17) + ".max_gain_" + n + " = 6.25;\n";
            break;
        case 1:
            text += "block.controlPointGR[" + std::to_string(i % 10) + "][" +
                    std::to_string(i / 10 % 10) + "]  = 1.10000002384;   # point\n";
            break;
        case 2:
            text += "af.set[" + std::to_string(i % 8) + "].FDN_dist_pair[" +
                    std::to_string(i % 40) + "] = { " + n + ", 2 };\n";
            break;
        case 3:
            text += "apply_lsc.ccm_" + n + " = {0.5, -1.25, 3e-2};\n";
            break;
        default:
            text += "# comment line " + n + "\n\n";
            break;
        }
    }
    return text;
}

void BM_ParseTenThousandLines(benchmark::State& state) {
    const std::string text = largeConfiguration();
    for (auto _ : state) {
        config_node_impl root("root");
        config_node& config = root.child("config");
        set_defaults(config);
        parse_config_text(text, config);
        benchmark::DoNotOptimize(&config);
    }
    state.SetBytesProcessed(static_cast<std::int64_t>(state.iterations() * text.size()));
}
BENCHMARK(BM_ParseTenThousandLines)->Unit(benchmark::kMillisecond);

void BM_PrintTree(benchmark::State& state) {
    config_node_impl root("root");
    config_node& config = root.child("config");
    set_defaults(config);
    parse_config_text(largeConfiguration(), config);
    for (auto _ : state) {
        std::ostringstream out;
        root.print(out);
        benchmark::DoNotOptimize(out.str().size());
    }
}
BENCHMARK(BM_PrintTree)->Unit(benchmark::kMillisecond);

} // namespace
