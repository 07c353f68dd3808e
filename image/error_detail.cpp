#include "image/error_detail.h"

#include <cstring>

std::string systemReason(const std::string& path, int error) {
    return path + ": " + std::strerror(error);
}
