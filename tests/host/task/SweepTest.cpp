#include <signal.h>
#include <unistd.h>

#include "TaskRoot.h"
#include "tests/support/Json.h"

namespace {

class Sweep : public TaskRoot {
  public:
    void SetUp() override {
        TaskRoot::SetUp();
        // The store is there, and was swept just now.
        ASSERT_EQ(InProcess([] { return ORB::Task("anna", "kept").isValid() ? 0 : 1; }), 0);
        Do("DELETE FROM task");
    }

    static void StoreAsProcess(const char* id, bool report) {
        ASSERT_EQ(InProcess([&] {
                      ORB::Task task("anna", id);
                      return Begin(&task) && task.setCreatePid(getpid()) &&
                                     (!report || Report(&task))
                                 ? 0
                                 : 1;
                  }),
                  0);
    }

    // By another process that only comes by.
    static void ComeBy() {
        ASSERT_EQ(InProcess([] {
                      (void)ORB::TaskUtil::checkTaskExists("bert", "none");
                      return 0;
                  }),
                  0);
    }
    static void RunSweep() {
        MakeSweepDue();
        ComeBy();
    }
    static bool Exists(const char* id) {
        return Ask(std::string("SELECT count(*) FROM task WHERE id = '") + id + "'") == "1";
    }
    static void FinishAgo(const char* id, bool autoRemove, int seconds) {
        ASSERT_TRUE(ORB::Task("anna", id).finish(autoRemove));
        Do("UPDATE task SET finished = finished - " + std::to_string(seconds) + " WHERE id = '" +
           id + "'");
    }
};

TEST_F(Sweep, EndsARecordWhoseProcessIsGone) {
    StoreAsProcess("one", false);
    RunSweep();
    EXPECT_TRUE(IsFinished("one"));
    EXPECT_EQ(Stored("one", "lost"), Json::Value(true));
    EXPECT_EQ(Stored("one", "body"),
              support::Parse("{\"success\":false,\"error\":{\"code\":117}}"));
    EXPECT_EQ(Stored("one", "auto_remove"), Json::Value(true));
    EXPECT_EQ(Ask("SELECT auto_remove FROM task"), "1");
}

TEST_F(Sweep, LeavesTheResultOfALostTask) {
    StoreAsProcess("one", true);
    RunSweep();
    EXPECT_TRUE(IsFinished("one"));
    EXPECT_EQ(Stored("one", "lost"), Json::Value(true));
    EXPECT_EQ(Stored("one", "body")["data"]["n"], Json::Value(1));
}

TEST_F(Sweep, EndsARecordWhoseProcessWasKilled) {
    const pid_t child = StartProcess([] {
        ORB::Task task("anna", "one");
        (void)task.setCreatePid(getpid());
        return task.setProperty("ready", true) ? pause() : 1;
    });
    ASSERT_TRUE(ORB::Task("anna", "one").waitForDataReady("ready", 30));
    RunSweep();
    EXPECT_FALSE(IsFinished("one"));
    ASSERT_EQ(kill(child, SIGKILL), 0);
    ASSERT_EQ(WaitFor(child), 1000 + SIGKILL);
    RunSweep();
    EXPECT_TRUE(IsFinished("one"));
}

TEST_F(Sweep, EndsARecordOfBeforeTheMachineStarted) {
    ASSERT_TRUE(ORB::Task("anna", "one").setCreatePid(getpid()));
    Do("UPDATE task SET boot = '00000000-0000-0000-0000-000000000000'");
    RunSweep();
    EXPECT_TRUE(IsFinished("one"));
}

TEST_F(Sweep, LeavesAFinishedRecordAsItIs) {
    StoreAsProcess("one", true);
    ASSERT_TRUE(ORB::Task("anna", "one").finish(false));
    RunSweep();
    EXPECT_FALSE(ORB::Task("anna", "one").hasProperty("lost"));
    EXPECT_EQ(Stored("one", "auto_remove"), Json::Value(false));
}

TEST_F(Sweep, WaitsTenMinutesForTheProcessOfARecord) {
    ASSERT_TRUE(ORB::Task("anna", "young").isValid());
    ASSERT_TRUE(ORB::Task("anna", "old").isValid());
    Do("UPDATE task SET created = created - 590 WHERE id = 'young'");
    Do("UPDATE task SET created = created - 601 WHERE id = 'old'");
    RunSweep();
    EXPECT_FALSE(IsFinished("young"));
    EXPECT_TRUE(IsFinished("old"));
    EXPECT_EQ(Stored("old", "lost"), Json::Value(true));
}

struct Age {
    const char* name;
    const char* settings;
    bool autoRemove;
    int seconds;
    bool kept;
};

class SweptAge : public Sweep, public ::testing::WithParamInterface<Age> {};

TEST_P(SweptAge, DecidesWhetherAFinishedRecordGoes) {
    Configure(GetParam().settings);
    ASSERT_TRUE(ORB::Task("anna", "one").setProperty("x", 1));
    FinishAgo("one", GetParam().autoRemove, GetParam().seconds);
    RunSweep();
    EXPECT_EQ(Exists("one"), GetParam().kept);
    EXPECT_EQ(Ask("SELECT count(*) FROM property") == "0", !GetParam().kept);
}

INSTANTIATE_TEST_SUITE_P(
    Rows, SweptAge,
    ::testing::Values(
        Age{"withinTheHour", "", true, 3500, true}, Age{"afterTheHour", "", true, 3601, false},
        Age{"toBeKept", "", false, 3601, true}, Age{"withinTheWeek", "", false, 604000, true},
        Age{"afterTheWeek", "", false, 604801, false},
        Age{"withinItsTime", "task_keep_auto_remove=\"100\"", true, 50, true},
        Age{"afterItsTime", "task_keep_auto_remove=\"100\"", true, 101, false},
        Age{"keptWithinItsTime", "task_keep_finished=\"100\"", false, 50, true},
        Age{"keptAfterItsTime", "task_keep_finished=\"100\"", false, 101, false},
        Age{"noNumber", "task_keep_auto_remove=\"soon\"", true, 3500, true},
        Age{"negative", "task_keep_auto_remove=\"-1\"", true, 3500, true},
        Age{"huge", "task_keep_auto_remove=\"99999999999999999999\"", true, 3601, false}),
    [](const auto& row) { return std::string(row.param.name); });

TEST_F(Sweep, NeverDropsWhatIsStillRunning) {
    ASSERT_TRUE(ORB::Task("anna", "one").setCreatePid(getpid()));
    FinishAgo("one", true, 1000000);
    RunSweep();
    EXPECT_TRUE(Exists("one"));
    Do("UPDATE task SET created = created - 1000000, finished = 0");
    RunSweep();
    EXPECT_FALSE(IsFinished("one"));
}

TEST_F(Sweep, RunsAtMostOnceAMinute) {
    StoreAsProcess("one", false);
    Do("UPDATE state SET value = strftime('%s', 'now') - 50");
    ComeBy();
    EXPECT_FALSE(IsFinished("one"));
    Do("UPDATE state SET value = strftime('%s', 'now') - 60");
    ComeBy();
    EXPECT_TRUE(IsFinished("one"));
    StoreAsProcess("two", false);
    ComeBy();
    EXPECT_FALSE(IsFinished("two"));
}

TEST_F(Sweep, RunsThoughTheClockWasSetBack) {
    StoreAsProcess("one", false);
    Do("UPDATE state SET value = strftime('%s', 'now') + 100000");
    ComeBy();
    EXPECT_TRUE(IsFinished("one"));
}

TEST_F(Sweep, IsDoneByAProcessThatLivesLong) {
    StoreAsProcess("one", false);
    ASSERT_FALSE(IsFinished("one"));
    MakeSweepDue();
    (void)usleep(1100000);
    EXPECT_TRUE(IsFinished("one"));
}

}  // namespace
