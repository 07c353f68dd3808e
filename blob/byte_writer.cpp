#include "blob/byte_writer.h"

namespace blob {

void ByteWriter::put(std::uint64_t value, unsigned count) {
    for (unsigned i = count; i-- > 0;)
        bytes_.push_back(static_cast<std::uint8_t>(value >> (8 * i)));
}

} // namespace blob
