#include "driver/run.h"

#include <csignal>
#include <iostream>

#include "driver/driver_messages.h"
#include "driver/failure_text.h"
#include "driver/output_stream.h"
#include "driver/pipeline.h"
#include "image/output_file.h"

#include <unistd.h>

namespace driver {

using img::removeLiveTemporaries;

namespace {

// An operator's Ctrl-C, a station's kill or a closed terminal ends the run
// at once; the outputs being written are left as they were (their
// temporaries are removed) and the status tells which signal it was.
extern "C" void endOnSignal(int signal) {
    removeLiveTemporaries();
    _exit(128 + signal);
}

void installSignalHandlers() {
    struct sigaction action {};
    action.sa_handler = endOnSignal;
    sigemptyset(&action.sa_mask);
    for (int signal : {SIGINT, SIGTERM, SIGHUP})
        sigaddset(&action.sa_mask, signal);
    for (int signal : {SIGINT, SIGTERM, SIGHUP}) {
        // A signal the caller chose to ignore (nohup) stays ignored.
        struct sigaction previous {};
        if (sigaction(signal, nullptr, &previous) == 0 && previous.sa_handler == SIG_IGN)
            continue;
        sigaction(signal, &action, nullptr);
    }
}

} // namespace

int runProgram(int argc, const char* const argv[]) {
    installSignalHandlers();
    int status = 0;
    try {
        Pipeline pipeline;
        status = pipeline.run(argc, argv);
    } catch (...) {
        const FailureText failure = describeFailure(std::current_exception());
        if (failure.standardError)
            std::cerr << failure.text << std::endl;
        else
            messageStream << failure.text << std::endl;
        status = failure.status;
    }
    // A log that lost lines must not pass for a complete record of the run.
    if (messageStream.writeFailed()) {
        std::cerr << msg::kInfoFileWrite << std::endl;
        if (status == 0)
            status = 1;
    }
    return status;
}

} // namespace driver
