#include "image/error_detail.h"

#include <cstring>

namespace img {

std::string systemReason(const std::string& path, int error) {
    return path + ": " + std::strerror(error);
}

} // namespace img
