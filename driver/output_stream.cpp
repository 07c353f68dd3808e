#include "driver/output_stream.h"

#include "driver/driver_messages.h"
#include "image/output_file.h"
#include "lsc/apan_exception.h"

#include <unistd.h>

using img::standardStreamDescriptor;

outputStream messageStream;

outputStream::outputStream() : std::ostream(nullptr) {
    rdbuf(&buffer_);
}

void outputStream::openInfoFile(const std::string& name) {
    if (name == "-")
        return;
    // Opened anew, the file standard output or error already writes to would
    // be truncated and its earlier lines overwritten: keep that stream.
    switch (standardStreamDescriptor(name)) {
    case STDOUT_FILENO:
        buffer_.target = stdout;
        return;
    case STDERR_FILENO:
        buffer_.target = stderr;
        return;
    default:
        break;
    }
    std::FILE* file = std::fopen(name.c_str(), "w+");
    if (!file)
        throw apan::exception(240, driver::msg::kInfoFileOpen, driver::msg::kInfoFileOpenHint);
    buffer_.target = file;
}

void outputStream::reset() {
    buffer_.str(std::string());
    if (buffer_.target != stdout && buffer_.target != stderr)
        std::fclose(buffer_.target);
    buffer_.target = stdout;
    buffer_.quiet = false;
    buffer_.failed = false;
    clear();
    flags(std::ios_base::dec | std::ios_base::skipws);
    precision(6);
}

// Writes every complete line that is buffered; a trailing partial line stays
// for the next end of line.
int outputStream::lineBuffer::sync() {
    const std::string text = str();
    const std::size_t end = text.rfind('\n');
    if (end == std::string::npos)
        return 0;
    if (!quiet) {
        const std::size_t length = end + 1;
        if (std::fwrite(text.data(), 1, length, target) != length || std::fflush(target) != 0)
            failed = true;
    }
    str(text.substr(end + 1));
    return 0;
}
