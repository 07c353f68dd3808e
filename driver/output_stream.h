#pragma once
// The process-wide message stream. Progress, warning and error lines are
// collected here and written to the target (standard output or the info file)
// only when the line ends, so a line is written whole or not at all. With the
// quiet switch on, ended lines are dropped.
//
// Any code that writes `<< std::endl` to it through a plain std::ostream& gets
// the same whole-line behaviour: the end of line is the buffer's sync.

#include <cstdio>
#include <ostream>
#include <sstream>
#include <string>

class outputStream : public std::ostream {
public:
    outputStream();
    outputStream(const outputStream&) = delete;
    outputStream& operator=(const outputStream&) = delete;

    void setQuiet(bool quiet) { buffer_.quiet = quiet; }
    bool quiet() const { return buffer_.quiet; }

    // "-", or a name of the file standard output or standard error already
    // writes to (/dev/stdout), keeps that stream. Any other name is created or
    // truncated and becomes the target for the rest of the run. Throws
    // apan::exception 240.
    void openInfoFile(const std::string& name);

    // Points the stream at an already open stdio stream (tests).
    void setTarget(std::FILE* target) { buffer_.target = target; }
    std::FILE* target() const { return buffer_.target; }

    // True once a line could not be written to the target.
    bool writeFailed() const { return buffer_.failed; }

    // Drops a partial line and restores the initial format state, target and
    // switches (tests run several commands in one process).
    void reset();

private:
    struct lineBuffer : std::stringbuf {
        // "ate": text left behind after a sync is appended to, not overwritten.
        lineBuffer() : std::stringbuf(std::ios_base::out | std::ios_base::ate) {}
        int sync() override;
        std::FILE* target = stdout;
        bool quiet = false;
        bool failed = false;
    };
    lineBuffer buffer_;
};

extern outputStream messageStream;
