#include "programs/webapi_server/Worker.h"

#include <gtest/gtest.h>
#include <poll.h>
#include <sys/mman.h>
#include <sys/resource.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <sys/wait.h>
#include <unistd.h>

#include <new>
#include <string>

#include "programs/common/ErrorReply.h"
#include "programs/webapi_server/Message.h"
#include "tests/programs/webapi_server/Netstring.h"
#include "tests/support/Json.h"
#include "tests/support/TempFolder.h"

namespace {

constexpr int kPatience = 20000;  // milliseconds

const char kLives[] = R"({"Test.Lives": {"lib": "MODULE", "minVersion": 1, "maxVersion": 1,
    "authLevel": 0, "isolation": "worker", "deadline": 7, "methods": {"1": ["echo", "variable",
    "leave", "child", "crash", "input", {"raw": {"allowDownload": true}}]}}})";
const char kEnds[] = R"({"Test.Ends": {"lib": "MODULE", "minVersion": 1, "maxVersion": 1,
    "authLevel": 0, "methods": {"1": ["echo"]}}})";
const char kCompound[] = R"({"TALO.Entry.Request": {"lib": "", "minVersion": 1, "maxVersion": 1,
    "authLevel": 0, "methods": {"1": ["request"]}}})";

std::string WithModule(std::string description) {
    return description.replace(description.find("MODULE"), 6, WORKER_MODULE);
}

