#include <fcntl.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <string>
#include <vector>

#include "Groups.h"
#include "Harness.h"
#include "platform/Paths.h"

namespace bench {

namespace {

const char kEntry[] = TALO_WEBAPI_DIR "entry.cgi";

// A process from its birth to its end, its output thrown away.
void RunProcess(const std::string& program, std::vector<std::string> environment) {
    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_addopen(&actions, STDIN_FILENO, "/dev/null", O_RDONLY, 0);
    posix_spawn_file_actions_addopen(&actions, STDOUT_FILENO, "/dev/null", O_WRONLY, 0);
    std::string name = program;
    char* arguments[] = {&name[0], nullptr};
    std::vector<char*> variables;
    for (std::string& variable : environment) {
        variables.push_back(&variable[0]);
    }
    variables.push_back(nullptr);
    pid_t child = -1;
    int status = -1;
    if (posix_spawn(&child, program.c_str(), &actions, nullptr, arguments, variables.data()) != 0 ||
        waitpid(child, &status, 0) != child || status != 0) {
        std::fprintf(stderr, "%s did not run\n", program.c_str());
        std::exit(1);
    }
    posix_spawn_file_actions_destroy(&actions);
}

std::vector<std::string> Ping() {
    return {"REQUEST_METHOD=GET", "QUERY_STRING=api=TALO.System&version=1&method=ping&text=hi",
            "SERVER_PROTOCOL=HTTP/1.1", "REMOTE_ADDR=127.0.0.1", "HTTP_HOST=127.0.0.1"};
}

}  // namespace

void ProcessStart() {
    Compare("A whole process",
            {{"bare C++ program with the JSON library", [] { RunProcess(BARE_PROGRAM, {}); }},
             {"entry.cgi answering ping", [] { RunProcess(kEntry, Ping()); }}},
            201, 5);
}

}  // namespace bench
