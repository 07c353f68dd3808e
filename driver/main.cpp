#include "driver/run.h"

int main(int argc, char* argv[]) {
    return driver::runProgram(argc, argv);
}
