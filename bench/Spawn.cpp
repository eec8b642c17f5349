#include "Spawn.h"

#include <fcntl.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <utility>

#include "platform/Paths.h"

namespace bench {

namespace {

[[noreturn]] void GiveUp(const std::string& program) {
    std::fprintf(stderr, "%s did not run\n", program.c_str());
    std::exit(1);
}

std::vector<char*> Pointers(std::vector<std::string>* texts) {
    std::vector<char*> pointers;
    for (std::string& text : *texts) {
        pointers.push_back(&text[0]);
    }
    pointers.push_back(nullptr);
    return pointers;
}

// With its standard output as `actions` have it.
pid_t Spawn(const std::string& program, std::vector<std::string>* environment,
            posix_spawn_file_actions_t* actions, std::vector<std::string> arguments = {}) {
    posix_spawn_file_actions_addopen(actions, STDIN_FILENO, "/dev/null", O_RDONLY, 0);
    arguments.insert(arguments.begin(), program);
    pid_t child = -1;
    if (posix_spawn(&child, program.c_str(), actions, nullptr, Pointers(&arguments).data(),
                    Pointers(environment).data()) != 0) {
        GiveUp(program);
    }
    posix_spawn_file_actions_destroy(actions);
    return child;
}

void Await(const std::string& program, pid_t child) {
    int status = -1;
    if (waitpid(child, &status, 0) != child || status != 0) {
        GiveUp(program);
    }
}

}  // namespace

const char kEntry[] = TALO_WEBAPI_DIR "entry.cgi";

void RunProcess(const std::string& program, std::vector<std::string> environment,
                std::vector<std::string> arguments) {
    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_addopen(&actions, STDOUT_FILENO, "/dev/null", O_WRONLY, 0);
    Await(program, Spawn(program, &environment, &actions, std::move(arguments)));
}

std::string ReplyOf(const std::string& program, std::vector<std::string> environment) {
    int ends[2];
    if (pipe2(ends, O_CLOEXEC) != 0) {
        GiveUp(program);
    }
    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_adddup2(&actions, ends[1], STDOUT_FILENO);
    const pid_t child = Spawn(program, &environment, &actions);
    (void)close(ends[1]);
    std::string reply;
    char block[4096];
    for (ssize_t got = 0; (got = read(ends[0], block, sizeof block)) > 0;) {
        reply.append(block, static_cast<size_t>(got));
    }
    (void)close(ends[0]);
    Await(program, child);
    return reply;
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
