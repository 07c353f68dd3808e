#include "driver/run.h"

#include "driver/driver_messages.h"
#include "driver/notice.h"
#include "driver/output_stream.h"
#include "driver/pipeline.h"
#include "lsc/apan_exception.h"

#include <iostream>
#include <new>
#include <string>

namespace {

int report(const char* text) {
    messageStream << msg::kErrorPrefix << text << std::endl;
    return 1;
}

int runCatching(int argc, const char* const argv[]) {
    try {
        Pipeline pipeline;
        return pipeline.run(argc, argv);
    } catch (const notice& text) {
        messageStream << text.what() << std::endl;
        return 0;
    } catch (const apan::exception& error) {
        messageStream << "ERROR(" << error.code() << "): " << error.what() << std::endl;
        messageStream << error.hint() << std::endl;
        return error.code();
    } catch (const std::bad_alloc&) {
        std::cerr << msg::kNoMemory << std::endl;
        return 1;
    } catch (const std::string& text) {
        return report(text.c_str());
    } catch (const char* text) {
        return report(text);
    } catch (const std::exception& error) {
        return report(error.what());
    } catch (...) {
        return report(msg::kUnknownError);
    }
}

} // namespace

int runProgram(int argc, const char* const argv[]) {
    int status = runCatching(argc, argv);
    // A log that lost lines must not pass for a complete record of the run.
    if (messageStream.writeFailed()) {
        std::cerr << msg::kInfoFileWrite << std::endl;
        if (status == 0)
            status = 1;
    }
    return status;
}
