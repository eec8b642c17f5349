#include <fcntl.h>
#include <sched.h>
#include <signal.h>
#include <sqlite3.h>
#include <sys/mount.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstring>
#include <filesystem>
#include <fstream>

#include "TaskRoot.h"
#include "platform/Paths.h"

namespace fs = std::filesystem;

namespace {

class Trouble : public TaskRoot {
  public:
    static std::string Content(const std::string& path) {
        std::ifstream file(path, std::ios::binary);
        return std::string(std::istreambuf_iterator<char>(file), {});
    }
    static void Overwrite(const std::string& content) {
        std::ofstream(Database(), std::ios::binary) << content;
    }

    static void StoreOne() {
        ASSERT_EQ(InProcess([] {
                      ORB::Task task("anna", "one");
                      return Begin(&task) && Report(&task) ? 0 : 1;
                  }),
                  0);
    }

    // Nobody gets anything, and the log says why.
    static void ExpectRefused(const std::string& reason) {
        EXPECT_FALSE(ORB::Task("anna", "one").isValid());
        EXPECT_TRUE(WasLogged(reason)) << Logged();
        EXPECT_FALSE(ORB::TaskUtil::checkTaskExists("anna", "one"));
        EXPECT_EQ(Id("x"), "");
        EXPECT_EQ(ORB::TaskMgr("anna").getAllTaskId(nullptr), Json::Value(Json::arrayValue));
    }

    // In a process whose mounts are its own. Where that is not permitted the test
    // fails: it needs root, or user namespaces.
    static void WithMounts(const std::function<void()>& body) {
        const int uid = static_cast<int>(getuid());
        const int status = InProcess([&] {
            const int spaces = uid == 0 ? CLONE_NEWNS : CLONE_NEWNS | CLONE_NEWUSER;
            if (unshare(spaces) != 0) {
                ADD_FAILURE() << "no mounts of its own: " << strerror(errno)
                              << "; a full and a read-only file system are NOT tested here";
                return 1;
            }
            if (uid != 0) {
                std::ofstream("/proc/self/uid_map") << "0 " << uid << " 1";
            }
            EXPECT_EQ(mount("none", "/", nullptr, MS_REC | MS_PRIVATE, nullptr), 0);
            if (!::testing::Test::HasFailure()) {
                body();
            }
            return 0;
        });
        EXPECT_EQ(status, 0);
    }

    static void MountSmall() {
        fs::create_directories(TALO_TASK_DIR);
        ASSERT_EQ(mount("none", TALO_TASK_DIR, "tmpfs", 0, "size=256k,mode=0700"), 0);
    }
};

// In a program of its own: what a process has opened once it finds again, also
// when the file is gone.
TEST_F(Trouble, WithAMissingModuleIsReported) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    const auto lookForModule = [] {
        const fs::path module = fs::path(TALO_MODULE_DIR) / "talo-task.so";
        fs::remove(module);
        ExpectRefused("no task can be used");
        EXPECT_FALSE(ORB::TaskMgr("anna").isValid());
        std::ofstream(module) << "no library";
        ExpectRefused("no task can be used");
        fs::remove(module);
        ClearTasks();
        EXPECT_TRUE(ORB::Task("anna", "one").isValid());
        _exit(HasFailure() ? 1 : 0);
    };
    EXPECT_EXIT(lookForModule(), ::testing::ExitedWithCode(0), "");
}

TEST_F(Trouble, WithAFolderThatOthersMayWriteIsReported) {
    fs::create_directories(TALO_TASK_DIR);
    ASSERT_EQ(chmod(TALO_TASK_DIR, 0777), 0);
    ExpectRefused("others may write there");
}

TEST_F(Trouble, WithAFileInTheFoldersPlaceIsReported) {
    fs::create_directories(fs::path(TALO_TASK_DIR).parent_path());
    std::ofstream(TALO_TASK_DIR) << "file";
    ExpectRefused("it is no folder");
}

TEST_F(Trouble, WithAFileThatIsNoDatabaseLeavesTheFile) {
    StoreOne();
    fs::remove(Database() + "-wal");
    const std::string garbage(20000, '#');
    Overwrite(garbage);
    ExpectRefused("is damaged, and left as it is");
    EXPECT_EQ(Content(Database()), garbage);
}

