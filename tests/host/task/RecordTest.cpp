#include <sys/stat.h>
#include <unistd.h>

#include <clocale>

#include "TaskRoot.h"
#include "platform/Paths.h"
#include "tests/support/Json.h"

namespace {

class Record : public TaskRoot {};

TEST_F(Record, IsMadeByItsFirstHandleAndFoundByTheNext) {
    EXPECT_FALSE(ORB::TaskUtil::checkTaskExists("anna", "one"));
    const ORB::Task task("anna", "one");
    EXPECT_TRUE(task.isValid());
    EXPECT_STREQ(task.getTaskId(), "one");
    EXPECT_TRUE(ORB::TaskUtil::checkTaskExists("anna", "one"));
    EXPECT_FALSE(ORB::TaskUtil::checkTaskExists("bert", "one"));
    EXPECT_TRUE(ORB::Task("anna", "one").isValid());
    EXPECT_EQ(Ask("SELECT count(*) FROM task"), "1");
}

TEST_F(Record, IsNotMadeByAQuestion) {
    (void)ORB::TaskUtil::checkTaskExists("anna", "one");
    (void)ORB::TaskUtil::getUniqueID("anna", "one");
    EXPECT_EQ(Ask("SELECT count(*) FROM task"), "0");
}

TEST_F(Record, LiesInAPlaceThatNobodyElseReads) {
    ASSERT_TRUE(ORB::Task("anna", "one").setProperty("x", 1));
    struct stat facts = {};
    ASSERT_EQ(stat(TALO_TASK_DIR, &facts), 0);
    EXPECT_EQ(facts.st_mode & 07777, 0700u);
    for (const char* end : {"", "-wal", "-shm"}) {
        ASSERT_EQ(stat((Database() + end).c_str(), &facts), 0) << end;
        EXPECT_EQ(facts.st_mode & 07777, 0600u) << end;
    }
}

TEST_F(Record, IsWrittenAheadAndSyncedFully) {
    ASSERT_TRUE(ORB::Task("anna", "one").isValid());
    EXPECT_EQ(Ask("PRAGMA journal_mode"), "wal");
}

struct Named {
    const char* name;
    const char* user;
    std::string id;
    bool valid;
};

class Identity : public TaskRoot, public ::testing::WithParamInterface<Named> {};

TEST_P(Identity, IsCheckedBeforeItReachesTheStore) {
    const Named& row = GetParam();
    const ORB::Task task(row.user, row.id.c_str());
    EXPECT_EQ(task.isValid(), row.valid);
    EXPECT_EQ(ORB::TaskUtil::checkTaskExists(row.user, row.id.c_str()), row.valid);
    EXPECT_STREQ(task.getTaskId(), row.id.c_str());
}

INSTANTIATE_TEST_SUITE_P(
    Rows, Identity,
    ::testing::Values(
        Named{"login", "anna", "a", true}, Named{"users", "@users", "a", true},
        Named{"administrators", "@administrators", "a", true},
        Named{"domain", "domain\\anna", "a", true}, Named{"digits", "anna", "123", true},
        Named{"signs", "anna", "-_.", true}, Named{"longest", "anna", std::string(128, 'x'), true},
        Named{"tooLong", "anna", std::string(129, 'x'), false}, Named{"noUser", "", "a", false},
        Named{"noId", "anna", "", false}, Named{"otherGroup", "@others", "a", false},
        Named{"slashInUser", "an/na", "a", false}, Named{"slashInId", "anna", "a/b", false},
        Named{"blank", "anna", "a b", false}, Named{"quote", "anna", "a'b", false},
        Named{"newline", "anna", "a\n", false}, Named{"notAscii", "anna", "\xc3\xa9", false}),
    [](const auto& row) { return std::string(row.param.name); });

TEST_F(Record, HasNoHandleForNull) {
    EXPECT_FALSE(ORB::Task(nullptr, "one").isValid());
    EXPECT_FALSE(ORB::Task("anna", nullptr).isValid());
    EXPECT_FALSE(ORB::TaskMgr(nullptr).isValid());
    EXPECT_FALSE(ORB::TaskUtil::checkTaskExists(nullptr, nullptr));
}

TEST_F(Record, TakesNothingThroughAnInvalidHandle) {
    ORB::Task task("", "one");
    task.beginUpdate();
    EXPECT_FALSE(task.setProperty("x", 1));
    EXPECT_FALSE(task.endUpdate());
    EXPECT_FALSE(task.setProperty("x", 1));
    EXPECT_FALSE(task.reload());
    EXPECT_FALSE(task.finish(true));
    EXPECT_FALSE(task.remove());
    EXPECT_FALSE(task.setCreatePid(getpid()));
    EXPECT_EQ(task.getCreatePid(), 0);
    EXPECT_FALSE(task.isFinished());
    EXPECT_FALSE(task.hasProperty("x"));
    EXPECT_TRUE(task.getProperty("x").isNull());
    EXPECT_TRUE(task.getBoolProperty("x", true));
    EXPECT_FALSE(task.waitForDataReady("x", 0));
}

TEST_F(Record, KeepsValuesAsTheyAre) {
    const std::string rows[] = {"null",
                                "true",
                                "false",
                                "0",
                                "-1",
                                "9223372036854775807",
                                "18446744073709551615",
                                "1.5",
                                "1e300",
                                "0.1",
                                "\"\"",
                                "\"a\\u0000b\"",
                                "\"\xc3\xa9 \\\\ \\\" <\"",
                                "[]",
                                "{}",
                                "[1,[2,{\"a\":[]}]]",
                                "{\"\":0,\"a/b\":null}"};
    for (const std::string& row : rows) {
        const Json::Value value = support::Parse(row);
        ORB::Task task("anna", "one");
        ASSERT_TRUE(task.setProperty("x", value)) << row;
        EXPECT_EQ(task.getProperty("x"), value) << row;
        EXPECT_EQ(Stored("one", "x"), value) << row;
    }
}

TEST_F(Record, KeepsBytesThatAreNoUtf8) {
    const Json::Value value("\xff\xfe name");
    ASSERT_TRUE(ORB::Task("anna", "one").setProperty("x", value));
    EXPECT_EQ(Stored("one", "x"), value);
}

TEST_F(Record, KeepsNumbersWhateverTheLocale) {
    const std::string before = setlocale(LC_ALL, nullptr);
    (void)setlocale(LC_ALL, "de_DE.UTF-8");
    const bool stored = ORB::Task("anna", "one").setProperty("x", 1.5);
    const Json::Value read = Stored("one", "x");
    (void)setlocale(LC_ALL, before.c_str());
    EXPECT_TRUE(stored);
    EXPECT_EQ(read, Json::Value(1.5));
}

TEST_F(Record, KeepsALongText) {
    const Json::Value value(std::string(3u << 20, 'x'));
    ASSERT_TRUE(ORB::Task("anna", "one").setProperty("x", value));
    EXPECT_EQ(Stored("one", "x"), value);
}

TEST_F(Record, RefusesAValueThatCouldNotBeReadBack) {
    Json::Value deep;
    for (int level = 0; level < 500; ++level) {
        Json::Value outer(Json::arrayValue);
        outer.append(deep);
        deep.swap(outer);
    }
    ORB::Task task("anna", "one");
    EXPECT_FALSE(task.setProperty("x", deep));
    EXPECT_FALSE(task.hasProperty("x"));
    EXPECT_TRUE(WasLogged("\"x\""));
}

TEST_F(Record, RefusesPropertiesWithoutAName) {
    ORB::Task task("anna", "one");
    EXPECT_FALSE(task.setProperty(nullptr, 1));
    EXPECT_FALSE(task.setProperty("", 1));
    EXPECT_FALSE(task.setProperty("a\nb", 1));
    EXPECT_FALSE(task.setProperty(std::string(129, 'x').c_str(), 1));
    EXPECT_TRUE(task.setProperty(std::string(128, 'x').c_str(), 1));
}

TEST_F(Record, TellsNullFromNothing) {
    ORB::Task task("anna", "one");
    EXPECT_FALSE(task.hasProperty("x"));
    ASSERT_TRUE(task.setProperty("x", Json::Value()));
    EXPECT_TRUE(task.hasProperty("x"));
    EXPECT_TRUE(ORB::Task("anna", "one").hasProperty("x"));
}

TEST_F(Record, AnswersTheFallbackForWhatIsNoBool) {
    ORB::Task task("anna", "one");
    ASSERT_TRUE(task.setProperty("yes", true) && task.setProperty("no", false) &&
                task.setProperty("one", 1) && task.setProperty("text", "true"));
    EXPECT_TRUE(task.getBoolProperty("yes", false));
    EXPECT_FALSE(task.getBoolProperty("no", true));
    for (const char* other : {"one", "text", "nothing"}) {
        EXPECT_TRUE(task.getBoolProperty(other, true)) << other;
        EXPECT_FALSE(task.getBoolProperty(other, false)) << other;
    }
}

TEST_F(Record, ShowsABatchToOthersAtItsEnd) {
    ORB::Task task("anna", "one");
    task.beginUpdate();
    ASSERT_TRUE(task.setProperty("a", 1));
    ASSERT_TRUE(task.setProperty("b", 2));
    EXPECT_FALSE(ORB::Task("anna", "one").hasProperty("a"));
    EXPECT_FALSE(task.hasProperty("a"));
    ASSERT_TRUE(task.endUpdate());
    EXPECT_EQ(task.getProperty("b"), Json::Value(2));
    EXPECT_EQ(Stored("one", "a"), Json::Value(1));
    EXPECT_EQ(Stored("one", "b"), Json::Value(2));
}

TEST_F(Record, StoresNothingOfABatchWithARefusedWrite) {
    ORB::Task task("anna", "one");
    task.beginUpdate();
    ASSERT_TRUE(task.setProperty("a", 1));
    ASSERT_FALSE(task.setProperty("", 2));
    EXPECT_FALSE(task.endUpdate());
    EXPECT_FALSE(task.hasProperty("a"));
    EXPECT_FALSE(ORB::Task("anna", "one").hasProperty("a"));
    task.beginUpdate();
    ASSERT_TRUE(task.setProperty("a", 1));
    EXPECT_TRUE(task.endUpdate());
}

TEST_F(Record, EndsNoBatchThatHasNotBegun) {
    ORB::Task task("anna", "one");
    EXPECT_FALSE(task.endUpdate());
    task.beginUpdate();
    EXPECT_TRUE(task.endUpdate());
    EXPECT_FALSE(task.endUpdate());
}

TEST_F(Record, ShowsWhatOthersHaveWrittenAfterReload) {
    ORB::Task task("anna", "one");
    ASSERT_TRUE(ORB::Task("anna", "one").setProperty("x", 1));
    ASSERT_TRUE(ORB::Task("anna", "one").finish(false));
    EXPECT_FALSE(task.hasProperty("x"));
    EXPECT_FALSE(task.isFinished());
    ASSERT_TRUE(task.reload());
    EXPECT_TRUE(task.hasProperty("x"));
    EXPECT_TRUE(task.isFinished());
}

TEST_F(Record, LosesNothingThatAnotherHandleWrote) {
    ORB::Task first("anna", "one");
    ORB::Task second("anna", "one");
    ASSERT_TRUE(first.setProperty("a", 1));
    ASSERT_TRUE(second.setProperty("b", 2));
    ASSERT_TRUE(first.setProperty("c", 3));
    EXPECT_EQ(Ask("SELECT group_concat(name) FROM property"), "a,b,c");
}

TEST_F(Record, IsFinishedAgainByTheLastOne) {
    ORB::Task task("anna", "one");
    ASSERT_TRUE(Begin(&task));
    ORB::Task stop("anna", "one");
    ASSERT_TRUE(stop.finish(false));
    EXPECT_TRUE(stop.isFinished());
    ASSERT_TRUE(task.reload());
    EXPECT_FALSE(task.getBoolProperty("auto_remove", true));
    EXPECT_TRUE(task.finish(true));
    EXPECT_TRUE(IsFinished("one"));
    EXPECT_EQ(Stored("one", "auto_remove"), Json::Value(true));
    EXPECT_EQ(Ask("SELECT auto_remove FROM task"), "1");
}

TEST_F(Record, TakesAResultAfterItWasFinished) {
    ORB::Task task("anna", "one");
    ASSERT_TRUE(ORB::Task("anna", "one").finish(false));
    EXPECT_TRUE(Report(&task));
    EXPECT_EQ(Stored("one", "task_run"), Json::Value(true));
}

TEST_F(Record, IsNotRaisedAgainByAHandleThatIsLeft) {
    ORB::Task left("anna", "one");
    ASSERT_TRUE(left.setProperty("x", 1));
    ASSERT_TRUE(ORB::Task("anna", "one").remove());
    const auto expectGone = [&] {
        EXPECT_FALSE(left.setProperty("x", 1));
        left.beginUpdate();
        (void)left.setProperty("x", 1);
        EXPECT_FALSE(left.endUpdate());
        EXPECT_FALSE(left.setCreatePid(getpid()));
        EXPECT_FALSE(left.finish(true));
    };
    expectGone();
    EXPECT_FALSE(ORB::TaskUtil::checkTaskExists("anna", "one"));
    EXPECT_EQ(Ask("SELECT count(*) FROM property"), "0");
    // A successor of the same id is another record.
    const ORB::Task successor("anna", "one");
    expectGone();
    EXPECT_FALSE(ORB::Task("anna", "one").hasProperty("x"));
    EXPECT_FALSE(ORB::Task("anna", "one").isFinished());
    EXPECT_FALSE(left.reload());
    EXPECT_FALSE(left.hasProperty("x"));
    EXPECT_TRUE(left.remove());
    EXPECT_TRUE(ORB::TaskUtil::checkTaskExists("anna", "one"));
}

TEST_F(Record, OutlivesItsProcess) {
    ASSERT_EQ(InProcess([] {
                  ORB::Task task("anna", "one");
                  return Begin(&task) && Report(&task) && task.finish(true) ? 0 : 1;
              }),
              0);
    EXPECT_TRUE(IsFinished("one"));
    EXPECT_EQ(Stored("one", "body")["data"]["n"], Json::Value(1));
}

TEST_F(Record, IsReadThoughItsContentsAreHostile) {
    ORB::Task task("anna", "one");
    ASSERT_TRUE(task.setProperty("good", 1));
    const std::string deep = std::string(100000, '[');
    Do("INSERT INTO property SELECT number, 'deep', '" + deep + "' FROM task");
    Do("INSERT INTO property SELECT number, 'empty', '' FROM task");
    Do("INSERT INTO property SELECT number, 'blob', x'00ff' FROM task");
    Do("INSERT INTO property SELECT number, 'number', 7 FROM task");
    Do("INSERT INTO property SELECT number, 'twice', '1 2' FROM task");
    Do("UPDATE task SET pid = 9223372036854775807, start = -1, boot = hex(zeroblob(5000)),"
       " finished = 'x'");
    ASSERT_TRUE(task.reload());
    EXPECT_EQ(task.getProperty("good"), Json::Value(1));
    for (const char* name : {"deep", "empty", "blob", "twice"}) {
        EXPECT_FALSE(task.hasProperty(name)) << name;
        EXPECT_TRUE(WasLogged(std::string("\"") + name + "\"")) << name;
    }
    EXPECT_EQ(task.getProperty("number"), Json::Value(7));
    EXPECT_EQ(task.getCreatePid(), 0);
    EXPECT_TRUE(task.setProperty("empty", 2));
}

}  // namespace
