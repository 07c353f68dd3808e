#include "image/image_warning.h"

#include <cstdarg>
#include <cstdio>

namespace img {

void warn(const char* format, ...) noexcept {
    char line[512];
    va_list args;
    va_start(args, format);
    std::vsnprintf(line, sizeof line, format, args);
    va_end(args);
    std::fputs(line, stderr);
    std::fflush(stderr);
}

std::string printableTag(const std::uint8_t* tag) {
    std::string text(16, '?');
    for (int i = 0; i < 16; ++i)
        if (tag[i] >= 32 && tag[i] <= 126)
            text[i] = static_cast<char>(tag[i]);
    return text;
}

} // namespace img
