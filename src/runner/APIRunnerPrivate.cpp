#include "src/runner/APIRunnerPrivate.h"

#include <errno.h>
#include <fcntl.h>
#include <string.h>
#include <unistd.h>

#include <cstdio>

namespace TALO {

namespace {

// What the last runner left in the argument vector: the start name, cut by one
// character where it had no more room. A process with many requests, one runner
// each, would else forget a piece of its name, and of its room, with each.
struct Left {
    char* argument;
    unsigned room;
    char shown[256];
    char startName[256];
};
Left left = {};

bool ShowsWhatWasLeft(const char* text) {
    return left.shown[0] != '\0' && strcmp(text, left.shown) == 0;
}

// Whether the system would tell of nothing else: what it shows is what the first
// argument holds.
bool ShowsStartName() {
    return left.argument != nullptr && left.argument == program_invocation_name &&
           ShowsWhatWasLeft(left.argument);
}

// The base name of the program as the system shows it. Reading ends at a blank:
// arguments that were joined into one are left out. False when it cannot be read.
bool ReadStartName(std::string* name) {
    const int commandLine = open("/proc/self/cmdline", O_RDONLY | O_CLOEXEC);
    if (commandLine < 0) {
        return false;
    }
    constexpr char kEnds[] = {' ', '\0'};
    std::string text;
    char block[256];
    size_t end = std::string::npos;
    for (ssize_t got = 0;
         end == std::string::npos && (got = read(commandLine, block, sizeof block)) > 0;) {
        text.append(block, static_cast<size_t>(got));
        end = text.find_first_of(kEnds, 0, sizeof kEnds);
    }
    (void)close(commandLine);
    *name = basename(text.substr(0, end).c_str());
    return true;
}

// What was read when the first argument held this text. It is what the system shows.
struct Read {
    const char* argument;
    char text[256];
    std::string startName;
};

// The base name of the program as it was started, before anybody renamed it.
std::string StartName() {
    if (ShowsStartName()) {
        return left.startName;
    }
    static Read last = {};
    const char* const argument = program_invocation_name;
    if (last.argument == nullptr || argument != last.argument ||
        strcmp(last.argument, last.text) != 0) {
        last.argument = nullptr;
        if (!ReadStartName(&last.startName)) {
            return program_invocation_short_name;
        }
        if (strlen(argument) < sizeof last.text) {
            (void)snprintf(last.text, sizeof last.text, "%s", argument);
            last.argument = argument;
        }
    }
    return last.startName;
}

}  // namespace

APIRunnerPrivate::APIRunnerPrivate(APIRunner* runner) : runner(runner), origProcName(StartName()) {
    if (ShowsWhatWasLeft(origProcName.c_str())) {
        origProcName = left.startName;
    }
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
    argv0Len = argv0 == left.argument && ShowsWhatWasLeft(argv0)
                   ? left.room
                   : static_cast<unsigned>(strlen(argv0));
    memset(argv0, 0, argv0Len);
}

void APIRunnerPrivate::SetArgv0(const std::string& name) {
    if (argv0 == nullptr) {
        return;
    }
    memset(argv0, 0, argv0Len);
    (void)snprintf(argv0, argv0Len, "%s", name.c_str());
}

void APIRunnerPrivate::LeaveArgv0() {
    if (argv0 == nullptr || argv0Len > sizeof left.shown ||
        origProcName.size() >= sizeof left.startName) {
        return;
    }
    left.argument = argv0;
    left.room = argv0Len;
    (void)snprintf(left.shown, sizeof left.shown, "%s", argv0);
    (void)snprintf(left.startName, sizeof left.startName, "%s", origProcName.c_str());
}

}  // namespace TALO
