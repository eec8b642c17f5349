#ifndef TESTS_PROGRAMS_WEBAPI_SERVER_WORKERLIFE_H
#define TESTS_PROGRAMS_WEBAPI_SERVER_WORKERLIFE_H

#include <gtest/gtest.h>
#include <poll.h>
#include <sys/mman.h>
#include <sys/resource.h>
#include <sys/socket.h>
#include <sys/wait.h>
#include <unistd.h>

#include <new>
#include <string>

#include "programs/webapi_server/Message.h"
#include "programs/webapi_server/Worker.h"
#include "tests/programs/webapi_server/Netstring.h"
#include "tests/support/Json.h"
#include "tests/support/TempFolder.h"

namespace support {

constexpr int kPatience = 20000;  // milliseconds

inline const char kLives[] = R"({"Test.Lives": {"lib": "MODULE", "minVersion": 1, "maxVersion": 1,
    "authLevel": 0, "isolation": "worker", "deadline": 7, "methods": {"1": ["echo", "variable",
    "leave", "child", "wait", "crash", "input", {"raw": {"allowDownload": true}}]}}})";
inline const char kEnds[] = R"({"Test.Ends": {"lib": "MODULE", "minVersion": 1, "maxVersion": 1,
    "authLevel": 0, "methods": {"1": ["echo"]}}})";
inline const char kCompound[] =
    R"({"TALO.Entry.Request": {"lib": "", "minVersion": 1, "maxVersion": 1,
    "authLevel": 0, "methods": {"1": ["request"]}}})";

inline std::string WithModule(std::string description) {
    return description.replace(description.find("MODULE"), 6, WORKER_MODULE);
}

inline std::string ReadAll(int from) {
    std::string content;
    char block[4096];
    struct pollfd input = {from, POLLIN, 0};
    while (poll(&input, 1, kPatience) == 1) {
        const ssize_t size = read(from, block, sizeof block);
        if (size <= 0) {
            return content;
        }
        content.append(block, static_cast<size_t>(size));
    }
    ADD_FAILURE() << "the worker keeps its connection";
    return content;
}

// A worker in a child process, and the master's part in its life.
class WorkerLife : public testing::Test {
  protected:
    WorkerLife() {
        (void)folder_.Write("Test.Lives.lib", WithModule(kLives));
        (void)folder_.Write("Test.Ends.lib", WithModule(kEnds));
        (void)folder_.Write("TALO.Entry.Request.lib", kCompound);
        void* memory =
            mmap(nullptr, sizeof(Slot), PROT_READ | PROT_WRITE, MAP_SHARED | MAP_ANONYMOUS, -1, 0);
        slot_ = new (memory) Slot();
    }
    ~WorkerLife() override {
        for (const int descriptor : {control_, listener_}) {
            if (descriptor >= 0) {
                (void)close(descriptor);
            }
        }
        if (worker_ > 0) {
            (void)kill(worker_, SIGKILL);
            (void)waitpid(worker_, nullptr, 0);
        }
        (void)munmap(slot_, sizeof(Slot));
    }

    void Start() {
        int ends[2];
        ASSERT_EQ(0, socketpair(AF_UNIX, SOCK_SEQPACKET | SOCK_CLOEXEC, 0, ends));
        worker_ = fork();
        if (worker_ == 0) {
            const struct rlimit none = {0, 0};
            (void)setrlimit(RLIMIT_CORE, &none);
            (void)close(ends[0]);
            (void)!chdir(folder_.Path("").c_str());
            _exit(RunWorker({ends[1], listener_, slot_}, settings_));
        }
        (void)close(ends[1]);
        control_ = ends[0];
        ASSERT_TRUE(SaysIdle());
    }

    // False when the worker has closed its side instead.
    bool SaysIdle() const {
        struct pollfd input = {control_, POLLIN, 0};
        EXPECT_EQ(1, poll(&input, 1, kPatience));
        char message = 0;
        return recv(control_, &message, 1, 0) == 1 && message == kIdle;
    }

    // The web server's end of a connection that the worker got.
    int Connect() const {
        int ends[2];
        EXPECT_EQ(0, socketpair(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0, ends));
        const char order = kServe;
        EXPECT_TRUE(SendMessage(control_, &order, 1, ends[1], 0));
        (void)close(ends[1]);
        return ends[0];
    }

    std::string Exchange(const std::string& bytes) const {
        const int connection = Connect();
        EXPECT_EQ(static_cast<ssize_t>(bytes.size()),
                  write(connection, bytes.data(), bytes.size()));
        std::string reply = ReadAll(connection);
        (void)close(connection);
        return reply;
    }

    std::string Get(const std::string& query) const {
        return Exchange(HeaderBlock({{"CONTENT_LENGTH", "0"},
                                     {"SCGI", "1"},
                                     {"REQUEST_METHOD", "GET"},
                                     {"REMOTE_ADDR", "192.0.2.1"},
                                     {"QUERY_STRING", query}}));
    }
    std::string Call(const std::string& method, const std::string& more = "") const {
        return Get("api=Test.Lives&version=1&method=" + method + "&" + more);
    }
    std::string Post(const std::string& form) const {
        return Exchange(HeaderBlock({{"CONTENT_LENGTH", std::to_string(form.size())},
                                     {"SCGI", "1"},
                                     {"REQUEST_METHOD", "POST"},
                                     {"CONTENT_TYPE", "application/x-www-form-urlencoded"},
                                     {"REMOTE_ADDR", "192.0.2.1"}}) +
                        form);
    }

    // The worker's exit status, or 1000 + the signal that ended it.
    int Ended() {
        EXPECT_FALSE(SaysIdle());
        int status = 0;
        EXPECT_EQ(worker_, waitpid(worker_, &status, 0));
        worker_ = -1;
        return WIFEXITED(status) ? WEXITSTATUS(status) : 1000 + WTERMSIG(status);
    }

    TempFolder folder_;
    Settings settings_;
    Slot* slot_;
    pid_t worker_ = -1;
    int control_ = -1;
    int listener_ = -1;
};

inline Json::Value Body(const std::string& reply) {
    const size_t end = reply.find("\r\n\r\n");
    Json::Value body;
    Json::Reader reader;
    EXPECT_TRUE(end != std::string::npos && reader.parse(reply.substr(end + 4), body)) << reply;
    return body;
}

}  // namespace support

#endif
