#include <fcntl.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/resource.h>
#include <unistd.h>

#include <fstream>

#include "platform/HTTPFileOutputer.h"
#include "tests/host/download/Exchange.h"
#include "tests/support/TempFolder.h"

namespace {

using exchange::Get;
using exchange::Output;
using exchange::Pattern;
using exchange::Reply;
using exchange::Server;

constexpr size_t kLarge = 8u << 20;

// What happens to a file and to its reader while it is on its way.
class OutputFate : public ::testing::Test {
  protected:
    std::function<int()> Sending() const {
        return [this] { return exchange::Told(HTTPFileOutputer().Output(path_.c_str(), "x/y")); };
    }

    support::TempFolder folder_;
    std::string content_ = Pattern(kLarge);
    std::string path_ = folder_.Write("a", content_);
};

TEST_F(OutputFate, OfAFileThatShrinksIsToEndWithoutAByteThatItNeverHad) {
    for (const Output kind : {Output::Pipe, Output::Socket, Output::NonBlockingPipe}) {
        for (const off_t left : {off_t(0), off_t(100), off_t(5000), off_t(3000001)}) {
            (void)folder_.Write("a", content_);
            Server server(Get(), kind, Sending());
            (void)server.Read(1000);
            ASSERT_EQ(truncate(path_.c_str(), left), 0);
            const Reply reply = server.Finish();
            EXPECT_EQ(reply.status, exchange::kNotSent) << left;
            EXPECT_EQ(reply.Line("Content-Length"), std::to_string(kLarge));
            const std::string body = reply.Body();
            EXPECT_LT(body.size(), kLarge) << left;
            EXPECT_TRUE(body == content_.substr(0, body.size())) << left;
        }
    }
}

TEST_F(OutputFate, OfAFileThatGrowsIsExactlyTheAnnouncedLength) {
    Server server(Get(), Output::Pipe, Sending());
    (void)server.Read(1000);
    std::ofstream(path_, std::ios::binary | std::ios::app) << Pattern(kLarge);
    const Reply reply = server.Finish();
    EXPECT_EQ(reply.status, exchange::kSent);
    EXPECT_TRUE(reply.Body() == content_);
}

TEST_F(OutputFate, OfAFileThatIsRemovedIsToArriveWhole) {
    Server server(Get(), Output::Pipe, Sending());
    (void)server.Read(1000);
    ASSERT_EQ(unlink(path_.c_str()), 0);
    const Reply reply = server.Finish();
    EXPECT_EQ(reply.status, exchange::kSent);
    EXPECT_TRUE(reply.Body() == content_);
}

// SIGPIPE is at its default here: it would end the process with 1013.
TEST_F(OutputFate, WhenTheClientGoesIsAFailureAndNoSignal) {
    for (const Output kind : {Output::Pipe, Output::Socket, Output::NonBlockingPipe}) {
        for (const size_t readBefore : {0u, 1000u, 3000000u}) {
            Server server(Get(), kind, Sending());
            (void)server.Read(readBefore);
            server.GoAway();
            EXPECT_EQ(server.Finish().status, exchange::kNotSent) << readBefore;
        }
    }
}

TEST_F(OutputFate, LeavesSignalsAndDescriptorAsTheyWere) {
    Server server(Get(), Output::NonBlockingPipe, [this] {
        const int flags = fcntl(STDOUT_FILENO, F_GETFL);
        EXPECT_LT(HTTPFileOutputer().Output(path_.c_str(), "x/y"), 0);
        sigset_t pending;
        sigset_t blocked;
        EXPECT_EQ(sigpending(&pending), 0);
        EXPECT_EQ(pthread_sigmask(SIG_SETMASK, nullptr, &blocked), 0);
        EXPECT_EQ(sigismember(&pending, SIGPIPE), 0);
        EXPECT_EQ(sigismember(&blocked, SIGPIPE), 0);
        EXPECT_EQ(fcntl(STDOUT_FILENO, F_GETFL), flags);
        return 0;
    });
    server.GoAway();
    EXPECT_EQ(server.Finish().status, 0);
}

TEST_F(OutputFate, LeavesASignalToItsOwner) {
    Server server(Get(), Output::Pipe, [this] {
        sigset_t pipe;
        EXPECT_EQ(sigemptyset(&pipe) | sigaddset(&pipe, SIGPIPE), 0);
        EXPECT_EQ(pthread_sigmask(SIG_BLOCK, &pipe, nullptr), 0);
        EXPECT_EQ(raise(SIGPIPE), 0);
        EXPECT_EQ(HTTPFileOutputer().Output(path_.c_str(), "x/y"), 0);
        sigset_t pending;
        EXPECT_EQ(sigpending(&pending), 0);
        EXPECT_EQ(sigismember(&pending, SIGPIPE), 1);
        EXPECT_EQ(signal(SIGPIPE, SIG_IGN), SIG_DFL);
        return 0;
    });
    EXPECT_EQ(server.Finish().status, 0);
}

TEST_F(OutputFate, OfAReaderThatComesLateIsToGetAll) {
    Server server(Get(), Output::NonBlockingPipe, Sending());
    for (int pause = 0; pause < 10; ++pause) {
        usleep(2000);
        (void)server.Read(1);
    }
    const Reply reply = server.Finish();
    EXPECT_EQ(reply.status, exchange::kSent);
    EXPECT_TRUE(reply.Body() == content_);
}

TEST_F(OutputFate, OfALargeFileNeedsLittleMemory) {
    ASSERT_EQ(truncate(path_.c_str(), 256 << 20), 0);
    Server server(Get(), Output::Pipe, [this] {
        struct rusage before = {};
        struct rusage after = {};
        EXPECT_EQ(getrusage(RUSAGE_SELF, &before), 0);
        EXPECT_EQ(HTTPFileOutputer().Output(path_.c_str(), "x/y"), 0);
        EXPECT_EQ(getrusage(RUSAGE_SELF, &after), 0);
        EXPECT_LT(after.ru_maxrss - before.ru_maxrss, 4096);  // KiB
        return 0;
    });
    for (size_t left = 256 << 20; left > 0;) {
        const size_t got = server.Read(1).size();
        ASSERT_GT(got, 0u);
        left -= std::min(left, got);
    }
    EXPECT_EQ(server.Finish().status, 0);
}

}  // namespace
