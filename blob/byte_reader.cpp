#include "blob/byte_reader.h"

namespace blob {

std::uint64_t ByteReader::take(std::size_t count) {
    if (!ok_ || count > size_ - pos_) {  // not "pos_ + count > size_": no overflow
        ok_ = false;
        return 0;
    }
    std::uint64_t value = 0;
    for (std::size_t i = 0; i < count; ++i)
        value = (value << 8) | data_[pos_ + i];
    pos_ += count;
    return value;
}

const std::uint8_t* ByteReader::bytes(std::size_t count) {
    if (!ok_ || count > size_ - pos_) {
        ok_ = false;
        return nullptr;
    }
    const std::uint8_t* start = data_ + pos_;
    pos_ += count;
    return start;
}

} // namespace blob
