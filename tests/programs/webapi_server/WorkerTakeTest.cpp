#include "programs/webapi_server/Worker.h"

#include <gtest/gtest.h>
#include <poll.h>
#include <signal.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

#include <string>

#include "programs/webapi_server/Message.h"
#include "tests/programs/webapi_server/Netstring.h"
#include "tests/programs/webapi_server/WorkerLife.h"

using support::Body;
using support::ReadAll;

namespace {

// A worker that may accept where the master does.
class WorkerTake : public support::WorkerLife {
  protected:
    // Before Start: where clients connect while the worker has a request.
    void Listen() {
        listener_ = socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC | SOCK_NONBLOCK, 0);
        const struct sockaddr_un address = Address();
        ASSERT_EQ(
            0, bind(listener_, reinterpret_cast<const struct sockaddr*>(&address), sizeof address));
        ASSERT_EQ(0, listen(listener_, 8));
        ASSERT_EQ(0, socketpair(AF_UNIX, SOCK_SEQPACKET | SOCK_CLOEXEC, 0, taken_));
    }

    // A client there, which has sent a call already.
    int ConnectToListener(const std::string& method) const {
        const int client = socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
        const struct sockaddr_un address = Address();
        EXPECT_EQ(
            0, connect(client, reinterpret_cast<const struct sockaddr*>(&address), sizeof address));
        const std::string bytes =
            support::HeaderBlock({{"CONTENT_LENGTH", "0"},
                                  {"SCGI", "1"},
                                  {"QUERY_STRING", "api=Test.Lives&version=1&method=" + method}});
        EXPECT_EQ(static_cast<ssize_t>(bytes.size()), write(client, bytes.data(), bytes.size()));
        return client;
    }
    bool HasClients() const {
        struct pollfd input = {listener_, POLLIN, 0};
        return poll(&input, 1, 0) == 1;
    }

    // The master's duplicate of a connection that the worker has taken; -1 when it has
    // told of none.
    int Taken() const {
        TakenReport report = {};
        int connection = -1;
        const ssize_t got =
            ReceiveMessage(taken_[0], &report, sizeof report, &connection, MSG_DONTWAIT);
        EXPECT_TRUE(got != sizeof report || (report.slot == 7 && report.serial == 70));
        return connection;
    }

  private:
    struct sockaddr_un Address() const {
        struct sockaddr_un address = {};
        address.sun_family = AF_UNIX;
        const std::string path = folder_.Path("socket");
        (void)path.copy(address.sun_path, sizeof address.sun_path - 1);
        return address;
    }
};

}  // namespace

TEST_F(WorkerTake, TakesWhoHasConnectedSinceAndTellsTheMaster) {
    Listen();
    Start();
    slot_->mayTake = 1;
    const int first = ConnectToListener("echo&text=first");
    const int second = ConnectToListener("echo&text=second");
    EXPECT_EQ("led", Body(Call("echo", "text=led"))["data"]["text"].asString());
    EXPECT_EQ("first", Body(ReadAll(first))["data"]["text"].asString());
    EXPECT_EQ("second", Body(ReadAll(second))["data"]["text"].asString());
    EXPECT_FALSE(HasClients());
    ASSERT_TRUE(SaysIdle());
    EXPECT_GT(slot_->takenAt, 0);
    for (const int client : {first, second}) {
        const int connection = Taken();
        EXPECT_GE(connection, 0);
        (void)close(connection);
        (void)close(client);
    }
    EXPECT_EQ(-1, Taken());
}

// Whoever ends it meanwhile must not take it for answered.
TEST_F(WorkerTake, TellsOfWhoItTookBeforeItServes) {
    Listen();
    Start();
    slot_->mayTake = 1;
    const int client = ConnectToListener("crash");
    EXPECT_TRUE(Body(Call("echo"))["success"].asBool());
    EXPECT_LT(1000, Ended());
    const int connection = Taken();
    EXPECT_GE(connection, 0);
    (void)close(connection);
    EXPECT_EQ(117, Body(ReadAll(client))["error"]["code"].asInt());
    (void)close(client);
}

TEST_F(WorkerTake, LeavesClientsToTheMasterUnlessItMayTakeThem) {
    Listen();
    Start();
    const int client = ConnectToListener("echo");
    EXPECT_TRUE(Body(Call("echo"))["success"].asBool());
    ASSERT_TRUE(SaysIdle());
    EXPECT_TRUE(HasClients());
    EXPECT_EQ(-1, Taken());
    (void)close(client);
}

TEST_F(WorkerTake, TakesNobodyWhenItsRequestWasItsLast) {
    Listen();
    Start();
    slot_->mayTake = 1;
    const int client = ConnectToListener("echo");
    EXPECT_TRUE(Body(Get("api=Test.Ends&version=1&method=echo"))["success"].asBool());
    EXPECT_EQ(0, Ended());
    EXPECT_TRUE(HasClients());
    (void)close(client);
}

// The socket is closed for clients when nobody accepts any more.
TEST_F(WorkerTake, LeavesTheListenerToNoChildOfAMethod) {
    Listen();
    Start();
    const int child = Body(Call("child"))["data"].asInt();
    ASSERT_GT(child, 0);
    ASSERT_TRUE(SaysIdle());
    const std::string number = std::to_string(listener_);
    char target[64] = {};
    EXPECT_EQ(-1, readlink(("/proc/" + std::to_string(child) + "/fd/" + number).c_str(), target,
                           sizeof target));
    EXPECT_EQ(0, kill(child, SIGKILL));
}
