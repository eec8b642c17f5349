#ifndef TALO_SRC_RUNNER_APIRUNNERPRIVATE_H
#define TALO_SRC_RUNNER_APIRUNNERPRIVATE_H

#include <string>

namespace TALO {

class APIRunner;

// The name under which every file of the runner logs.
constexpr char kSource[] = "APIRunner.cpp";

// The names that the process goes by.
class APIRunnerPrivate {
  public:
    explicit APIRunnerPrivate(APIRunner* runner);

    void SetArgs(int argc, char** argv);

    // Shows a name in the argument vector, as much of it as the first argument
    // was long. Nothing before SetArgs.
    void SetArgv0(const std::string& name);

    // Remembers what the argument vector shows and why, for the next runner.
    void LeaveArgv0();

    std::string& GetProcName() {
        return procName;
    }
    std::string& GetOrigProcName() {
        return origProcName;
    }

    APIRunner* runner;
    char* argv0 = nullptr;
    void* unused = nullptr;
    unsigned argv0Len = 0;
    std::string procName;
    std::string origProcName;
};

// Gives the process its start-up name back: log identity, argument vector, task.
void RestoreProcessName(APIRunnerPrivate* d);

}  // namespace TALO

#endif
