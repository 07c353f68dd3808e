#include "driver/pipeline.h"

#include "driver/output_stream.h"

#include <boost/date_time/posix_time/posix_time.hpp>

#include <iostream>

Pipeline::Pipeline()
    : startTime_(boost::posix_time::microsec_clock::local_time()), timer_(startStageTimer()) {}

int Pipeline::run(int argc, const char* const argv[]) {
    commandLine_ = CommandLine::parse(argc, argv, std::cout, std::cerr);
    messageStream << "Completed." << std::endl;
    return 0;
}
