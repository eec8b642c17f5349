#include "tests/support/Child.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>

namespace support {

namespace {

// A file rather than a pipe: any size, and no second process to feed it.
int FileWith(const std::string& content) {
    char name[] = "/tmp/child-input-XXXXXX";
    const int file = mkstemp(name);
    (void)unlink(name);
    if (write(file, content.data(), content.size()) != static_cast<ssize_t>(content.size())) {
        abort();
    }
    (void)lseek(file, 0, SEEK_SET);
    return file;
}

[[noreturn]] void RunChild(const std::function<int()>& body, int input, int output) {
    (void)dup2(input, STDIN_FILENO);
    (void)dup2(output, STDOUT_FILENO);
    (void)close(input);
    (void)close(output);
    const int status = body();
    (void)fflush(stdout);
    _exit(::testing::Test::HasFailure() ? 99 : status);
}

std::string ReadAll(int from) {
    std::string content;
    char block[4096];
    for (ssize_t got = 0; (got = read(from, block, sizeof block)) > 0;) {
        content.append(block, static_cast<size_t>(got));
    }
    return content;
}

}  // namespace

ChildResult InChild(const std::function<int()>& body, const std::string& input) {
    (void)fflush(stdout);
    int ends[2];
    if (pipe2(ends, O_CLOEXEC) != 0) {
        abort();
    }
    const int inputFile = FileWith(input);
    const pid_t child = fork();
    if (child == 0) {
        (void)close(ends[0]);
        RunChild(body, inputFile, ends[1]);
    }
    (void)close(inputFile);
    (void)close(ends[1]);
    ChildResult result;
    result.output = ReadAll(ends[0]);
    (void)close(ends[0]);
    int status = 0;
    (void)waitpid(child, &status, 0);
    result.status = WIFEXITED(status) ? WEXITSTATUS(status) : 1000 + WTERMSIG(status);
    return result;
}

}  // namespace support
