#ifndef TESTS_RUNNER_SYSTEMPROBE_H
#define TESTS_RUNNER_SYSTEMPROBE_H

#include <string>
#include <vector>

// What the code under test asks of the C library and the kernel, seen from
// outside, and refusals of both on demand.
namespace probe {

struct Identity {
    const char* pointer;  // as it was handed over: the C library keeps it
    std::string text;     // what stood there at the call
    int options;
    int facility;
    bool closedBefore;  // closelog had been called since the call before
};

// Calls of openlog, oldest first, and of setpriority (its value only).
std::vector<Identity>& LogIdentities();
std::vector<int>& Priorities();

// The name that the kernel shows for this process, and its argument vector.
std::string TaskName();
std::string CommandLine();

// The argument vector of this very process, as main got it.
int ArgumentCount();
char** Arguments();

// From now on the kernel answers `error` to the system call in this process and
// its children (only with that first argument in the second form). No way back:
// use it in a child.
void RefuseSystemCall(int number, int error);
void RefuseSystemCall(int number, int firstArgument, int error);

// Makes the Nth allocation from now with std::nothrow fail; 0 for none.
void FailNothrowAllocation(int nth);

}  // namespace probe

#endif
