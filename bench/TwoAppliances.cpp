#include "TwoAppliances.h"

#include <fcntl.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <sstream>

#include "platform/Paths.h"

extern char** environ;

namespace bench {

namespace {

constexpr int kLines = 3;

struct Pipe {
    int read = -1;
    int write = -1;
    Pipe() {
        int ends[2];
        if (pipe2(ends, O_CLOEXEC) == 0) {
            read = ends[0];
            write = ends[1];
        }
    }
};

// The private root's folder: what stands before the first folder of a path in it.
std::string Root() {
    const std::string path = TALO_HOST_CONF;
    return path.substr(0, path.rfind("/etc/talo/"));
}

std::string ReadLines(int from, int count) {
    std::string text;
    char byte = '\0';
    while (count > 0 && read(from, &byte, 1) == 1) {
        text += byte;
        count -= byte == '\n' ? 1 : 0;
    }
    return text;
}

}  // namespace

TwoAppliances::TwoAppliances() {
    const Pipe input;
    const Pipe output;
    std::string script = TWO_APPLIANCES;
    std::string root = Root();
    char* arguments[] = {&script[0], &root[0], nullptr};
    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_adddup2(&actions, input.read, STDIN_FILENO);
    posix_spawn_file_actions_adddup2(&actions, output.write, STDOUT_FILENO);
    if (posix_spawn(&script_, script.c_str(), &actions, nullptr, arguments, environ) != 0) {
        script_ = -1;
    }
    posix_spawn_file_actions_destroy(&actions);
    (void)close(input.read);
    (void)close(output.write);
    input_ = input.write;
    Read(ReadLines(output.read, kLines));
    (void)close(output.read);
}

TwoAppliances::~TwoAppliances() {
    (void)close(input_);
    int status = 0;
    (void)waitpid(script_, &status, 0);
}

void TwoAppliances::Read(const std::string& said) {
    std::istringstream words(said);
    std::string name;
    words >> name >> authority_;
    words >> name >> first_.url >> first_.session;
    words >> name >> second_.url >> second_.session;
}

}  // namespace bench