std::string ReadAll(int from) {
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
        for (const int descriptor : {control_, listener_, taken_[0], taken_[1]}) {
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
            _exit(RunWorker({ends[1], listener_, taken_[1], {7, 70}, slot_}, settings_));
        }
        (void)close(ends[1]);
        control_ = ends[0];
        ASSERT_TRUE(SaysIdle());
    }

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
        return Exchange(support::HeaderBlock({{"CONTENT_LENGTH", "0"},
                                              {"SCGI", "1"},
                                              {"REQUEST_METHOD", "GET"},
                                              {"REMOTE_ADDR", "192.0.2.1"},
                                              {"QUERY_STRING", query}}));
    }
    std::string Call(const std::string& method, const std::string& more = "") const {
        return Get("api=Test.Lives&version=1&method=" + method + "&" + more);
    }
    std::string Post(const std::string& form) const {
        return Exchange(support::HeaderBlock({{"CONTENT_LENGTH", std::to_string(form.size())},
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

    struct sockaddr_un Address() const {
        struct sockaddr_un address = {};
        address.sun_family = AF_UNIX;
        const std::string path = folder_.Path("socket");
        (void)path.copy(address.sun_path, sizeof address.sun_path - 1);
        return address;
    }

    support::TempFolder folder_;
    Settings settings_;
    Slot* slot_;
    pid_t worker_ = -1;
    int control_ = -1;
    int listener_ = -1;
    int taken_[2] = {-1, -1};
};

Json::Value Body(const std::string& reply) {
    const size_t end = reply.find("\r\n\r\n");
    Json::Value body;
    Json::Reader reader;
    EXPECT_TRUE(end != std::string::npos && reader.parse(reply.substr(end + 4), body)) << reply;
    return body;
}

std::string Text(const ErrorReply& reply) {
    return std::string(reply.text, reply.size);
}

}  // namespace

TEST_F(WorkerLife, ServesOneRequestAfterTheOther) {
    Start();
    for (int number = 0; number < 50; ++number) {
        const Json::Value body = Body(Call("echo", "text=n" + std::to_string(number)));
        EXPECT_EQ("n" + std::to_string(number), body["data"]["text"].asString());
        EXPECT_EQ(worker_, body["data"]["pid"].asInt());
        ASSERT_TRUE(SaysIdle());
    }
    EXPECT_EQ(worker_, slot_->pid);
}

TEST_F(WorkerLife, TakesWhoHasConnectedSinceAndTellsTheMaster) {
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
TEST_F(WorkerLife, TellsOfWhoItTookBeforeItServes) {
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

TEST_F(WorkerLife, LeavesClientsToTheMasterUnlessItMayTakeThem) {
    Listen();
    Start();
    const int client = ConnectToListener("echo");
    EXPECT_TRUE(Body(Call("echo"))["success"].asBool());
    ASSERT_TRUE(SaysIdle());
    EXPECT_TRUE(HasClients());
    EXPECT_EQ(-1, Taken());
    (void)close(client);
}

TEST_F(WorkerLife, TakesNobodyWhenItsRequestWasItsLast) {
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
TEST_F(WorkerLife, LeavesTheListenerToNoChildOfAMethod) {
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

// Where there is no body the end of input is there at once, as of any CGI program.
TEST_F(WorkerLife, GivesNoInputToARequestWithoutABody) {
    Start();
    EXPECT_EQ("", Body(Call("input"))["data"].asString());
    ASSERT_TRUE(SaysIdle());
}

TEST_F(WorkerLife, ServesABodyAndLeavesNoneOfItToTheNextRequest) {
    Start();
    const std::string form = "api=Test.Lives&version=1&method=echo&text=posted";
    EXPECT_EQ("posted", Body(Post(form))["data"]["text"].asString());
    ASSERT_TRUE(SaysIdle());
    EXPECT_EQ("posted",
              Body(Post(form + "&x=" + std::string(100000, 'x')))["data"]["text"].asString());
    ASSERT_TRUE(SaysIdle());
    EXPECT_EQ("", Body(Call("echo"))["data"]["text"].asString());
}

// A web server that sends all of a body before it looks for a reply would lose this one.
TEST_F(WorkerLife, TakesTheRestOfABodyThatItHasRefused) {
    Start();
    const std::string block(size_t{1} << 20, 'x');
    constexpr int kBlocks = 17;
    const std::string head =
        support::HeaderBlock({{"CONTENT_LENGTH", std::to_string(kBlocks * block.size())},
                              {"SCGI", "1"},
                              {"REQUEST_METHOD", "POST"},
                              {"CONTENT_TYPE", "application/x-www-form-urlencoded"}});
    const int connection = Connect();
    ASSERT_EQ(static_cast<ssize_t>(head.size()), write(connection, head.data(), head.size()));
    EXPECT_EQ(101, Body(ReadAll(connection))["error"]["code"].asInt());
    for (int sent = 0; sent < kBlocks; ++sent) {
        ASSERT_EQ(static_cast<ssize_t>(block.size()),
                  send(connection, block.data(), block.size(), MSG_NOSIGNAL))
            << sent << " MiB sent";
    }
    (void)close(connection);
    ASSERT_TRUE(SaysIdle());
    EXPECT_EQ("hi", Body(Call("echo", "text=hi"))["data"]["text"].asString());
}

// A web server that closes a client's side behind the reply would cut off who still sends.
TEST_F(WorkerLife, EndsItsReplyBehindABodyThatStillComes) {
    Start();
    const int connection = Connect();
    const std::string head = support::HeaderBlock({{"CONTENT_LENGTH", "20000000"},
                                                   {"SCGI", "1"},
                                                   {"REQUEST_METHOD", "POST"},
                                                   {"CONTENT_TYPE", "text/plain"}});
    ASSERT_EQ(static_cast<ssize_t>(head.size()), write(connection, head.data(), head.size()));
    std::string reply;
    for (int sent = 0; sent < 100; ++sent) {
        ASSERT_EQ(1, send(connection, "x", 1, MSG_NOSIGNAL));
        (void)usleep(5000);
        char block[4096];
        const ssize_t got = recv(connection, block, sizeof block, MSG_DONTWAIT);
        ASSERT_NE(0, got) << sent;
        reply.append(block, got > 0 ? static_cast<size_t>(got) : 0);
    }
    EXPECT_EQ(101, Body(reply + ReadAll(connection))["error"]["code"].asInt());
    (void)close(connection);
    EXPECT_TRUE(SaysIdle());
}

TEST_F(WorkerLife, EndsAfterARequestToAnAPIThatPromisesNothing) {
    Start();
    EXPECT_TRUE(Body(Get("api=Test.Ends&version=1&method=echo&text=x"))["success"].asBool());
    EXPECT_EQ(0, Ended());
}

TEST_F(WorkerLife, EndsWhenOneElementOfACompoundPromisesNothing) {
    Start();
    const std::string lives = R"({"api":"Test.Lives","version":1,"method":"echo"})";
    const std::string ends = R"({"api":"Test.Ends","version":1,"method":"echo"})";
    const std::string call = "api=TALO.Entry.Request&version=1&method=request&compound=";
    EXPECT_FALSE(Body(Post(call + "[" + lives + "," + lives + "]"))["data"]["has_fail"].asBool());
    ASSERT_TRUE(SaysIdle());
    EXPECT_FALSE(Body(Post(call + "[" + lives + "," + ends + "]"))["data"]["has_fail"].asBool());
    EXPECT_EQ(0, Ended());
}

TEST_F(WorkerLife, GoesOnAfterACallThatOpensNoLibrary) {
    Start();
    EXPECT_EQ(102, Body(Get("api=Test.Nobody&version=1&method=x"))["error"]["code"].asInt());
    ASSERT_TRUE(SaysIdle());
    EXPECT_EQ(101, Body(Get(""))["error"]["code"].asInt());
    EXPECT_TRUE(SaysIdle());
}

TEST_F(WorkerLife, EndsWhenAMethodBreaksItsPromise) {
    for (const char* what : {"folder", "descriptor", "mask"}) {
        SCOPED_TRACE(what);
        Start();
        EXPECT_TRUE(Body(Call("leave", std::string("what=") + what))["success"].asBool());
        EXPECT_EQ(0, Ended());
        (void)close(control_);
        control_ = -1;
    }
}

TEST_F(WorkerLife, TakesItsEnvironmentFromTheRequestAlone) {
    Start();
    (void)Call("leave", "what=variable");
    ASSERT_TRUE(SaysIdle());
    EXPECT_TRUE(Body(Call("variable", "name=LEFT_BEHIND"))["data"].empty());
    ASSERT_TRUE(SaysIdle());
    EXPECT_EQ("192.0.2.1", Body(Call("variable", "name=REMOTE_ADDR"))["data"].asString());
    ASSERT_TRUE(SaysIdle());
    EXPECT_TRUE(Body(Call("variable", "name=CONTENT_TYPE"))["data"].empty());
}

TEST_F(WorkerLife, EndsAtItsNumberOfRequests) {
    settings_.workerRequests = 3;
    Start();
    (void)Call("echo");
    ASSERT_TRUE(SaysIdle());
    (void)Call("echo");
    ASSERT_TRUE(SaysIdle());
    EXPECT_TRUE(Body(Call("echo"))["success"].asBool());
    EXPECT_EQ(0, Ended());
}

TEST_F(WorkerLife, EndsWhenItHasGrown) {
    settings_.workerGrowthKiB = 16 * 1024;
    Start();
    int calls = 0;
    do {
        (void)Call("leave", "what=memory");
        ++calls;
    } while (calls < 40 && SaysIdle());
    EXPECT_GT(calls, 2);
    EXPECT_LT(calls, 6);
}

// A sanitizer keeps what was freed.
TEST_F(WorkerLife, GoesOnWhenWhatItHasGrownByIsFree) {
#if defined(__SANITIZE_ADDRESS__)
    constexpr bool isFreed = false;
#else
    constexpr bool isFreed = true;
#endif
    settings_.workerGrowthKiB = 16 * 1024;
    Start();
    EXPECT_TRUE(Body(Call("leave", "what=holes"))["success"].asBool());
    EXPECT_EQ(SaysIdle(), isFreed);
}

TEST_F(WorkerLife, EndsAtItsAge) {
    settings_.workerSeconds = 0;
    Start();
    EXPECT_TRUE(Body(Call("echo"))["success"].asBool());
    EXPECT_EQ(0, Ended());
}

TEST_F(WorkerLife, LeavesWhenItIsToldToAndWhenTheMasterIsGone) {
    Start();
    const char order = kLeave;
    ASSERT_TRUE(SendMessage(control_, &order, 1, -1, 0));
    EXPECT_EQ(0, Ended());
    (void)close(control_);
    Start();
    (void)shutdown(control_, SHUT_RDWR);
    EXPECT_EQ(0, Ended());
}

TEST_F(WorkerLife, AnswersWhatIsNoRequestAndGoesOn) {
    Start();
    EXPECT_EQ(Text(ReplyFor(ReplyStatus::kBadRequest)), Exchange("GET / HTTP/1.1\r\n\r\n"));
    ASSERT_TRUE(SaysIdle());
    EXPECT_EQ(Text(ReplyFor(ReplyStatus::kBadRequest)), Exchange("70000:"));
    ASSERT_TRUE(SaysIdle());
    (void)close(Connect());
    ASSERT_TRUE(SaysIdle());
    EXPECT_TRUE(Body(Call("echo"))["success"].asBool());
}

TEST_F(WorkerLife, AnswersWhenAMethodCrashes) {
    Start();
    EXPECT_EQ(Text(ReplyFor(ReplyStatus::kCrashed)), Call("crash"));
    EXPECT_EQ(1000 + SIGABRT, Ended());
    EXPECT_EQ(1, slot_->answerBegun);
}

TEST_F(WorkerLife, SendsWhatAMethodWritesItself) {
    Start();
    EXPECT_EQ("Content-Type: text/plain\r\n\r\nraw", Call("raw"));
    ASSERT_TRUE(SaysIdle());
    EXPECT_EQ(1, slot_->transfers);
    EXPECT_TRUE(Body(Call("echo"))["success"].asBool());
}

TEST_F(WorkerLife, ShowsWhatItRuns) {
    Start();
    (void)Call("echo");
    ASSERT_TRUE(SaysIdle());
    EXPECT_STREQ("Test.Lives", slot_->api);
    EXPECT_EQ(0, slot_->began);
    EXPECT_EQ(0, slot_->transfers);
    EXPECT_EQ(1, slot_->answerBegun);
    EXPECT_GE(slot_->allowedMs, 7000);
    EXPECT_LT(slot_->allowedMs, 7000 + kPatience);
}

TEST_F(WorkerLife, AllowsAnAPIWithoutADeadlineWhatTheServerAllows) {
    settings_.deadlineSeconds = 60;
    Start();
    (void)Get("api=Test.Ends&version=1&method=echo");
    (void)Ended();
    EXPECT_GE(slot_->allowedMs, 60000);
    EXPECT_LT(slot_->allowedMs, 60000 + kPatience);
}

TEST_F(WorkerLife, LeavesNoConnectionToAChildOfAMethod) {
    Start();
    const int child = Body(Call("child"))["data"].asInt();
    ASSERT_GT(child, 0);
    ASSERT_TRUE(SaysIdle());
    const char order = kLeave;
    ASSERT_TRUE(SendMessage(control_, &order, 1, -1, 0));
    EXPECT_EQ(0, Ended());
    EXPECT_EQ(0, kill(child, SIGKILL));
}
