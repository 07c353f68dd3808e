#pragma once
// Where the generator finds the calibration data in the configuration tree
// after the register file (and the autofocus file) were read into it.

#include "config/config_node.h"

namespace blob {

struct BlobSources {
    const config::config_node& registers;     // <block_name>: serial_no, R, GR, GB, B
    const config::config_node& controlPoints; // controlPointR ... controlPointB
    const config::config_node& module;        // module: serial_no, af.set[i]
    const config::config_node& config;        // the "config" node: shared.*, blob.*
};

// The nodes as the register file lays them out under the "config" node:
// registers under `<block_name>`, control points there too or, when
// shared.block_num_flag is set, under `<block_name>.ctrlPoints[<block_num>]`;
// autofocus data under `module`. Missing nodes come back as the null node
// (a negative block number finds none).
BlobSources blobSourcesFromConfig(const config::config_node& config);

} // namespace blob
