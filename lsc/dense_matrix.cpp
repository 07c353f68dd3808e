#include "lsc/dense_matrix.h"

#include <algorithm>
#include <cstdint>
#include <new>

namespace apan {

denseMatrix::denseMatrix(std::uint32_t rows, std::uint32_t columns) {
    // Counted in 64 bits: on a 32-bit host rows * columns * 8 can wrap size_t.
    const std::uint64_t count = static_cast<std::uint64_t>(rows) * columns;
    if (count > SIZE_MAX / sizeof(double))
        throw std::bad_alloc();
    data_.reset(new double[static_cast<std::size_t>(count)]());
    rows_ = rows;
    columns_ = columns;
}

void denseMatrix::fill(double value) {
    std::fill(data_.get(), data_.get() + size(), value);
}

} // namespace apan