TEST_F(Trouble, WithDamagedPagesIsReportedAndTheRestIsLeft) {
    StoreOne();
    Do("PRAGMA wal_checkpoint(TRUNCATE)");
    ASSERT_EQ(InProcess([] { return 0; }), 0);
    std::string content = Content(Database());
    ASSERT_GT(content.size(), 4096u * 3);
    for (size_t at = 4096; at < content.size(); ++at) {
        content[at] = static_cast<char>(at * 7);
    }
    Overwrite(content);
    EXPECT_EQ(InProcess([] {
                  ORB::Task task("anna", "one");
                  EXPECT_FALSE(task.isValid());
                  EXPECT_TRUE(WasLogged("is damaged, and left as it is")) << Logged();
                  return 0;
              }),
              0);
    EXPECT_EQ(Content(Database()), content);
}

TEST_F(Trouble, WithALaterFormatIsReported) {
    StoreOne();
    Do("PRAGMA user_version = 2");
    EXPECT_EQ(InProcess([] {
                  ExpectRefused("has the format 2");
                  return 0;
              }),
              0);
    Do("PRAGMA user_version = 1");
    EXPECT_TRUE(ORB::Task("anna", "one").hasProperty("body"));
}

TEST_F(Trouble, WithAnotherProcesssLockIsReportedAfterTheWait) {
    Configure("task_lock_wait=\"1\"");
    StoreOne();
    ORB::Task early("anna", "one");
    int ends[2];
    ASSERT_EQ(pipe2(ends, O_CLOEXEC), 0);
    const pid_t holder = StartProcess([&] {
        sqlite3* database = nullptr;
        (void)sqlite3_open(Database().c_str(), &database);
        const int begun = sqlite3_exec(database, "BEGIN IMMEDIATE", nullptr, nullptr, nullptr);
        (void)!write(ends[1], begun == SQLITE_OK ? "y" : "n", 1);
        return pause();
    });
    char answer = 0;
    ASSERT_EQ(read(ends[0], &answer, 1), 1);
    EXPECT_EQ(answer, 'y');
    early.beginUpdate();
    (void)early.setProperty("x", 1);
    EXPECT_FALSE(early.endUpdate());
    EXPECT_TRUE(WasLogged("another process has locked it")) << Logged();
    EXPECT_FALSE(early.finish(true));
    EXPECT_FALSE(ORB::Task("anna", "new").isValid());
    // Who only reads is not held up.
    EXPECT_TRUE(ORB::Task("anna", "one").hasProperty("body"));
    ASSERT_EQ(kill(holder, SIGKILL), 0);
    EXPECT_EQ(WaitFor(holder), 1000 + SIGKILL);
    EXPECT_TRUE(early.setProperty("x", 1));
    EXPECT_TRUE(early.hasProperty("body"));
    (void)close(ends[0]);
    (void)close(ends[1]);
}

TEST_F(Trouble, WithAShortLockOnlyTakesLonger) {
    StoreOne();
    int ends[2];
    ASSERT_EQ(pipe2(ends, O_CLOEXEC), 0);
    const pid_t holder = StartProcess([&] {
        sqlite3* database = nullptr;
        (void)sqlite3_open(Database().c_str(), &database);
        (void)sqlite3_exec(database, "BEGIN IMMEDIATE", nullptr, nullptr, nullptr);
        (void)!write(ends[1], "y", 1);
        (void)usleep(300000);
        (void)sqlite3_exec(database, "ROLLBACK", nullptr, nullptr, nullptr);
        return 0;
    });
    char answer = 0;
    ASSERT_EQ(read(ends[0], &answer, 1), 1);
    EXPECT_TRUE(ORB::Task("anna", "one").setProperty("x", 1));
    EXPECT_EQ(WaitFor(holder), 0);
    (void)close(ends[0]);
    (void)close(ends[1]);
}

