#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <set>
#include <string>

#include "platform/System.h"
#include "platform/Task.h"
#include "tests/contract/TaskWorld.h"
#include "tests/support/Child.h"
#include "tests/support/Json.h"

#include <gtest/gtest.h>

namespace {

class TaskContract : public ::testing::Test {
  protected:
    TaskContract() : world(MakeTaskWorld()) {}

    static bool Begin(ORB::Task* task) {
        task->beginUpdate();
        (void)task->setProperty("info", support::Parse("{\"api\":\"a\",\"param\":{}}"));
        (void)task->setProperty("auto_remove", true);
        return task->endUpdate();
    }
    static bool Report(ORB::Task* task) {
        task->beginUpdate();
        (void)task->setProperty("body", support::Parse("{\"success\":true}"));
        (void)task->setProperty("task_run", true);
        return task->endUpdate();
    }
    static std::set<std::string> Ids(const char* user, const char* prefix) {
        std::set<std::string> ids;
        for (const Json::Value& id : ORB::TaskMgr(user).getAllTaskId(prefix)) {
            EXPECT_TRUE(id.isString());
            ids.insert(id.asString());
        }
        return ids;
    }

    const std::unique_ptr<TaskWorld> world;
};

TEST_F(TaskContract, MakesARecordWithItsFirstHandle) {
    EXPECT_FALSE(ORB::TaskUtil::checkTaskExists("anna", "one"));
    const ORB::Task task("anna", "one");
    EXPECT_TRUE(task.isValid());
    EXPECT_STREQ(task.getTaskId(), "one");
    EXPECT_TRUE(ORB::TaskUtil::checkTaskExists("anna", "one"));
    EXPECT_FALSE(ORB::TaskUtil::checkTaskExists("bert", "one"));
    EXPECT_FALSE(task.isFinished());
    EXPECT_EQ(task.getCreatePid(), 0);
}

TEST_F(TaskContract, MakesNoRecordForAQuestion) {
    (void)ORB::TaskUtil::checkTaskExists("anna", "one");
    (void)ORB::TaskUtil::getUniqueID("anna", "one");
    EXPECT_TRUE(Ids("anna", nullptr).empty());
}

TEST_F(TaskContract, HasNoHandleForNobodyOrNothing) {
    EXPECT_FALSE(ORB::Task("", "one").isValid());
    EXPECT_FALSE(ORB::Task("anna", "").isValid());
    EXPECT_FALSE(ORB::Task(nullptr, "one").isValid());
    EXPECT_FALSE(ORB::Task("anna", nullptr).isValid());
    EXPECT_FALSE(ORB::TaskMgr("").isValid());
    EXPECT_FALSE(ORB::TaskUtil::checkTaskExists("", ""));
    ORB::Task task("", "one");
    task.beginUpdate();
    (void)task.setProperty("x", 1);
    EXPECT_FALSE(task.endUpdate());
    EXPECT_FALSE(task.finish(true));
    EXPECT_FALSE(task.reload());
}

TEST_F(TaskContract, NamesTasksByTheirPrefix) {
    std::set<std::string> ids;
    for (const char* prefix : {"", "copy", "a-b_c.9", "copy"}) {
        const std::string id = ORB::TaskUtil::getUniqueID("anna", prefix);
        EXPECT_EQ(id.compare(0, std::string(prefix).size(), prefix), 0) << id;
        EXPECT_TRUE(ORB::Task("anna", id.c_str()).isValid()) << id;
        ids.insert(id);
    }
    EXPECT_EQ(ids.size(), 4u);
    EXPECT_EQ(Ids("anna", nullptr), ids);
    EXPECT_EQ(Ids("anna", "copy").size(), 2u);
    EXPECT_TRUE(Ids("bert", nullptr).empty());
}

TEST_F(TaskContract, NamesNoTaskByAPrefixThatIsNoName) {
    for (const std::string& prefix :
         {std::string("a/b"), std::string("a b"), std::string(65, 'a'), std::string("*")}) {
        EXPECT_EQ(ORB::TaskUtil::getUniqueID("anna", prefix.c_str()), "") << prefix;
    }
    EXPECT_EQ(ORB::TaskUtil::getUniqueID("", "copy"), "");
}

TEST_F(TaskContract, ListsTheOldestFirst) {
    for (const char* id : {"b2", "a1", "b1"}) {
        ASSERT_TRUE(ORB::Task("@users", id).isValid());
    }
    EXPECT_EQ(ORB::TaskMgr("@users").getAllTaskId(nullptr),
              support::Parse("[\"b2\",\"a1\",\"b1\"]"));
    EXPECT_EQ(ORB::TaskMgr("@users").getAllTaskId("b"), support::Parse("[\"b2\",\"b1\"]"));
    EXPECT_EQ(ORB::TaskMgr("@users").getAllTaskId("c"), Json::Value(Json::arrayValue));
    EXPECT_EQ(ORB::TaskMgr("@administrators").getAllTaskId(nullptr), Json::Value(Json::arrayValue));
}

TEST_F(TaskContract, StoresABatchAtItsEnd) {
    ORB::Task task("anna", "one");
    task.beginUpdate();
    EXPECT_TRUE(task.setProperty("a", 1));
    EXPECT_TRUE(task.setProperty("b", "text"));
    EXPECT_FALSE(task.hasProperty("a"));
    EXPECT_FALSE(ORB::Task("anna", "one").hasProperty("a"));
    ASSERT_TRUE(task.endUpdate());
    for (const ORB::Task& other : {ORB::Task("anna", "one")}) {
        EXPECT_EQ(other.getProperty("a"), Json::Value(1));
        EXPECT_EQ(other.getProperty("b"), Json::Value("text"));
    }
    EXPECT_TRUE(task.hasProperty("a"));
    EXPECT_FALSE(task.endUpdate());
}

TEST_F(TaskContract, StoresAWriteOutsideOfABatchAtOnce) {
    ASSERT_TRUE(ORB::Task("anna", "one").setProperty("x", Json::Value()));
    const ORB::Task task("anna", "one");
    EXPECT_TRUE(task.hasProperty("x"));
    EXPECT_TRUE(task.getProperty("x").isNull());
    EXPECT_FALSE(task.hasProperty("y"));
    EXPECT_TRUE(task.getProperty("y").isNull());
}

TEST_F(TaskContract, AnswersTheFallbackForWhatIsNoBool) {
    ORB::Task task("anna", "one");
    ASSERT_TRUE(task.setProperty("yes", true) && task.setProperty("text", "true"));
    EXPECT_TRUE(task.getBoolProperty("yes", false));
    EXPECT_FALSE(task.getBoolProperty("text", false));
    EXPECT_TRUE(task.getBoolProperty("none", true));
}

TEST_F(TaskContract, ShowsWhatOthersWroteAfterReload) {
    ORB::Task task("anna", "one");
    ASSERT_TRUE(ORB::Task("anna", "one").setProperty("x", 1));
    EXPECT_FALSE(task.hasProperty("x"));
    ASSERT_TRUE(task.reload());
    EXPECT_TRUE(task.hasProperty("x"));
}

TEST_F(TaskContract, MasksSecretParametersInInfo) {
    ORB::Task task("anna", "one");
    task.setSecretParams(support::Parse("[\"key\",7]"));
    const Json::Value info =
        support::Parse("{\"api\":\"a\",\"param\":{\"_sid\":1,\"passwd\":2,\"key\":3,\"x\":4}}");
    ASSERT_TRUE(task.setProperty("info", info) && task.setProperty("other", info));
    const Json::Value masked = support::Parse(
        "{\"api\":\"a\",\"param\":{\"_sid\":\"*****\",\"passwd\":\"*****\",\"key\":\"*****\","
        "\"x\":4}}");
    EXPECT_EQ(task.getProperty("info"), masked);
    EXPECT_EQ(ORB::Task("anna", "one").getProperty("info"), masked);
    EXPECT_EQ(task.getProperty("other"), info);
}

TEST_F(TaskContract, KnowsTheProcessAsLongAsItLives) {
    ORB::Task task("anna", "one");
    ASSERT_TRUE(task.setCreatePid(getpid()));
    EXPECT_EQ(task.getCreatePid(), getpid());
    const pid_t child = fork();
    if (child == 0) {
        (void)pause();
        _exit(0);
    }
    ASSERT_TRUE(task.setCreatePid(child));
    EXPECT_EQ(ORB::Task("anna", "one").getCreatePid(), child);
    ASSERT_EQ(kill(child, SIGKILL), 0);
    siginfo_t ended = {};
    ASSERT_EQ(waitid(P_PID, static_cast<id_t>(child), &ended, WEXITED | WNOWAIT), 0);
    EXPECT_EQ(task.getCreatePid(), 0);
    EXPECT_EQ(waitpid(child, nullptr, 0), child);
    EXPECT_EQ(ORB::Task("anna", "one").getCreatePid(), 0);
}

TEST_F(TaskContract, KnowsNoProcessThatIsNone) {
    ORB::Task task("anna", "one");
    EXPECT_FALSE(task.setCreatePid(0));
    EXPECT_FALSE(task.setCreatePid(-1));
    EXPECT_FALSE(task.setCreatePid(0x7fffffff));
    EXPECT_EQ(task.getCreatePid(), 0);
}

TEST_F(TaskContract, FinishesAndLetsTheLastOneCount) {
    ORB::Task task("anna", "one");
    ASSERT_TRUE(Begin(&task));
    ORB::Task stop("anna", "one");
    EXPECT_FALSE(stop.isFinished());
    ASSERT_TRUE(stop.finish(false));
    EXPECT_TRUE(stop.isFinished());
    ASSERT_TRUE(task.reload());
    EXPECT_TRUE(task.isFinished());
    EXPECT_FALSE(task.getBoolProperty("auto_remove", true));
    EXPECT_TRUE(task.finish(true));
    EXPECT_EQ(ORB::Task("anna", "one").getProperty("auto_remove"), Json::Value(true));
}

TEST_F(TaskContract, RaisesNoRecordThatIsGone) {
    ORB::Task left("anna", "one");
    ASSERT_TRUE(left.setProperty("x", 1));
    ASSERT_TRUE(ORB::Task("anna", "one").remove());
    EXPECT_FALSE(ORB::TaskUtil::checkTaskExists("anna", "one"));
    EXPECT_FALSE(left.setProperty("x", 2));
    EXPECT_FALSE(Report(&left));
    EXPECT_FALSE(left.setCreatePid(getpid()));
    EXPECT_FALSE(left.finish(true));
    EXPECT_FALSE(left.waitForDataReady("y", 60));
    EXPECT_FALSE(left.reload());
    EXPECT_FALSE(left.hasProperty("x"));
    EXPECT_TRUE(left.remove());
    EXPECT_FALSE(ORB::TaskUtil::checkTaskExists("anna", "one"));
}

TEST_F(TaskContract, WritesNothingIntoASuccessorOfTheSameId) {
    ORB::Task left("anna", "one");
    ASSERT_TRUE(ORB::Task("anna", "one").remove());
    const ORB::Task successor("anna", "one");
    EXPECT_FALSE(left.setProperty("x", 1));
    EXPECT_FALSE(left.finish(true));
    EXPECT_FALSE(ORB::Task("anna", "one").hasProperty("x"));
    EXPECT_FALSE(ORB::Task("anna", "one").isFinished());
}

TEST_F(TaskContract, WaitsForAPropertyAndReadsTheRecord) {
    ORB::Task task("anna", "one");
    EXPECT_FALSE(task.waitForDataReady("task_run", 0));
    ORB::Task other("anna", "one");
    ASSERT_TRUE(Report(&other));
    EXPECT_TRUE(task.waitForDataReady("task_run", 60));
    EXPECT_TRUE(task.hasProperty("body"));
}

TEST_F(TaskContract, WaitsNoLongerThanItsSeconds) {
    ORB::Task task("anna", "one");
    ASSERT_TRUE(task.finish(true));
    EXPECT_FALSE(task.waitForDataReady("task_run", 1));
}

// A start, its work and its end, with one handle on both sides of the fork.
TEST_F(TaskContract, ServesBothSidesOfAFork) {
    const support::ChildResult result = support::InChild([] {
        ORB::Task task("anna", "one");
        if (!Begin(&task)) {
            return 1;
        }
        const int child = TLIBCProcFork();
        if (child == 0) {
            ORB::Task response("anna", "one");
            (void)setsid();
            const bool done = task.setCreatePid(getpid()) && Report(&response) && task.reload() &&
                              task.hasProperty("body") && task.getCreatePid() == getpid() &&
                              task.finish(task.getBoolProperty("auto_remove", false));
            _exit(done ? 0 : 1);
        }
        const bool ready = task.waitForDataReady("task_run", 60) && task.hasProperty("body");
        int status = -1;
        (void)waitpid(child, &status, 0);
        return ready && status == 0 && task.reload() && task.isFinished() &&
                       task.getCreatePid() == 0
                   ? 0
                   : 2;
    });
    EXPECT_EQ(result.status, 0) << result.output;
}

}  // namespace
