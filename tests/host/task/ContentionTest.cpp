#include <signal.h>
#include <sys/mman.h>
#include <sys/wait.h>
#include <time.h>
#include <unistd.h>

#include <atomic>
#include <cstdlib>

#include "TaskRoot.h"

namespace {

constexpr int kMost = 64;

int Setting(const char* name, int fallback) {
    const char* text = getenv(name);
    return text != nullptr ? atoi(text) : fallback;
}

double Now() {
    struct timespec now = {};
    (void)clock_gettime(CLOCK_MONOTONIC, &now);
    return static_cast<double>(now.tv_sec) + static_cast<double>(now.tv_nsec) / 1e9;
}

// What the processes tell, in memory that outlives them.
struct Told {
    std::atomic<int> stop;
    std::atomic<int> failures;
    std::atomic<int> tasks;
    std::atomic<int> counts[kMost];  // the last one of each that was stored
};

class Contention : public TaskRoot {
  public:
    void SetUp() override {
        TaskRoot::SetUp();
        void* room =
            mmap(nullptr, sizeof(Told), PROT_READ | PROT_WRITE, MAP_SHARED | MAP_ANONYMOUS, -1, 0);
        ASSERT_NE(room, MAP_FAILED);
        told = static_cast<Told*>(room);
    }
    void TearDown() override {
        (void)munmap(told, sizeof(Told));
        TaskRoot::TearDown();
    }

    bool Expect(bool done, const char* what) {
        if (!done) {
            ++told->failures;
            std::printf("%s failed: %s\n", what, Logged().c_str());
        }
        return done;
    }

    // Starts, counts, lists and ends tasks; all count in one record, too.
    bool LiveOneTask(int worker) {
        const std::string id = Id("load");
        const std::string name = "w" + std::to_string(worker);
        ORB::Task task("anna", id.c_str());
        ORB::Task common("anna", "common");
        if (!Expect(!id.empty() && task.isValid() && common.isValid(), "a handle") ||
            !Expect(Begin(&task), "the first batch") ||
            !Expect(task.setCreatePid(getpid()), "the pid")) {
            return false;
        }
        const int count = told->counts[worker] + 1;
        common.beginUpdate();
        (void)common.setProperty(name.c_str(), count);
        (void)common.setProperty((name + "again").c_str(), count);
        if (!Expect(common.endUpdate(), "the count")) {
            return false;
        }
        told->counts[worker] = count;
        const bool seen = common.reload() && common.getProperty(name.c_str()) == count;
        bool listed = false;
        for (const Json::Value& other : ORB::TaskMgr("anna").getAllTaskId("load")) {
            listed = listed || other.asString() == id;
        }
        ++told->tasks;
        return Expect(seen, "the count's read") && Expect(listed, "the list") &&
               Expect(Report(&task), "the result") &&
               Expect(ORB::Task("anna", id.c_str()).finish(true), "the stop") &&
               Expect(task.reload() && task.finish(true), "the end") &&
               Expect(told->tasks % 3 != 0 || task.remove(), "the removal");
    }

    pid_t StartWorker(int worker) {
        return StartProcess([this, worker] {
            while (told->stop == 0) {
                if (!LiveOneTask(worker)) {
                    return 1;
                }
            }
            return 0;
        });
    }

    Told* told = nullptr;
};

TEST_F(Contention, LosesNothingAndLocksNobodyOut) {
    const int processes = std::min(Setting("TASK_PROCESSES", 8), kMost);
    const int seconds = Setting("TASK_SECONDS", 3);
    std::vector<pid_t> workers;
    for (int worker = 0; worker < processes; ++worker) {
        workers.push_back(StartWorker(worker));
    }
    const double end = Now() + seconds;
    const double pause = seconds > 10 ? 1 : 0.3;
    for (int round = 0; Now() < end; ++round) {
        (void)usleep(static_cast<useconds_t>(pause * 1e6));
        pid_t& victim = workers[static_cast<size_t>(round % processes)];
        ASSERT_EQ(kill(victim, SIGKILL), 0);
        ASSERT_EQ(WaitFor(victim), 1000 + SIGKILL) << "it had failed before";
        victim = StartWorker(round % processes);
    }
    told->stop = 1;
    for (const pid_t worker : workers) {
        EXPECT_EQ(WaitFor(worker), 0);
    }
    EXPECT_EQ(told->failures, 0);
    EXPECT_GT(told->tasks, processes);

    // Who was killed may have stored one count more than it could tell.
    const ORB::Task common("anna", "common");
    for (int worker = 0; worker < processes; ++worker) {
        const std::string name = "w" + std::to_string(worker);
        const int stored = common.getProperty(name.c_str()).asInt();
        EXPECT_GE(stored, told->counts[worker]);
        EXPECT_LE(stored, told->counts[worker] + 1);
        EXPECT_EQ(common.getProperty((name + "again").c_str()).asInt(), stored);
    }
    ASSERT_EQ(Ask("PRAGMA integrity_check"), "ok");

    Configure("task_start_wait=\"0\"");
    MakeSweepDue();
    EXPECT_EQ(InProcess([] { return Id("x").empty() ? 1 : 0; }), 0);
    EXPECT_EQ(Ask("SELECT count(*) FROM task WHERE finished = 0"), "0");
    EXPECT_EQ(Ask("SELECT count(*) FROM property WHERE task NOT IN (SELECT number FROM task)"),
              "0");
    std::printf("%d processes, %d seconds: %d tasks\n", processes, seconds, told->tasks.load());
}

}  // namespace
