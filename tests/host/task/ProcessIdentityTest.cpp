#include "hosts/linux/task/ProcessIdentity.h"

#include <fcntl.h>
#include <signal.h>
#include <sys/prctl.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstring>

#include "TaskRoot.h"

namespace {

struct Row {
    const char* name;
    std::string line;
    char state;  // 0 where the line is none
    unsigned long long start;
};

constexpr char kMiddle[] = " 1 2 3 4 5 6 7 8 9 10 11 12 13 14 15 16 17 18 ";

class ProcessLine : public ::testing::TestWithParam<Row> {};

TEST_P(ProcessLine, GivesStateAndStart) {
    const Row& row = GetParam();
    char state = '?';
    unsigned long long start = 99;
    EXPECT_EQ(host::ParseProcessLine(row.line, &state, &start), row.state != 0);
    EXPECT_EQ(state, row.state != 0 ? row.state : '?');
    EXPECT_EQ(start, row.state != 0 ? row.start : 99);
}

INSTANTIATE_TEST_SUITE_P(
    Rows, ProcessLine,
    ::testing::Values(
        Row{"plain", std::string("7 (sh) S") + kMiddle + "4711 20 21\n", 'S', 4711},
        Row{"last", std::string("7 (sh) R") + kMiddle + "4711", 'R', 4711},
        Row{"blankInName", std::string("7 (a b) S") + kMiddle + "12 0", 'S', 12},
        Row{"bracketsInName", std::string("7 () Z 1)) S") + kMiddle + "12 0", 'S', 12},
        Row{"newlineInName", std::string("7 (a\nb) S") + kMiddle + "12 0", 'S', 12},
        Row{"empty", "", 0, 0}, Row{"noBracket", "7 sh S 1", 0, 0},
        Row{"short", "7 (sh) S 1 2 3", 0, 0}, Row{"nothingBehind", "7 (sh)", 0, 0},
        Row{"noNumber", std::string("7 (sh) S") + kMiddle + "x 1", 0, 0},
        Row{"tooLarge", std::string("7 (sh) S") + kMiddle + "99999999999999999999999 1", 0, 0}),
    [](const auto& row) { return std::string(row.param.name); });

TEST(ProcessIdentity, IsOfThisProcessAsLongAsItLives) {
    TaloTaskProcess process = {};
    ASSERT_TRUE(host::IdentifyProcess(getpid(), &process));
    EXPECT_EQ(process.pid, getpid());
    EXPECT_GT(process.start, 0u);
    EXPECT_EQ(strlen(process.boot), 36u);
    EXPECT_TRUE(host::ProcessLives(process));
}

TEST(ProcessIdentity, IsNotThatOfAnotherStartOrBoot) {
    TaloTaskProcess process = {};
    ASSERT_TRUE(host::IdentifyProcess(getpid(), &process));
    TaloTaskProcess other = process;
    ++other.start;
    EXPECT_FALSE(host::ProcessLives(other));
    other = process;
    other.boot[0] = other.boot[0] == '0' ? '1' : '0';
    EXPECT_FALSE(host::ProcessLives(other));
    other = process;
    std::memset(other.boot, 'x', sizeof other.boot);  // not even ended
    EXPECT_FALSE(host::ProcessLives(other));
}

TEST(ProcessIdentity, IsOfNobodyForWhatIsNoProcess) {
    TaloTaskProcess process = {};
    for (const int pid : {0, -1, 0x7fffffff}) {
        process.pid = 5;
        EXPECT_FALSE(host::IdentifyProcess(pid, &process)) << pid;
        EXPECT_EQ(process.pid, 5);
        process.pid = pid;
        EXPECT_FALSE(host::ProcessLives(process)) << pid;
    }
}

class CreatePid : public TaskRoot {
  public:
    // A process that lives until it is let go.
    pid_t StartSleeper(const char* name = "sleeper") {
        int ends[2];
        EXPECT_EQ(pipe2(ends, O_CLOEXEC), 0);
        const pid_t child = StartProcess([name, &ends] {
            (void)prctl(PR_SET_NAME, name);
            (void)!write(ends[1], "x", 1);
            (void)pause();
            return 0;
        });
        char byte = 0;
        EXPECT_EQ(read(ends[0], &byte, 1), 1);
        (void)close(ends[0]);
        (void)close(ends[1]);
        return child;
    }
    static int AskedPid() {
        return ORB::Task("anna", "one").getCreatePid();
    }
};

TEST_F(CreatePid, IsZeroForARecordThatNobodyRuns) {
    EXPECT_EQ(ORB::Task("anna", "one").getCreatePid(), 0);
}

TEST_F(CreatePid, IsAnsweredWhileTheProcessLives) {
    const pid_t child = StartSleeper(") Z 1 (");
    ORB::Task task("anna", "one");
    ASSERT_TRUE(task.setCreatePid(child));
    EXPECT_EQ(task.getCreatePid(), child);
    EXPECT_EQ(AskedPid(), child);
    ASSERT_EQ(kill(child, SIGKILL), 0);
    siginfo_t ended = {};
    // It has ended, and is not waited for.
    ASSERT_EQ(waitid(P_PID, static_cast<id_t>(child), &ended, WEXITED | WNOWAIT), 0);
    EXPECT_EQ(task.getCreatePid(), 0);
    EXPECT_EQ(AskedPid(), 0);
    EXPECT_EQ(WaitFor(child), 1000 + SIGKILL);
    EXPECT_EQ(AskedPid(), 0);
}

TEST_F(CreatePid, IsNotThatOfALaterProcessOfTheSameNumber) {
    ASSERT_TRUE(ORB::Task("anna", "one").setCreatePid(getpid()));
    ASSERT_EQ(AskedPid(), getpid());
    Do("UPDATE task SET start = start - 1");
    EXPECT_EQ(AskedPid(), 0);
    Do("UPDATE task SET start = start + 1");
    ASSERT_EQ(AskedPid(), getpid());
    Do("UPDATE task SET boot = '00000000-0000-0000-0000-000000000000'");
    EXPECT_EQ(AskedPid(), 0);
}

TEST_F(CreatePid, IsRefusedForWhatIsNoProcess) {
    ORB::Task task("anna", "one");
    for (const int pid : {0, -1, 0x7fffffff}) {
        EXPECT_FALSE(task.setCreatePid(pid)) << pid;
    }
    EXPECT_EQ(task.getCreatePid(), 0);
    EXPECT_TRUE(WasLogged("does not live"));
}

}  // namespace
