#include "programs/webapi_server/Worker.h"

#include <gtest/gtest.h>
#include <signal.h>
#include <sys/socket.h>
#include <unistd.h>

#include <string>

#include "programs/common/ErrorReply.h"
#include "programs/webapi_server/Message.h"
#include "tests/programs/webapi_server/Netstring.h"
#include "tests/programs/webapi_server/WorkerLife.h"

using support::Body;
using support::kPatience;
using support::ReadAll;
using support::WorkerLife;

namespace {

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
