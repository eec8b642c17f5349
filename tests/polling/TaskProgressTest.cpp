#include "webapi/APITaskProgress.h"

#include <pthread.h>
#include <signal.h>
#include <unistd.h>

#include <chrono>
#include <cmath>
#include <limits>
#include <thread>

#include "tests/polling/PollingFixture.h"
#include "tests/support/Child.h"

using polling::Parse;
using TALO::APIRequest;
using TALO::APIResponse;
using TALO::APITaskProgress;

namespace {

typedef std::chrono::steady_clock Clock;

// The request is the task "ann/1" itself.
class TaskProgress : public polling::Fixture {
  protected:
    TaskProgress() {
        request.InitEnv(Parse(R"({"task_id": "1", "task_user": "ann", "full_task_id": "ann/1"})"));
    }

    static Json::Value Written() {
        return fake::TaskRecord("ann", "1")["properties"]["progress"];
    }

    static int Writings() {
        int number = 0;
        for (const fake::TaskCall& call : fake::TaskCalls()) {
            number += call.operation == "Task.endUpdate" ? 1 : 0;
        }
        return number;
    }

    // Whether the record comes to say so while the work is silent.
    static bool Comes(const std::string& member, const Json::Value& value) {
        const auto end = Clock::now() + std::chrono::seconds(20);
        while (Written()[member] != value) {
            if (Clock::now() > end) {
                return false;
            }
            (void)usleep(5000);
        }
        return true;
    }
};

TEST_F(TaskProgress, DoesNothingWithoutATask) {
    const APIRequest ordinary(Parse(R"({"environ": {"task_id": "1"}})"));
    for (APIRequest* without :
         {static_cast<APIRequest*>(nullptr), const_cast<APIRequest*>(&ordinary)}) {
        APITaskProgress progress(without);
        progress.SetPercent(1);
        progress.SetText("text");
        progress.AddLog("line");
    }
    EXPECT_TRUE(fake::TaskCalls().empty());
}

TEST_F(TaskProgress, IsNotWrittenUntilItIsTold) {
    { const APITaskProgress progress(&request); }
    EXPECT_EQ(Writings(), 0);
    EXPECT_TRUE(Written().isNull());
}

TEST_F(TaskProgress, WritesTheFirstThatIsToldAtOnce) {
    APITaskProgress progress(&request);
    const time_t before = time(nullptr);
    progress.SetText("a.mp3");
    Json::Value written = Written();
    EXPECT_GE(written["time"].asInt64(), before);
    EXPECT_LE(written["time"].asInt64(), time(nullptr));
    written.removeMember("time");
    EXPECT_EQ(written, Parse(R"({"percent": null, "text": "a.mp3", "log": [], "log_first": 0})"));
}

TEST_F(TaskProgress, WritesTheLastWhenTheObjectGoes) {
    {
        APITaskProgress progress(&request);
        for (int index = 0; index <= 100; ++index) {
            progress.SetPercent(index);
            progress.SetText(std::to_string(index));
            progress.AddLog("line " + std::to_string(index));
        }
    }
    const Json::Value written = Written();
    EXPECT_EQ(written["percent"], 100.0);
    EXPECT_EQ(written["text"], "100");
    EXPECT_EQ(written["log"].size(), 101u);
    EXPECT_EQ(written["log"][100], "line 100");
}

TEST_F(TaskProgress, WritesTheLastAlsoWhileTheWorkIsSilent) {
    APITaskProgress progress(&request);
    progress.SetPercent(1);
    progress.SetPercent(2);
    progress.SetText("waits");
    EXPECT_TRUE(Comes("text", "waits"));
    EXPECT_EQ(Written()["percent"], 2.0);
    progress.AddLog("again");
    progress.SetPercent(3);
    EXPECT_TRUE(Comes("percent", 3.0));
    EXPECT_EQ(Written()["log"], Parse(R"(["again"])"));
}

TEST_F(TaskProgress, IsWrittenTenTimesASecondAtMost) {
    const auto begin = Clock::now();
    int told = 0;
    {
        APITaskProgress progress(&request);
        while (Clock::now() - begin < std::chrono::milliseconds(550)) {
            progress.SetPercent(++told % 100);
            (void)usleep(200);
        }
    }
    const double seconds = std::chrono::duration<double>(Clock::now() - begin).count();
    EXPECT_GT(told, 20);
    // One at once, ten in every second, one at the end.
    EXPECT_LE(Writings(), 2 + static_cast<int>(seconds * 10));
    EXPECT_GE(Writings(), 2);
}

TEST_F(TaskProgress, IsNotWrittenAgainWithoutNews) {
    APITaskProgress progress(&request);
    progress.SetPercent(1);
    (void)usleep(350 * 1000);
    EXPECT_EQ(Writings(), 1);
}

TEST_F(TaskProgress, MovesAPercentageBetweenItsEnds) {
    const double infinity = std::numeric_limits<double>::infinity();
    const struct {
        double told;
        double kept;
    } rows[] = {{-1, 0},      {-infinity, 0}, {0, 0},         {0.5, 0.5},
                {99.9, 99.9}, {100, 100},     {100.001, 100}, {infinity, 100}};
    for (const auto& row : rows) {
        {
            APITaskProgress progress(&request);
            progress.SetPercent(row.told);
        }
        EXPECT_EQ(Written()["percent"], row.kept) << row.told;
    }
}

TEST_F(TaskProgress, IgnoresAPercentageThatIsNoNumber) {
    APITaskProgress progress(&request);
    progress.SetPercent(std::nan(""));
    EXPECT_EQ(Writings(), 0);
}

TEST_F(TaskProgress, KeepsTheLastLinesOfTheLog) {
    {
        APITaskProgress progress(&request);
        for (int index = 0; index < APITaskProgress::kMaxLogLines + 100; ++index) {
            progress.AddLog(std::to_string(index));
        }
    }
    const Json::Value written = Written();
    EXPECT_EQ(written["log"].size(), 500u);
    EXPECT_EQ(written["log_first"], 100);
    EXPECT_EQ(written["log"][0], "100");
    EXPECT_EQ(written["log"][499], "599");
}

TEST_F(TaskProgress, CutsTextsWhereACharacterBegins) {
    const std::string full(APITaskProgress::kMaxTextBytes, 'a');
    const std::string almost(APITaskProgress::kMaxTextBytes - 1, 'a');
    const struct {
        std::string told;
        std::string kept;
    } rows[] = {
        {full, full},
        {full + "b", full},
        {almost + "\xC3\xA4", almost},
        {almost + "\xE2\x82\xAC and more", almost},
        {full + "\xC3\xA4", full},
        {"", ""},
    };
    for (const auto& row : rows) {
        {
            APITaskProgress progress(&request);
            progress.SetText(row.told);
            progress.AddLog(row.told);
        }
        EXPECT_EQ(Written()["text"], row.kept);
        EXPECT_EQ(Written()["log"][0], row.kept);
    }
}

TEST_F(TaskProgress, TriesAgainWhatCouldNotBeWritten) {
    fake::Now().FailCall("Task.endUpdate", 1);
    APITaskProgress progress(&request);
    progress.SetPercent(7);
    EXPECT_TRUE(Comes("percent", 7.0));
    EXPECT_EQ(Writings(), 2);
}

TEST_F(TaskProgress, TriesAgainAtTheEndWhatCouldNotBeWritten) {
    fake::Now().FailCall("Task.setProperty", 1);
    {
        APITaskProgress progress(&request);
        progress.SetPercent(7);
    }
    EXPECT_EQ(Written()["percent"], 7.0);
}

TEST_F(TaskProgress, BearsATaskThatCannotBeHad) {
    fake::Now().FailCall("Task.Task", 1);
    {
        APITaskProgress progress(&request);
        progress.SetPercent(7);
        progress.AddLog("line");
    }
    EXPECT_TRUE(Written().isNull());
}

TEST_F(TaskProgress, MayBeToldBySeveralThreads) {
    {
        APITaskProgress progress(&request);
        std::vector<std::thread> threads;
        for (int thread = 0; thread < 4; ++thread) {
            threads.emplace_back([&progress] {
                for (int index = 0; index < 100; ++index) {
                    progress.AddLog("line");
                    progress.SetPercent(index);
                }
            });
        }
        for (std::thread& thread : threads) {
            thread.join();
        }
    }
    EXPECT_EQ(Written()["log"].size(), 400u);
    EXPECT_EQ(Written()["percent"], 99.0);
}

TEST_F(TaskProgress, LeavesSignalsToTheWork) {
    static pthread_t work;
    static volatile sig_atomic_t elsewhere;
    static volatile sig_atomic_t arrived;
    const support::ChildResult result = support::InChild([this] {
        work = pthread_self();
        (void)signal(SIGTERM, [](int) {
            arrived = arrived + 1;
            elsewhere = elsewhere + (pthread_equal(pthread_self(), work) != 0 ? 0 : 1);
        });
        APITaskProgress progress(&request);
        progress.SetPercent(1);
        progress.SetPercent(2);
        sigset_t term;
        (void)sigemptyset(&term);
        (void)sigaddset(&term, SIGTERM);
        // Held back here, it would go to any other thread that takes it.
        (void)pthread_sigmask(SIG_BLOCK, &term, nullptr);
        (void)kill(getpid(), SIGTERM);
        EXPECT_TRUE(Comes("percent", 2.0));
        EXPECT_EQ(arrived, 0);
        (void)pthread_sigmask(SIG_UNBLOCK, &term, nullptr);
        EXPECT_EQ(arrived, 1);
        EXPECT_EQ(elsewhere, 0);
        return 0;
    });
    EXPECT_EQ(result.status, 0) << result.output;
}

TEST_F(TaskProgress, StandsBesideTheResultInTheRecord) {
    request.InitEnv(Json::Value());
    APIRequest starter(Parse(R"({"session": {"username": "ann"}})"));
    APIResponse answer(&starter);
    TALO::APIPolling task(&starter);
    ASSERT_TRUE(task.Start(
        &answer,
        [](APIRequest* taskRequest, APIResponse* taskResponse, void*) {
            APITaskProgress progress(taskRequest);
            progress.SetPercent(50);
            taskResponse->SetSuccess("half");
            progress.SetPercent(100);
            progress.AddLog("done");
        },
        nullptr));
    (void)AwaitChildren();
    Json::Value progress;
    const std::string id = answer.GetBody()["data"]["task_id"].asString();
    EXPECT_TRUE(task.Progress(id, progress));
    EXPECT_EQ(progress["percent"], 100.0);
    EXPECT_EQ(progress["log"], Parse(R"(["done"])"));
    EXPECT_EQ(progress["finish"], true);
    EXPECT_EQ(Reported(id), "half");
    Json::Value status;
    EXPECT_TRUE(task.Status(id, status));
    EXPECT_FALSE(status.isMember("progress"));
}

}  // namespace
