#include "programs/webapi_server/Worker.h"

#include <gtest/gtest.h>
#include <poll.h>
#include <signal.h>
#include <sys/socket.h>
#include <sys/syscall.h>
#include <sys/un.h>
#include <unistd.h>

#include <filesystem>
#include <set>
#include <string>
#include <thread>

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
    }

    void StartTaking() {
        Listen();
        Start();
        slot_->mayTake = 1;
    }

    // A client there.
    int ConnectToListener() const {
        const int client = socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
        const struct sockaddr_un address = Address();
        EXPECT_EQ(
            0, connect(client, reinterpret_cast<const struct sockaddr*>(&address), sizeof address));
        return client;
    }
    static void Send(int client, const std::string& bytes) {
        EXPECT_EQ(static_cast<ssize_t>(bytes.size()), write(client, bytes.data(), bytes.size()));
    }
    static std::string BlockOf(const std::string& method) {
        return support::HeaderBlock(
            {{"CONTENT_LENGTH", "0"},
             {"SCGI", "1"},
             {"QUERY_STRING", "api=Test.Lives&version=1&method=" + method}});
    }
    // One which has sent a call already.
    int Ask(const std::string& method) const {
        const int client = ConnectToListener();
        Send(client, BlockOf(method));
        return client;
    }
    bool HasClients() const {
        struct pollfd input = {listener_, POLLIN, 0};
        return poll(&input, 1, 0) == 1;
    }

    // Whether the slot comes to show something.
    template <typename Condition>
    static bool Shows(Condition condition) {
        for (int waited = 0; waited < support::kPatience; ++waited) {
            if (condition()) {
                return true;
            }
            (void)usleep(1000);
        }
        return false;
    }
    bool Waits() const {
        return Shows([this] { return slot_->IsWaiting(); });
    }
    bool IsSilent() const {
        struct pollfd input = {control_, POLLIN, 0};
        return poll(&input, 1, 0) == 0;
    }
    void Order(ControlMessage order) const {
        const char message = order;
        EXPECT_TRUE(SendMessage(control_, &message, sizeof message, -1, 0));
    }

    // A worker that waits for clients.
    void StartWaiting() {
        StartTaking();
        EXPECT_TRUE(Body(Call("echo"))["success"].asBool());
        ASSERT_TRUE(Waits());
    }
    void Serves(const std::string& text) const {
        const int client = Ask("echo&text=" + text);
        EXPECT_EQ(text, Body(ReadAll(client))["data"]["text"].asString());
        (void)close(client);
    }

    void OutlivesTheWorker(int connection, int client) {
        ASSERT_GE(connection, 0);
        EXPECT_EQ(0, kill(worker_, SIGKILL));
        EXPECT_EQ(1000 + SIGKILL, Ended());
        EXPECT_EQ(5, write(connection, "still", 5));
        (void)close(connection);
        EXPECT_EQ("still", ReadAll(client));
        (void)close(client);
    }

    // A duplicate of the connection that the worker shows, as the master gets it.
    int Fetched() const {
        const int process = static_cast<int>(syscall(SYS_pidfd_open, worker_, 0));
        const int number = slot_->connection;
        const int connection = static_cast<int>(syscall(SYS_pidfd_getfd, process, number, 0));
        (void)close(process);
        return connection;
    }

    // What a process has open.
    static std::set<std::string> Opened(pid_t process) {
        std::set<std::string> targets;
        const auto folder = "/proc/" + std::to_string(process) + "/fd";
        for (const auto& entry : std::filesystem::directory_iterator(folder)) {
            targets.insert(std::filesystem::read_symlink(entry.path()).string());
        }
        return targets;
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

TEST_F(WorkerTake, TakesWhoHasConnectedSinceAndCountsThem) {
    StartTaking();
    const int first = Ask("echo&text=first");
    const int second = Ask("echo&text=second");
    EXPECT_EQ("led", Body(Call("echo", "text=led"))["data"]["text"].asString());
    EXPECT_EQ("first", Body(ReadAll(first))["data"]["text"].asString());
    EXPECT_EQ("second", Body(ReadAll(second))["data"]["text"].asString());
    EXPECT_FALSE(HasClients());
    ASSERT_TRUE(Waits());
    EXPECT_GT(slot_->takenAt, 0);
    EXPECT_EQ(5U, slot_->turns) << "done three times, two taken";
    EXPECT_TRUE(IsSilent());
    (void)close(first);
    (void)close(second);
}

TEST_F(WorkerTake, ShowsTheConnectionThatItTook) {
    StartTaking();
    const int client = ConnectToListener();
    EXPECT_TRUE(Body(Call("echo"))["success"].asBool());
    Send(client, BlockOf("wait").substr(0, 9));
    ASSERT_TRUE(Shows([this] { return slot_->connection > STDERR_FILENO; }));
    OutlivesTheWorker(Fetched(), client);
}

TEST_F(WorkerTake, ShowsTheConnectionWhereItLiesWhileAMethodRuns) {
    StartTaking();
    const int client = Ask("wait");
    EXPECT_TRUE(Body(Call("echo"))["success"].asBool());
    ASSERT_TRUE(Shows([this] { return slot_->connection == STDOUT_FILENO; }));
    OutlivesTheWorker(Fetched(), client);
}

TEST_F(WorkerTake, AnswersWhoSendsNoRequestAndTakesTheRestOfIt) {
    StartTaking();
    const int client = ConnectToListener();
    EXPECT_TRUE(Body(Call("echo"))["success"].asBool());
    const std::string bytes = "GET / HTTP/1.0\r\n" + std::string(1 << 20, 'x');
    std::thread sender([&] { Send(client, bytes); });
    EXPECT_NE(std::string::npos, ReadAll(client).find("Status: 400"));
    sender.join();
    (void)close(client);
    EXPECT_TRUE(Waits());
}

TEST_F(WorkerTake, AnswersACrashOfWhatItTookByItself) {
    StartTaking();
    const int client = Ask("crash");
    EXPECT_TRUE(Body(Call("echo"))["success"].asBool());
    EXPECT_LT(1000, Ended());
    EXPECT_EQ(117, Body(ReadAll(client))["error"]["code"].asInt());
    (void)close(client);
}

TEST_F(WorkerTake, WaitsForTheNextByItself) {
    StartWaiting();
    Serves("later");
    ASSERT_TRUE(Waits());
    EXPECT_EQ(3U, slot_->turns);
    Serves("still later");
    EXPECT_TRUE(IsSilent());
}

TEST_F(WorkerTake, ComesWhenCalled) {
    StartWaiting();
    slot_->mayTake = 0;
    Order(kCome);
    ASSERT_TRUE(SaysIdle());
    const int client = Ask("echo");
    EXPECT_EQ("led", Body(Call("echo", "text=led"))["data"]["text"].asString());
    ASSERT_TRUE(SaysIdle());
    EXPECT_TRUE(HasClients());
    (void)close(client);
}

TEST_F(WorkerTake, StaysWhenItMayAgainBeforeItCame) {
    StartWaiting();
    Order(kCome);
    Serves("one");
    EXPECT_TRUE(IsSilent());
}

TEST_F(WorkerTake, ComesOnceForACallThatCameTooLate) {
    StartWaiting();
    slot_->mayTake = 0;
    Order(kCome);
    ASSERT_TRUE(SaysIdle());
    Order(kCome);
    EXPECT_EQ("led", Body(Call("echo", "text=led"))["data"]["text"].asString());
    ASSERT_TRUE(SaysIdle());
    EXPECT_TRUE(IsSilent());
}

TEST_F(WorkerTake, TakesWhomItWasWokenForThoughItMayNotAnyMore) {
    StartWaiting();
    ASSERT_EQ(0, kill(worker_, SIGSTOP));
    ASSERT_EQ(worker_, waitpid(worker_, nullptr, WUNTRACED));
    slot_->mayTake = 0;
    const int client = Ask("echo&text=woken");
    ASSERT_EQ(0, kill(worker_, SIGCONT));
    EXPECT_EQ("woken", Body(ReadAll(client))["data"]["text"].asString());
    ASSERT_TRUE(SaysIdle());
    (void)close(client);
}

TEST_F(WorkerTake, LeavesWhenToldWhileItWaits) {
    StartWaiting();
    Order(kLeave);
    EXPECT_EQ(0, Ended());
}

TEST_F(WorkerTake, LeavesWithTheMasterWhileItWaits) {
    StartWaiting();
    (void)shutdown(control_, SHUT_RDWR);
    EXPECT_EQ(0, Ended());
}

TEST_F(WorkerTake, LeavesClientsToTheMasterUnlessItMayTakeThem) {
    Listen();
    Start();
    const int client = Ask("echo");
    EXPECT_TRUE(Body(Call("echo"))["success"].asBool());
    ASSERT_TRUE(SaysIdle());
    EXPECT_TRUE(HasClients());
    (void)close(client);
}

TEST_F(WorkerTake, TakesNobodyWhenItsRequestWasItsLast) {
    StartTaking();
    const int client = Ask("echo");
    EXPECT_TRUE(Body(Get("api=Test.Ends&version=1&method=echo"))["success"].asBool());
    EXPECT_EQ(0, Ended());
    EXPECT_TRUE(HasClients());
    (void)close(client);
}

// The socket is closed for clients when nobody accepts any more.
TEST_F(WorkerTake, LeavesNoneOfItsSocketsToAChildOfAMethod) {
    Listen();
    Start();
    const std::set<std::string> own = Opened(worker_);
    const int child = Body(Call("child"))["data"].asInt();
    ASSERT_GT(child, 0);
    ASSERT_TRUE(SaysIdle());
    const std::set<std::string> ofChild = Opened(child);
    EXPECT_EQ(1U, own.count("anon_inode:[eventpoll]"));
    for (const std::string& target : own) {
        const bool isSocket = target.rfind("socket:", 0) == 0 || target.rfind("anon_", 0) == 0;
        EXPECT_FALSE(isSocket && ofChild.count(target) != 0) << target;
    }
    EXPECT_EQ(0, kill(child, SIGKILL));
}
