#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include "tests/polling/PollingFixture.h"
#include "tests/support/Child.h"

using polling::Parse;
using TALO::APIPollingPrivate;

namespace {

TEST(FullTaskId, PutsTheUserInFrontOfEach) {
    const struct {
        const char* ids;
        const char* full;
    } rows[] = {
        {R"("1")", R"("u/1")"},
        {R"(["1", "2"])", R"(["u/1", "u/2"])"},
        {R"([1, 2])", R"(["u/1", "u/2"])"},
        {R"(["b", "a", "a"])", R"(["u/b", "u/a", "u/a"])"},
        {R"({"one": "1", "two": 2})", R"({"one": "u/1", "two": "u/2"})"},
        {R"(["a/b", ""])", R"(["u/a/b", "u/"])"},
        {R"([true, null])", R"(["u/true", "u/"])"},
        {R"([])", "null"},
        {R"({})", "null"},
        {"null", "null"},
        {"7", "null"},
        {"-1.5", "null"},
        {"true", "null"},
    };
    for (const auto& row : rows) {
        EXPECT_EQ(APIPollingPrivate::ConverToFullTaskId("u", Parse(row.ids)), Parse(row.full))
            << row.ids;
    }
}

TEST(FullTaskId, IsNullWithoutAUser) {
    for (const char* ids : {R"("1")", R"(["1"])", R"({"one": "1"})"}) {
        EXPECT_TRUE(APIPollingPrivate::ConverToFullTaskId("", Parse(ids)).isNull()) << ids;
    }
}

TEST(FullTaskId, IsCutAtTheFirstSlash) {
    const struct {
        const char* full;
        const char* user;
        const char* id;
    } rows[] = {
        {"ann/1", "ann", "1"}, {"@users/1", "@users", "1"},
        {"a/b/c", "a", "b/c"}, {"a/", "a", ""},
        {"/1", "", "1"},       {"/", "", ""},
        {"//", "", "/"},
    };
    for (const auto& row : rows) {
        std::string user = "before";
        std::string id = "before";
        EXPECT_TRUE(APIPollingPrivate::GetUserAndTaskID(row.full, user, id)) << row.full;
        EXPECT_EQ(user, row.user) << row.full;
        EXPECT_EQ(id, row.id) << row.full;
    }
}

TEST(FullTaskId, WithoutASlashLeavesUserAndIdAlone) {
    for (const char* full : {"", "ann", "ann\\1"}) {
        std::string user = "before";
        std::string id = "before";
        EXPECT_FALSE(APIPollingPrivate::GetUserAndTaskID(full, user, id)) << full;
        EXPECT_EQ(user + id, "beforebefore") << full;
    }
}

TEST(FullTaskId, MayBeCutInPlace) {
    std::string user = "ann/1";
    std::string id;
    EXPECT_TRUE(APIPollingPrivate::GetUserAndTaskID(user, user, id));
    EXPECT_EQ(user + "," + id, "ann,1");
    id = "bob/2";
    EXPECT_TRUE(APIPollingPrivate::GetUserAndTaskID(id, user, id));
    EXPECT_EQ(user + "," + id, "bob,2");
}

typedef polling::Fixture TaskUser;

TEST_F(TaskUser, MayBeTheCallerOrEveryone) {
    const TALO::APIPollingPrivate* d = polling::PrivateOf(polling);
    EXPECT_TRUE(d->CheckTaskUser("ann"));
    EXPECT_TRUE(d->CheckTaskUser("@users"));
    LogIn("", false);
    EXPECT_TRUE(d->CheckTaskUser("@users"));
    EXPECT_TRUE(log.Lines().empty());
}

TEST_F(TaskUser, MayBeTheAdministratorsForOneOfThem) {
    const TALO::APIPollingPrivate* d = polling::PrivateOf(polling);
    EXPECT_FALSE(d->CheckTaskUser("@administrators"));
    EXPECT_EQ(Messages(), std::vector<std::string>{"Permission denied"});
    EXPECT_TRUE(Logged("Permission denied"));
    LogIn("root", true);
    EXPECT_TRUE(d->CheckTaskUser("@administrators"));
    EXPECT_EQ(log.Lines().size(), 1u);
}

TEST_F(TaskUser, MayBeNobodyElseWhoeverAsks) {
    const TALO::APIPollingPrivate* d = polling::PrivateOf(polling);
    for (const bool isAdmin : {false, true}) {
        LogIn("ann", isAdmin);
        for (const char* user : {"bob", "", "Ann", "ann ", "@Users", "@everyone", "admin"}) {
            EXPECT_FALSE(d->CheckTaskUser(user)) << user;
        }
    }
    EXPECT_EQ(Messages(), std::vector<std::string>(14, "Invalid task id"));
    EXPECT_EQ(polling.GetError(), 500);
}

typedef polling::Fixture Kill;

TEST_F(Kill, RefusesWhatIsNoProcess) {
    for (const int pid : {0, -1, -2147483647 - 1}) {
        EXPECT_FALSE(APIPollingPrivate::DoKill(pid));
    }
    EXPECT_EQ(Messages(), std::vector<std::string>(3, "invalid process id"));
    EXPECT_TRUE(Logged("invalid process id"));
}

TEST_F(Kill, SendsSigterm) {
    const pid_t child = fork();
    if (child == 0) {
        for (;;) {
            (void)pause();
        }
    }
    EXPECT_TRUE(APIPollingPrivate::DoKill(child));
    int status = 0;
    EXPECT_EQ(waitpid(child, &status, 0), child);
    EXPECT_TRUE(WIFSIGNALED(status));
    EXPECT_EQ(WTERMSIG(status), SIGTERM);
    EXPECT_TRUE(log.Lines().empty());
}

TEST_F(Kill, CountsAProcessThatHasGoneAsDone) {
    const pid_t child = fork();
    if (child == 0) {
        _exit(0);
    }
    EXPECT_EQ(waitpid(child, nullptr, 0), child);
    EXPECT_TRUE(APIPollingPrivate::DoKill(child));
    EXPECT_TRUE(log.Lines().empty());
}

// The first process of the machine belongs to nobody who gives up all rights.
TEST_F(Kill, TellsWhyAProcessCouldNotBeSignalled) {
    const support::ChildResult result = support::InChild([this] {
        if (geteuid() == 0 && setresuid(65534, 65534, 65534) != 0) {
            return 1;
        }
        if (kill(1, 0) == 0) {
            return 2;
        }
        EXPECT_FALSE(APIPollingPrivate::DoKill(1));
        EXPECT_TRUE(Logged("Failed to kill 1, reason=Operation not permitted(1)"));
        return 0;
    });
    EXPECT_EQ(result.status, 0) << result.output;
}

}  // namespace
