#include "src/runner/APIRunnerPrivate.h"

#include <errno.h>
#include <string.h>

#include <cstdio>
#include <fstream>

namespace TALO {

namespace {

// The base name of the program as it was started, before anybody renamed it.
// Reading ends at a blank: arguments that were joined into one are left out.
std::string StartName() {
    std::ifstream commandLine("/proc/self/cmdline");
    if (!commandLine) {
        return program_invocation_short_name;
    }
    std::string text;
    std::getline(commandLine, text, ' ');
    return basename(text.c_str());
}

}  // namespace

APIRunnerPrivate::APIRunnerPrivate(APIRunner* runner) : runner(runner), origProcName(StartName()) {
    procName = origProcName;
}

void APIRunnerPrivate::SetArgs(int argc, char** argv) {
    if (argc <= 0) {
        return;
    }
    if (origProcName.find("_entry.cgi") != std::string::npos) {
        procName = "entry.cgi";
    }
    argv0 = argv[0];
    argv0Len = static_cast<unsigned>(strlen(argv0));
    memset(argv0, 0, argv0Len);
}

void APIRunnerPrivate::SetArgv0(const std::string& name) {
    if (argv0 == nullptr) {
        return;
    }
    memset(argv0, 0, argv0Len);
    (void)snprintf(argv0, argv0Len, "%s", name.c_str());
}

}  // namespace TALO
