#pragma once
// Row-major matrix of doubles that owns its elements; the storage the linear
// solvers work on. A vector is a matrix of one column.

#include <cstddef>
#include <cstdint>
#include <memory>

namespace apan {

class denseMatrix {
public:
    denseMatrix() = default;
    // rows x columns elements, all 0. Throws std::bad_alloc when the element
    // count cannot be addressed on this host or memory runs out.
    denseMatrix(std::uint32_t rows, std::uint32_t columns);

    denseMatrix(denseMatrix&&) noexcept = default;
    denseMatrix& operator=(denseMatrix&&) noexcept = default;

    std::uint32_t rows() const { return rows_; }
    std::uint32_t columns() const { return columns_; }
    std::size_t size() const { return static_cast<std::size_t>(rows_) * columns_; }

    double* data() { return data_.get(); }
    const double* data() const { return data_.get(); }

    // Element (r, c) lives at c + r * columns.
    double& operator()(std::uint32_t r, std::uint32_t c) {
        return data_[c + static_cast<std::size_t>(r) * columns_];
    }
    double operator()(std::uint32_t r, std::uint32_t c) const {
        return data_[c + static_cast<std::size_t>(r) * columns_];
    }
    // Plain element index, for vectors.
    double& operator[](std::size_t i) { return data_[i]; }
    double operator[](std::size_t i) const { return data_[i]; }

    void fill(double value);

private:
    std::unique_ptr<double[]> data_;
    std::uint32_t rows_ = 0;
    std::uint32_t columns_ = 0;
};

} // namespace apan