TEST_F(Trouble, WithoutSpaceLosesNothing) {
    WithMounts([] {
        MountSmall();
        ORB::Task task("anna", "one");
        ASSERT_TRUE(Begin(&task) && task.setProperty("x", 0));
        int stored = 0;
        const auto grow = [&] {
            return task.setProperty("x",
                                    std::string(static_cast<size_t>(1000 + 100 * stored), 'x'));
        };
        while (stored < 2000 && grow()) {
            ++stored;
        }
        EXPECT_LT(stored, 2000);
        EXPECT_TRUE(WasLogged("no space is left") || WasLogged("disk I/O error")) << Logged();
        task.beginUpdate();
        (void)task.setProperty("a", std::string(200000, 'a'));
        (void)task.setProperty("b", 1);
        EXPECT_FALSE(task.endUpdate());
        EXPECT_FALSE(task.hasProperty("b"));
        // What was stored is there, also for a process that comes later.
        EXPECT_EQ(InProcess([&] {
                      EXPECT_FALSE(ORB::Task("anna", "one").hasProperty("b"));
                      const Json::Value x = Stored("one", "x");
                      EXPECT_EQ(x.asString().size(),
                                static_cast<size_t>(1000 + 100 * (stored - 1)));
                      EXPECT_EQ(Stored("one", "auto_remove"), Json::Value(true));
                      return 0;
                  }),
                  0);
        EXPECT_EQ(Ask("PRAGMA integrity_check"), "ok");
        ASSERT_EQ(mount("none", TALO_TASK_DIR, nullptr, MS_REMOUNT, "size=8m"), 0);
        EXPECT_TRUE(task.setProperty("b", 1));
    });
}

TEST_F(Trouble, WithoutAnySpaceMakesNoStore) {
    WithMounts([] {
        MountSmall();
        std::ofstream(TALO_TASK_DIR "/filler") << std::string(1u << 20, 'x');
        EXPECT_FALSE(ORB::Task("anna", "one").isValid());
        EXPECT_NE(Logged(), "");
        fs::remove(TALO_TASK_DIR "/filler");
        EXPECT_TRUE(ORB::Task("anna", "one").isValid());
    });
}

TEST_F(Trouble, WithAReadOnlyFileSystemStoresNothing) {
    StoreOne();
    WithMounts([] {
        ORB::Task early("anna", "one");
        ASSERT_EQ(mount(TALO_TASK_DIR, TALO_TASK_DIR, nullptr, MS_BIND, nullptr), 0);
        ASSERT_EQ(mount("none", TALO_TASK_DIR, nullptr, MS_REMOUNT | MS_BIND | MS_RDONLY, nullptr),
                  0);
        EXPECT_EQ(InProcess([] {
                      ORB::Task task("anna", "one");
                      EXPECT_FALSE(task.isValid() && task.setProperty("x", 1));
                      EXPECT_FALSE(ORB::Task("anna", "new").isValid());
                      EXPECT_TRUE(WasLogged("it can only be read") || WasLogged("unable to open"))
                          << Logged();
                      return 0;
                  }),
                  0);
    });
    EXPECT_TRUE(ORB::Task("anna", "one").hasProperty("body"));
    EXPECT_FALSE(ORB::TaskUtil::checkTaskExists("anna", "new"));
}

TEST_F(Trouble, WithAStoreThatWasReplacedGoesOnInTheNewOne) {
    ORB::Task task("anna", "one");
    ASSERT_TRUE(task.setProperty("x", 1));
    fs::remove_all(TALO_TASK_DIR);
    EXPECT_FALSE(task.setProperty("x", 2));
    EXPECT_TRUE(ORB::Task("anna", "two").setProperty("x", 3));
    EXPECT_EQ(Stored("two", "x"), Json::Value(3));
    EXPECT_FALSE(ORB::TaskUtil::checkTaskExists("anna", "one"));
}

TEST_F(Trouble, LeavesNoDescriptorToOtherPrograms) {
    ASSERT_TRUE(ORB::Task("anna", "one").setProperty("x", 1));
    for (const auto& entry : fs::directory_iterator("/proc/self/fd")) {
        std::error_code gone;
        const std::string target = fs::read_symlink(entry.path(), gone);
        if (target.rfind(TALO_TASK_DIR, 0) == 0) {
            const int number = std::stoi(entry.path().filename());
            EXPECT_NE(fcntl(number, F_GETFD) & FD_CLOEXEC, 0) << target;
        }
    }
}

}  // namespace
