#include "blob/blob_sources.h"

namespace blob {

using config::config_node;

BlobSources blobSourcesFromConfig(const config_node& config) {
    const config_node& shared = config.find("shared");
    const config_node& registers = config.find(shared.find("block_name").as_string());
    const bool numbered = shared.find("block_num_flag").as_bool();
    const config_node& controlPoints =
        numbered ? registers.find("ctrlPoints")
                       .find(static_cast<std::size_t>(shared.find("block_num").as_int()))
                 : registers;
    return {registers, controlPoints, config.find("module"), config};
}

} // namespace blob
