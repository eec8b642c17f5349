#include "tests/host/download/Exchange.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <stdlib.h>
#include <sys/socket.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>

#include "platform/HTTPFileOutputer.h"

namespace exchange {

namespace {

struct Ends {
    int reading;
    int writing;
};

Ends Open(Output kind) {
    int ends[2] = {-1, -1};
    int error = 0;
    if (kind == Output::Socket) {
        error = socketpair(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0, ends);
    } else if (kind == Output::File) {
        char name[] = "/tmp/webapi-test-XXXXXX";
        ends[1] = mkostemp(name, O_CLOEXEC);
        ends[0] = open(name, O_RDONLY | O_CLOEXEC);
        error = unlink(name);
    } else {
        error = pipe2(ends, O_CLOEXEC);
    }
    if (error != 0 || ends[0] < 0 || ends[1] < 0) {
        abort();
    }
    if (kind == Output::NonBlockingPipe) {
        (void)fcntl(ends[1], F_SETFL, fcntl(ends[1], F_GETFL) | O_NONBLOCK);
    }
    return {ends[0], ends[1]};
}

const char* const kHeaders[] = {
    "REQUEST_METHOD",
    "HTTP_RANGE",
    "HTTP_IF_RANGE",
    "HTTP_IF_MATCH",
    "HTTP_IF_NONE_MATCH",
    "HTTP_IF_MODIFIED_SINCE",
    "HTTP_IF_UNMODIFIED_SINCE",
    "MOD_X_SENDFILE_ENABLED",
    "MOD_X_ACCEL_PREFIX",
    "MOD_X_SENDFILE_PLAIN",
};

[[noreturn]] void Serve(const Environment& environment, int output,
                        const std::function<int()>& body) {
    (void)dup2(output, STDOUT_FILENO);
    (void)signal(SIGPIPE, SIG_DFL);
    for (const char* name : kHeaders) {
        (void)unsetenv(name);
    }
    for (const auto& variable : environment) {
        (void)setenv(variable.first.c_str(), variable.second.c_str(), 1);
    }
    const int status = body();
    (void)fflush(stdout);
    _exit(::testing::Test::HasFailure() ? 99 : status);
}

}  // namespace

int Told(int result) {
    return result == 0 ? kSent : result < 0 ? kNotSent : 98;
}

std::string Reply::Header() const {
    const size_t end = raw.find("\r\n\r\n");
    return end == std::string::npos ? "(no blank line)" : raw.substr(0, end + 2);
}

std::string Reply::Body() const {
    const size_t end = raw.find("\r\n\r\n");
    return end == std::string::npos ? "(no blank line)" : raw.substr(end + 4);
}

std::string Reply::Line(const std::string& name) const {
    const std::string header = "\r\n" + Header();
    const std::string wanted = "\r\n" + name + ": ";
    const size_t found = header.find(wanted);
    if (found == std::string::npos) {
        return "(none)";
    }
    if (header.find(wanted, found + 1) != std::string::npos) {
        return "(twice)";
    }
    const size_t start = found + wanted.size();
    return header.substr(start, header.find("\r\n", start) - start);
}

Server::Server(const Environment& environment, Output kind, const std::function<int()>& body) {
    (void)fflush(stdout);
    const Ends ends = Open(kind);
    process_ = fork();
    if (process_ == 0) {
        (void)close(ends.reading);
        Serve(environment, ends.writing, body);
    }
    (void)close(ends.writing);
    reading_ = ends.reading;
    if (kind == Output::File) {
        siginfo_t ignored;
        (void)waitid(P_PID, static_cast<id_t>(process_), &ignored, WEXITED | WNOWAIT);
    }
}

Server::~Server() {
    GoAway();
    (void)Wait();
}

std::string Server::Read(size_t atLeast) {
    std::string content;
    char block[65536];
    while (content.size() < atLeast) {
        const ssize_t got = read(reading_, block, sizeof block);
        if (got <= 0) {
            break;
        }
        content.append(block, static_cast<size_t>(got));
    }
    read_ += content;
    return content;
}

void Server::GoAway() {
    if (reading_ >= 0) {
        (void)close(reading_);
        reading_ = -1;
    }
}

Reply Server::Finish() {
    if (reading_ >= 0) {
        (void)Read(static_cast<size_t>(-1));
    }
    Reply reply;
    reply.status = Wait();
    reply.raw = read_;
    return reply;
}

int Server::Wait() {
    if (process_ < 0) {
        return -1;
    }
    int status = 0;
    (void)waitpid(process_, &status, 0);
    process_ = -1;
    return WIFEXITED(status) ? WEXITSTATUS(status) : 1000 + WTERMSIG(status);
}

Reply Ask(const Environment& environment, const std::function<int()>& body, Output kind) {
    return Server(environment, kind, body).Finish();
}

Environment Get(const Environment& headers) {
    Environment environment = {{"REQUEST_METHOD", "GET"}};
    environment.insert(environment.end(), headers.begin(), headers.end());
    return environment;
}

Reply AskForPath(const std::string& path, const Environment& environment, const std::string& type,
                 Output kind) {
    return Ask(
        environment, [&] { return Told(HTTPFileOutputer().Output(path.c_str(), type.c_str())); },
        kind);
}

Reply AskForFile(const std::string& path, long position, const Environment& environment,
                 const std::string& name, Output kind) {
    return Ask(
        environment,
        [&] {
            FILE* const file = fopen(path.c_str(), "re");
            EXPECT_EQ(fseek(file, position, SEEK_SET), 0);
            const int result = HTTPFileOutputer().Output(file, name.c_str(), "text/plain");
            // Still the caller's, and open.
            EXPECT_EQ(fclose(file), 0);
            return Told(result);
        },
        kind);
}

std::string Pattern(size_t size) {
    std::string text(size, '\0');
    unsigned state = 12345;
    for (char& byte : text) {
        state = state * 1103515245u + 12345u;
        byte = static_cast<char>(1 + (state >> 16) % 255);
    }
    return text;
}

}  // namespace exchange
