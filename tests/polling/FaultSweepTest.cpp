#include <signal.h>
#include <sys/wait.h>

#include "tests/polling/PollingFixture.h"
#include "tests/support/Child.h"

using polling::Parse;
using TALO::APIRequest;
using TALO::APIResponse;

namespace {

// Every operation on the task manager fails once, in the parent and in the child.
class PollingFaults : public polling::Fixture {
  protected:
    void Plan(int failing) {
        (void)AwaitChildren();
        fake::ResetTasks();
        fake::Tasks().failOperation = failing;
        fake::Tasks().waitsPassAtOnce = true;
        polling.SetError(500);
        response.SetError(999, Json::Value());
    }

    bool StartFailing(int failing) {
        Plan(failing);
        return Start([](APIRequest*, APIResponse* taskResponse) {
            taskResponse->SetSuccess(Parse(R"({"n": 1})"));
        });
    }
};

TEST_F(PollingFaults, LeaveWholeRecordsAndAProperAnswerOfStart) {
    ASSERT_TRUE(StartFailing(0));
    (void)AwaitChildren();
    const int steps = static_cast<int>(fake::TaskCalls().size());
    ASSERT_GT(steps, 15);
    int refused = 0;
    int unfinished = 0;
    for (int failing = 1; failing <= steps; ++failing) {
        const bool started = StartFailing(failing);
        const std::vector<int> children = AwaitChildren();
        EXPECT_EQ(children, started ? std::vector<int>{0} : std::vector<int>()) << failing;
        if (!started) {
            ++refused;
            EXPECT_TRUE(response.GetError() == 117 || response.GetError() == 999) << failing;
        } else {
            EXPECT_EQ(response.GetError(), 0) << failing;
            EXPECT_FALSE(Record(StartedId()).isNull()) << failing;
            unfinished += Record(StartedId())["finished"].asBool() ? 0 : 1;
        }
        for (const std::string& id : fake::TaskIds("ann")) {
            const Json::Value properties = fake::TaskRecord("ann", id)["properties"];
            EXPECT_EQ(properties.isMember("info"), started) << failing;
            EXPECT_EQ(properties.isMember("body"), properties.isMember("task_run")) << failing;
            if (properties.isMember("body")) {
                EXPECT_EQ(properties["body"], Parse(R"({"success": true, "data": {"n": 1}})"));
            }
        }
    }
    // No id, no handle, two properties and the end of the batch; and the finish.
    EXPECT_EQ(refused, 5);
    EXPECT_EQ(unfinished, 1);
}

// Killed at any step, the parent, the child or both leave records that are whole,
// and a child without its parent goes on to its end.
TEST_F(PollingFaults, LeaveWholeRecordsWhenAProcessIsKilled) {
    ASSERT_TRUE(StartFailing(0));
    (void)AwaitChildren();
    const int steps = static_cast<int>(fake::TaskCalls().size());
    int killed = 0;
    for (int step = 1; step <= steps; ++step) {
        Plan(0);
        fake::Tasks().killOperation = step;
        const support::ChildResult result = support::InChild([this] {
            const bool started = Start([](APIRequest*, APIResponse* taskResponse) {
                taskResponse->SetSuccess(Parse(R"({"n": 1})"));
            });
            (void)AwaitChildren();
            return started ? 0 : 1;
        });
        fake::Tasks().killOperation = 0;
        EXPECT_TRUE(result.status == 0 || result.status == 1000 + SIGKILL) << step;
        killed += result.status == 0 ? 0 : 1;
        for (const std::string& id : fake::TaskIds("ann")) {
            const Json::Value properties = fake::TaskRecord("ann", id)["properties"];
            EXPECT_EQ(properties.isMember("info"), properties.isMember("auto_remove")) << step;
            EXPECT_EQ(properties.isMember("body"), properties.isMember("task_run")) << step;
            Json::Value status;
            EXPECT_TRUE(polling.Status("ann/" + id, status)) << step;
            EXPECT_TRUE(polling.Stop("ann/" + id, true)) << step;
        }
    }
    EXPECT_GT(killed, 6);
    EXPECT_LT(killed, steps);
}

TEST_F(PollingFaults, LeaveTheOutputOfStatusAndProgressAlone) {
    for (int failing = 1; failing <= 6; ++failing) {
        Plan(failing);
        fake::PutTask("ann", "1", Parse(R"({"body": {"success": true}})"));
        Json::Value out("before");
        const bool status = polling.Status("ann/1", out);
        EXPECT_EQ(status, out.isObject()) << failing;
        EXPECT_EQ(polling.GetError(), status ? 500 : failing == 1 ? 508 : 504) << failing;
        Plan(failing);
        fake::PutTask("ann", "1", Parse(R"({"progress": {"percent": 1}})"));
        out = "before";
        const bool progress = polling.Progress("ann/1", out);
        EXPECT_EQ(progress, out.isObject()) << failing;
        EXPECT_EQ(progress, status) << failing;
    }
}

TEST_F(PollingFaults, AreToldByStop) {
    const int codes[] = {508, 504, 500, 501, 500};
    for (int failing = 1; failing <= 5; ++failing) {
        Plan(failing);
        fake::PutTask("ann", "1", Json::Value(Json::objectValue));
        const int code = codes[failing - 1];
        EXPECT_EQ(polling.Stop("ann/1", true), code == 500) << failing;
        EXPECT_EQ(polling.GetError(), code) << failing;
        EXPECT_EQ(fake::TaskRecord("ann", "1")["finished"].asBool(), code == 500) << failing;
    }
}

}  // namespace
