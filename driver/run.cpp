#include "driver/run.h"

#include "driver/driver_messages.h"
#include "driver/failure_text.h"
#include "driver/output_stream.h"
#include "driver/pipeline.h"

#include <iostream>

int runProgram(int argc, const char* const argv[]) {
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
