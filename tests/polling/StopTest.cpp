#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include "tests/polling/PollingFixture.h"
#include "tests/support/Child.h"

using polling::Parse;
using TALO::APIRequest;
using TALO::APIResponse;

namespace {

class StopTask : public polling::Fixture {
  protected:
    void Fails(const std::string& id, int code, const std::vector<std::string>& messages) {
        const size_t before = log.Lines().size();
        polling.SetError(500);
        EXPECT_FALSE(polling.Stop(id, true)) << id;
        EXPECT_EQ(polling.GetError(), code) << id;
        std::vector<std::string> all = Messages();
        EXPECT_EQ(std::vector<std::string>(all.begin() + static_cast<long>(before), all.end()),
                  messages)
            << id;
        for (const std::string& message : messages) {
            EXPECT_TRUE(Logged(message));
        }
    }

    // A process that waits for a signal.
    static pid_t Sleeper() {
        const pid_t child = fork();
        if (child == 0) {
            for (;;) {
                (void)pause();
            }
        }
        return child;
    }
};

TEST_F(StopTask, WithoutARequestFailsWith502) {
    polling.SetRequest(nullptr);
    Fails("ann/1", 502, {"unknown request"});
}

TEST_F(StopTask, OfAMalformedIdFailsWith502) {
    Fails("ann", 502, {"Invalid task id[ann]"});
    Fails("", 502, {"Invalid task id[]"});
}

TEST_F(StopTask, OfAnotherUsersTaskFailsWith503WhoeverAsks) {
    fake::PutTask("bob", "1", Json::Value(Json::objectValue));
    Fails("bob/1", 503, {"Invalid task id"});
    LogIn("root", true);
    Fails("bob/1", 503, {"Invalid task id"});
    EXPECT_EQ(fake::TaskRecord("bob", "1")["finished"], false);
}

TEST_F(StopTask, OfTheAdministratorsTaskFailsWith503ForOthers) {
    fake::PutTask("@administrators", "1", Json::Value(Json::objectValue));
    Fails("@administrators/1", 503, {"Permission denied"});
    EXPECT_EQ(fake::TaskRecord("@administrators", "1")["finished"], false);
    LogIn("root", true);
    EXPECT_TRUE(polling.Stop("@administrators/1", false));
    EXPECT_EQ(fake::TaskRecord("@administrators", "1")["finished"], true);
}

TEST_F(StopTask, OfATaskThatThereIsNotFailsWith508) {
    Fails("ann/1", 508, {"task id[ann/1] does not exist"});
    Fails("@users/", 508, {"task id[@users/] does not exist"});
    EXPECT_TRUE(fake::TaskIds("ann").empty());
}

TEST_F(StopTask, WithoutAHandleFailsWith504) {
    fake::PutTask("ann", "1", Json::Value(Json::objectValue));
    fake::Now().FailCall("Task.Task", 1);
    Fails("ann/1", 504, {"cannot get task by task id[ann/1]"});
}

TEST_F(StopTask, ThatCannotBeMarkedFinishedFailsWith501) {
    fake::PutTask("ann", "1", Json::Value(Json::objectValue));
    fake::Now().FailCall("Task.finish", 1);
    Fails("ann/1", 501, {"set task id[ann/1] to finish fail"});
    EXPECT_EQ(fake::TaskRecord("ann", "1")["finished"], false);
}

// The first process of the machine belongs to nobody who gives up all rights.
TEST_F(StopTask, WhoseProcessCannotBeSignalledFailsWith506) {
    fake::PutTask("ann", "1", Json::Value(Json::objectValue), 1);
    fake::Tasks().answersDeadPids = true;
    const support::ChildResult result = support::InChild([this] {
        if (geteuid() == 0 && setresuid(65534, 65534, 65534) != 0) {
            return 1;
        }
        if (kill(1, 0) == 0) {
            return 2;
        }
        Fails("ann/1", 506,
              {"Failed to kill 1, reason=Operation not permitted(1)",
               "send SIGTERM to task id[ann/1] fail"});
        return 0;
    });
    EXPECT_EQ(result.status, 0) << result.output;
    EXPECT_EQ(fake::TaskRecord("ann", "1")["finished"], false);
}

TEST_F(StopTask, SendsSigtermAndMarksTheTaskFinished) {
    for (const bool remove : {true, false}) {
        const pid_t child = Sleeper();
        fake::PutTask("ann", "1", Json::Value(Json::objectValue), child);
        EXPECT_TRUE(polling.Stop("ann/1", remove));
        int status = 0;
        EXPECT_EQ(waitpid(child, &status, 0), child);
        EXPECT_TRUE(WIFSIGNALED(status) && WTERMSIG(status) == SIGTERM);
        EXPECT_EQ(fake::TaskRecord("ann", "1")["finished"], true);
        EXPECT_EQ(LastDetail("Task.finish"), remove ? "true" : "false");
    }
    EXPECT_EQ(polling.GetError(), 500);
    EXPECT_TRUE(log.Lines().empty());
}

TEST_F(StopTask, SignalsBeforeItMarksFinished) {
    const pid_t child = Sleeper();
    fake::PutTask("ann", "1", Json::Value(Json::objectValue), child);
    fake::Now().FailCall("Task.finish", 1);
    EXPECT_FALSE(polling.Stop("ann/1", true));
    int status = 0;
    EXPECT_EQ(waitpid(child, &status, 0), child);
    EXPECT_TRUE(WIFSIGNALED(status));
}

TEST_F(StopTask, WithoutAProcessOnlyMarksFinished) {
    fake::PutTask("@users", "1", Json::Value(Json::objectValue));
    EXPECT_TRUE(polling.Stop("@users/1", false));
    EXPECT_EQ(fake::TaskRecord("@users", "1")["finished"], true);
    EXPECT_TRUE(log.Lines().empty());
}

TEST_F(StopTask, WhoseProcessGoesAtThatMomentSucceeds) {
    const pid_t child = fork();
    if (child == 0) {
        _exit(0);
    }
    (void)waitpid(child, nullptr, 0);
    fake::Tasks().answersDeadPids = true;
    fake::PutTask("ann", "1", Json::Value(Json::objectValue), child);
    EXPECT_TRUE(polling.Stop("ann/1", true));
    EXPECT_EQ(fake::TaskRecord("ann", "1")["finished"], true);
    EXPECT_TRUE(log.Lines().empty());
}

TEST_F(StopTask, MayBeAskedOfAFinishedTask) {
    const std::string id = RunTask();
    EXPECT_TRUE(polling.Stop(id, false));
    EXPECT_EQ(Record(id)["finished"], true);
    EXPECT_EQ(Reported(id), Parse(R"({"n": 1})"));
}

TEST_F(StopTask, EndsARunningOne) {
    ASSERT_TRUE(Start([](APIRequest*, APIResponse* taskResponse) {
        taskResponse->SetSuccess("running");
        for (;;) {
            (void)pause();
        }
    }));
    const std::string id = StartedId();
    EXPECT_TRUE(polling.Stop(id, false));
    const std::vector<int> statuses = AwaitChildren();
    ASSERT_EQ(statuses.size(), 1u);
    EXPECT_TRUE(WIFSIGNALED(statuses[0]) && WTERMSIG(statuses[0]) == SIGTERM);
    Json::Value status;
    EXPECT_TRUE(polling.Status(id, status));
    EXPECT_EQ(status["finish"], true);
    EXPECT_EQ(status["data"], "running");
}

}  // namespace
