#include <signal.h>
#include <stdlib.h>
#include <string.h>
#include <sys/mman.h>
#include <unistd.h>

#include <cerrno>
#include <filesystem>

#include "FaultyFiles.h"
#include "TaskRoot.h"
#include "platform/Paths.h"
#include "tests/support/Json.h"

namespace fs = std::filesystem;

namespace {

using faulty::Fault;

// What the life of a task has been told to be stored, in memory that outlives it.
struct Told {
    bool id;
    bool made;
    bool begun;
    bool pid;
    bool reported;
    bool finished;
    bool struck;
};

// One task is born, works and ends while a call to the system fails.
class Faults : public TaskRoot, public ::testing::WithParamInterface<Fault> {
  public:
    void SetUp() override {
        TaskRoot::SetUp();
        char name[] = "/dev/shm/webapi-test-XXXXXX";
        ASSERT_NE(mkdtemp(name), nullptr) << strerror(errno);
        memory = name;
        void* room =
            mmap(nullptr, sizeof(Told), PROT_READ | PROT_WRITE, MAP_SHARED | MAP_ANONYMOUS, -1, 0);
        ASSERT_NE(room, MAP_FAILED);
        told = static_cast<Told*>(room);
    }
    void TearDown() override {
        (void)munmap(told, sizeof(Told));
        TaskRoot::TearDown();
        fs::remove_all(memory);
    }

    // In memory, as there are hundreds of them.
    void MakeEmptyStore() const {
        ClearTasks();
        fs::remove_all(memory);
        fs::create_directory(memory);
        fs::create_directories(fs::path(TALO_TASK_DIR).parent_path());
        fs::create_directory_symlink(memory, TALO_TASK_DIR);
        *told = Told();
    }

    void Live(int call) {
        faulty::Plan(GetParam(), call);
        const std::string id = Id("new");
        told->id = !id.empty();
        if (told->id) {
            ORB::Task task("anna", "new");
            told->made = task.isValid();
            told->begun = Begin(&task);
            told->pid = task.setCreatePid(getpid());
            told->reported = Report(&task);
            told->finished = task.finish(false);
        }
        told->struck = faulty::HasStruck();
    }

    // What was told is there. What was not may be there whole, or not at all.
    void ExpectWhole() const {
        ASSERT_EQ(Ask("PRAGMA integrity_check"), "ok");
        const bool exists = ORB::TaskUtil::checkTaskExists("anna", "new");
        EXPECT_TRUE(exists || !told->made);
        const ORB::Task task("anna", "new");
        ASSERT_TRUE(task.isValid());
        EXPECT_TRUE(task.hasProperty("info") || !told->begun);
        EXPECT_TRUE(task.hasProperty("auto_remove") || !task.hasProperty("info"));
        EXPECT_TRUE(task.hasProperty("body") || !told->reported);
        EXPECT_EQ(task.hasProperty("body"), task.hasProperty("task_run"));
        EXPECT_TRUE(task.isFinished() || !told->finished);
        if (told->pid) {
            EXPECT_NE(Ask("SELECT pid FROM task WHERE id = 'new'"), "0");
        }
        EXPECT_TRUE(ORB::Task("anna", "after").setProperty("x", 1));
    }

    // Without a look at what went before: only each Nth call differs.
    void Sweep(bool withOldStore) {
        bool struck = true;
        int call = 0;
        while (struck && !HasFailure()) {
            SCOPED_TRACE("call " + std::to_string(++call));
            MakeEmptyStore();
            if (withOldStore) {
                ASSERT_EQ(InProcess([] {
                              ORB::Task old("anna", "old");
                              return Begin(&old) && Report(&old) && old.finish(false) ? 0 : 1;
                          }),
                          0);
            }
            const int status = InProcess([&] {
                Live(call);
                return 0;
            });
            struck = told->struck || status == 1000 + SIGKILL;
            ASSERT_TRUE(status == 0 || (GetParam() == Fault::kKill && struck)) << status;
            ASSERT_EQ(InProcess([&] {
                          ExpectWhole();
                          if (withOldStore) {
                              EXPECT_TRUE(IsFinished("old"));
                              EXPECT_EQ(Stored("old", "body")["data"]["n"], Json::Value(1));
                          }
                          return 0;
                      }),
                      0);
        }
        EXPECT_TRUE(told->id && told->made && told->begun && told->pid && told->reported &&
                    told->finished);
        EXPECT_GT(call, withOldStore ? 50 : 80);
    }

    std::string memory;
    Told* told = nullptr;
};

TEST_P(Faults, LeaveTheOldRecordOrTheNewOneInANewStore) {
    Sweep(false);
}

TEST_P(Faults, LeaveTheOldRecordOrTheNewOneInAStoreWithRecords) {
    Sweep(true);
}

INSTANTIATE_TEST_SUITE_P(Of, Faults, ::testing::Values(Fault::kError, Fault::kFull, Fault::kKill),
                         [](const auto& row) {
                             return row.param == Fault::kKill   ? "Kill"
                                    : row.param == Fault::kFull ? "Full"
                                                                : "Error";
                         });

}  // namespace
