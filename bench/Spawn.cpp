#include "Spawn.h"

#include <fcntl.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>

#include "platform/Paths.h"

namespace bench {

const char kEntry[] = TALO_WEBAPI_DIR "entry.cgi";

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

std::vector<std::string> Get(const std::string& query) {
    return {"REQUEST_METHOD=GET", "QUERY_STRING=" + query, "SERVER_PROTOCOL=HTTP/1.1",
            "REMOTE_ADDR=127.0.0.1", "HTTP_HOST=127.0.0.1"};
}

std::vector<std::string> Get(const std::string& query, const std::string& sessionId) {
    std::vector<std::string> environment = Get(query);
    environment.push_back("HTTP_COOKIE=id=" + sessionId);
    return environment;
}

}  // namespace bench
