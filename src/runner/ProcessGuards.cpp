#include "src/runner/ProcessGuards.h"

#include <sys/resource.h>

#include <iostream>

namespace TALO {

// Buffers of no file: every use of them fails.
StandardStreams::StandardStreams(bool disconnectInput, bool disconnectOutput) {
    if (disconnectInput) {
        input = std::cin.rdbuf(&noInput);
    }
    if (disconnectOutput) {
        output = std::cout.rdbuf(&noOutput);
    }
}

// Putting a buffer back clears the error state that the method's use has left.
StandardStreams::~StandardStreams() {
    if (input != nullptr) {
        std::cin.rdbuf(input);
    }
    if (output != nullptr) {
        std::cout.rdbuf(output);
    }
}

SchedulingPriority::SchedulingPriority(int priority)
    : before(getpriority(PRIO_PROCESS, 0)), changed(priority != before) {
    if (changed) {
        (void)setpriority(PRIO_PROCESS, 0, priority);
    }
}

SchedulingPriority::~SchedulingPriority() {
    if (changed) {
        (void)setpriority(PRIO_PROCESS, 0, before);
    }
}

}  // namespace TALO
