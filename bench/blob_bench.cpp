// Building and reading back a full blob: serial number, tool block, 400
// control points, white balance and two focus sets.

#include <sstream>
#include <string>

#include <benchmark/benchmark.h>

#include "blob/blob_parser.h"
#include "blob/blob_writer.h"
#include "config/config_node.h"

using config::config_node;
using config::config_node_impl;

namespace {

void fillCalibration(config_node& config) {
    const auto set = [&](const std::string& path, const std::string& value) {
        config.child_path(path).set(value);
    };
    set("shared.block_name", "reference");
    set("shared.block_num_flag", "0");
    set("shared.block_num", "0");
    set("shared.light_source", "1");
    set("shared.program_number", "3");
    set("shared.cfg_file_date", "2012-05-01T10:30");
    set("blob.compression_flag", "1");
    set("blob.compression_res", "s3.8");
    set("reference.serial_no", "0123456789abcdef");
    const char* grids[] = {"controlPointR", "controlPointGR", "controlPointGB", "controlPointB"};
    for (int c = 0; c < 4; ++c)
        for (int i = 0; i < 10; ++i)
            for (int j = 0; j < 10; ++j)
                set(std::string("reference.") + grids[c] + "[" + std::to_string(i) + "][" +
                        std::to_string(j) + "]",
                    std::to_string(1.0 + 0.01 * (c + i * j)));
    for (const char* name : {"R", "GR", "GB", "B"})
        set(std::string("reference.") + name, "700");
    for (int s = 0; s < 2; ++s) {
        const std::string head = "module.af.set[" + std::to_string(s) + "].";
        set(head + "posture", "'H'");
        for (const char* key : {"macro", "hyper", "inf", "settle_time", "hysteresis"})
            set(head + key, "100");
        for (int k = 0; k < 8; ++k) {
            set(head + "FDN_dist_pair[" + std::to_string(k) + "][0]", std::to_string(k));
            set(head + "FDN_dist_pair[" + std::to_string(k) + "][1]", std::to_string(k * 3));
        }
    }
}

void BM_GenerateBlob(benchmark::State& state) {
    config_node_impl root("root");
    config_node& config = root.child("config");
    fillCalibration(config);
    const blob::BlobSources sources = blob::blobSourcesFromConfig(config);
    std::ostringstream warnings;
    for (auto _ : state)
        benchmark::DoNotOptimize(blob::generateBlob(sources, {1, 7, 2}, warnings));
}
BENCHMARK(BM_GenerateBlob)->Unit(benchmark::kMicrosecond);

void BM_ParseBlob(benchmark::State& state) {
    config_node_impl root("root");
    config_node& config = root.child("config");
    fillCalibration(config);
    std::ostringstream warnings;
    const std::vector<std::uint8_t> bytes =
        blob::generateBlob(blob::blobSourcesFromConfig(config), {1, 7, 2}, warnings);
    for (auto _ : state) {
        config_node_impl back("root");
        benchmark::DoNotOptimize(blob::parseBlob(bytes.data(), bytes.size(),
                                                 back.child("calibration"), back.child("config")));
    }
}
BENCHMARK(BM_ParseBlob)->Unit(benchmark::kMicrosecond);

} // namespace
