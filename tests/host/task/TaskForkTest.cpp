#include <dirent.h>
#include <pthread.h>
#include <signal.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <atomic>
#include <thread>

#include "TaskRoot.h"
#include "platform/Paths.h"
#include "platform/System.h"

namespace {

// How many descriptors of the store this process has.
int OpenFiles() {
    int files = 0;
    DIR* folder = opendir("/proc/self/fd");
    while (const dirent* entry = readdir(folder)) {
        char target[4096] = {};
        const std::string link = std::string("/proc/self/fd/") + entry->d_name;
        if (readlink(link.c_str(), target, sizeof target - 1) > 0 &&
            std::string(target).rfind(TALO_TASK_DIR, 0) == 0) {
            ++files;
        }
    }
    (void)closedir(folder);
    return files;
}

// Whoever else is at work comes to rest at the store's lock. AddressSanitizer's
// allocator hangs in a child that is forked while another thread is in it.
std::atomic<bool> restBeforeForks{false};

void RestBeforeFork() {
    if (restBeforeForks) {
        (void)usleep(20'000);
    }
}

// What is registered before the store's own handler runs after it.
const int registered = pthread_atfork(RestBeforeFork, nullptr, nullptr);

int ByWrapper() {
    return TLIBCProcFork();
}
int ByCLibrary() {
    return fork();
}

class TaskFork : public TaskRoot, public ::testing::WithParamInterface<int (*)()> {
  public:
    // What a start does, with the one handle on both sides of the fork.
    static int Start() {
        ORB::Task task("anna", "one");
        if (!Begin(&task)) {
            return 1;
        }
        const int child = GetParam()();
        if (child == 0) {
            if (OpenFiles() != 0 || !task.setCreatePid(getpid())) {
                _exit(2);
            }
            ORB::Task response("anna", "one");
            if (!Report(&response) || !task.reload() || !task.hasProperty("body") ||
                !task.finish(task.getBoolProperty("auto_remove", false))) {
                _exit(3);
            }
            _exit(0);
        }
        const bool ready = task.waitForDataReady("task_run", 60) && task.hasProperty("body");
        const int status = WaitFor(child);
        return status != 0 ? status : ready && task.reload() && task.isFinished() ? 0 : 4;
    }
};

TEST_P(TaskFork, LetsOneHandleServeBothSides) {
    EXPECT_EQ(InProcess([] { return Start(); }), 0);
    EXPECT_TRUE(IsFinished("one"));
    EXPECT_EQ(Stored("one", "auto_remove"), Json::Value(true));
    EXPECT_EQ(Ask("PRAGMA integrity_check"), "ok");
}

TEST_P(TaskFork, HandsNoConnectionDown) {
    ASSERT_TRUE(ORB::Task("anna", "one").isValid());
    ASSERT_GT(OpenFiles(), 0);
    const int child = GetParam()();
    if (child == 0) {
        _exit(OpenFiles());
    }
    EXPECT_EQ(WaitFor(child), 0);
}

// The child is left alone with the store while others come, go and write: with
// locks that only the parent had, it would lose what it stores.
TEST_P(TaskFork, LeavesTheChildItsOwnLocksWhenTheParentIsGone) {
    const int status = InProcess([] {
        ORB::Task task("anna", "one");
        if (!Begin(&task)) {
            return 1;
        }
        const int child = GetParam()();
        if (child != 0) {
            return 0;
        }
        for (int number = 0; number < 100; ++number) {
            (void)task.setProperty("n", number);
            (void)usleep(1000);
        }
        _exit(task.setProperty("end", true) ? 0 : 1);
    });
    EXPECT_EQ(status, 0);
    for (int number = 0; number < 50; ++number) {
        EXPECT_EQ(InProcess([&] {
                      ORB::Task other("anna", "two");
                      return other.setProperty("n", number) ? 0 : 1;
                  }),
                  0);
    }
    ORB::Task task("anna", "one");
    EXPECT_TRUE(task.waitForDataReady("end", 60));
    EXPECT_EQ(task.getProperty("n"), Json::Value(99));
    EXPECT_EQ(Stored("two", "n"), Json::Value(49));
    EXPECT_EQ(Ask("PRAGMA integrity_check"), "ok");
}

TEST_P(TaskFork, StoresFromManyGenerations) {
    EXPECT_EQ(InProcess([] {
                  ORB::Task task("anna", "one");
                  for (int generation = 0; generation < 10; ++generation) {
                      const std::string name = "n" + std::to_string(generation);
                      if (!task.setProperty(name.c_str(), generation)) {
                          return 1;
                      }
                      const int child = GetParam()();
                      if (child != 0) {
                          return WaitFor(child);
                      }
                  }
                  return 0;
              }),
              0);
    EXPECT_EQ(Ask("SELECT count(*) FROM property"), "10");
}

TEST_P(TaskFork, WaitsForAnotherThreadsStep) {
    EXPECT_EQ(InProcess([] {
                  // The store is open before the first fork.
                  ORB::Task task("anna", "thread");
                  restBeforeForks = registered == 0;
                  std::atomic<bool> end{false};
                  std::thread writer([&] {
                      while (!end) {
                          (void)task.setProperty("x", 1);
                      }
                  });
                  int status = 0;
                  for (int number = 0; number < 30 && status == 0; ++number) {
                      const int child = GetParam()();
                      if (child == 0) {
                          _exit(ORB::Task("anna", "one").setProperty("x", number) ? 0 : 1);
                      }
                      status = WaitFor(child);
                  }
                  end = true;
                  writer.join();
                  return status;
              }),
              0);
    EXPECT_EQ(Stored("one", "x"), Json::Value(29));
}

INSTANTIATE_TEST_SUITE_P(Of, TaskFork, ::testing::Values(ByWrapper, ByCLibrary),
                         [](const auto& row) {
                             return row.param == ByWrapper ? "Wrapper" : "CLibrary";
                         });

TEST_F(TaskRoot, IsClosedToAProcessThatWasForkedPastTheCLibrary) {
    ORB::Task task("anna", "one");
    ASSERT_TRUE(task.isValid());
    const long child = syscall(SYS_fork);
    if (child == 0) {
        const bool stored = task.setProperty("x", 1);
        _exit(!stored && WasLogged("forked in an unknown way") ? 0 : 1);
    }
    EXPECT_EQ(WaitFor(static_cast<pid_t>(child)), 0);
    EXPECT_TRUE(task.setProperty("x", 2));
}

}  // namespace
