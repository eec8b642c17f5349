#include <sys/socket.h>
#include <sys/time.h>
#include <sys/un.h>
#include <unistd.h>

#include <atomic>
#include <cstdio>
#include <cstdlib>
#include <string>
#include <thread>
#include <vector>

#include "tests/programs/webapi_server/Netstring.h"

// soak-client SOCKET COUNT CLIENTS FIRST: so many requests over SCGI, each with a number
// from FIRST on that its reply has to tell. Ends at the first one that is not right.

namespace {

constexpr int kPatience = 30;  // seconds
constexpr int kMostClients = 64;

struct Task {
    const char* socket;
    long end;
    std::atomic<long> next;
    std::atomic<bool> failed;
};

int Connect(const char* path) {
    const int connection = socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
    const struct timeval patience = {kPatience, 0};
    (void)setsockopt(connection, SOL_SOCKET, SO_RCVTIMEO, &patience, sizeof patience);
    struct sockaddr_un address = {};
    address.sun_family = AF_UNIX;
    (void)std::snprintf(address.sun_path, sizeof address.sun_path, "%s", path);
    const auto* any = reinterpret_cast<const struct sockaddr*>(&address);
    if (connect(connection, any, sizeof address) == 0) {
        return connection;
    }
    std::perror(path);
    (void)close(connection);
    return -1;
}

std::string Exchange(const char* path, const std::string& request) {
    const int connection = Connect(path);
    std::string reply;
    if (connection < 0) {
        return reply;
    }
    if (send(connection, request.data(), request.size(), MSG_NOSIGNAL) ==
        static_cast<ssize_t>(request.size())) {
        char block[4096];
        for (ssize_t size = 0; (size = recv(connection, block, sizeof block, 0)) > 0;) {
            reply.append(block, static_cast<size_t>(size));
        }
    }
    (void)close(connection);
    return reply;
}

std::string Request(const std::string& nonce) {
    return support::HeaderBlock(
        {{"CONTENT_LENGTH", "0"},
         {"SCGI", "1"},
         {"REQUEST_METHOD", "GET"},
         {"REMOTE_ADDR", "192.0.2.1"},
         {"QUERY_STRING", "api=TALO.System&version=1&method=ping&text=" + nonce}});
}

void Run(Task* task) {
    for (long number = 0; !task->failed && (number = task->next++) < task->end;) {
        const std::string nonce = "n" + std::to_string(number) + "n";
        const std::string reply = Exchange(task->socket, Request(nonce));
        const std::string right =
            "\r\n\r\n{\"data\":{\"text\":\"" + nonce + "\"},\"success\":true}";
        if (reply.size() < right.size() ||
            reply.compare(reply.size() - right.size(), right.size(), right) != 0) {
            (void)std::fprintf(stderr, "request %s was answered: %s\n", nonce.c_str(),
                               reply.c_str());
            task->failed = true;
        }
    }
}

}  // namespace

int main(int argc, char** argv) {
    if (argc != 5) {
        return 2;
    }
    const long first = std::strtol(argv[4], nullptr, 10);
    Task task = {argv[1], first + std::strtol(argv[2], nullptr, 10), {first}, {false}};
    const long count = std::strtol(argv[3], nullptr, 10);
    std::vector<std::thread> clients;
    for (long client = 0; client < count && client < kMostClients; ++client) {
        clients.emplace_back(Run, &task);
    }
    for (std::thread& client : clients) {
        client.join();
    }
    return task.failed ? 1 : 0;
}
