#include "hosts/linux/cgi/UploadSweep.h"

#include <fcntl.h>
#include <signal.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <ctime>
#include <filesystem>
#include <string>
#include <thread>

#include "hosts/linux/cgi/UploadName.h"
#include "tests/host/upload/UploadFixture.h"

namespace {

namespace fs = std::filesystem;

constexpr long kMinute = 60;

// A child process that, once it has ended, is nothing but remains until this goes.
class Ending {
  public:
    explicit Ending(void (*work)() = [] { (void)pause(); })
        : process_(fork()), start_(host::ProcessStart(process_)) {
        if (process_ == 0) {
            work();
            _exit(0);
        }
    }
    ~Ending() {
        (void)kill(process_, SIGKILL);
        (void)waitpid(process_, nullptr, 0);
    }
    Ending(const Ending&) = delete;
    Ending& operator=(const Ending&) = delete;

    pid_t Process() const {
        return process_;
    }
    unsigned long long Start() const {
        return start_;
    }
    void End() const {
        (void)kill(process_, SIGKILL);
        siginfo_t facts = {};
        (void)waitid(P_PID, static_cast<id_t>(process_), &facts, WEXITED | WNOWAIT);
    }

  private:
    pid_t process_;
    unsigned long long start_;
};

class UploadSweep : public ::testing::Test {
  protected:
    // A file that nobody wrote to for that long.
    void Make(const std::string& name, long age) {
        folder_.Write(name, "x");
        Age(name, age);
    }
    void Age(const std::string& name, long age) {
        struct timespec times[2] = {};
        times[0].tv_sec = times[1].tv_sec = time(nullptr) - age;
        ASSERT_EQ(utimensat(AT_FDCWD, Path(name).c_str(), times, AT_SYMLINK_NOFOLLOW), 0);
    }
    void Sweep() {
        host::SweepUploads(Path(""));
    }
    bool IsThere(const std::string& name) const {
        return fs::symlink_status(Path(name)).type() != fs::file_type::not_found;
    }
    std::string Path(const std::string& name) const {
        return folder_.Path(name);
    }
    static std::string Name(pid_t pid, unsigned long long start) {
        return "webapi-upload-" + std::to_string(pid) + "-" + std::to_string(start) +
               "-0123456789abcdef01234567";
    }
    // Of a process that is gone.
    static std::string Abandoned() {
        const pid_t child = fork();
        if (child == 0) {
            _exit(0);
        }
        (void)waitpid(child, nullptr, 0);
        return Name(child, 1);
    }

  private:
    const support::TempFolder folder_;
};

TEST_F(UploadSweep, RemovesAnAbandonedUploadAfterADay) {
    const std::string name = Abandoned();
    Make(name, host::kAbandonedSeconds - kMinute);
    Sweep();
    EXPECT_TRUE(IsThere(name));
    Age(name, host::kAbandonedSeconds + kMinute);
    Age(".webapi-upload-sweep", host::kSweepSeconds + kMinute);
    Sweep();
    EXPECT_FALSE(IsThere(name));
}

TEST_F(UploadSweep, ComesAtMostOnceAnHour) {
    Sweep();
    const std::string name = Abandoned();
    Make(name, 2 * host::kAbandonedSeconds);
    Age(".webapi-upload-sweep", host::kSweepSeconds - kMinute);
    Sweep();
    EXPECT_TRUE(IsThere(name));
    Age(".webapi-upload-sweep", host::kSweepSeconds + kMinute);
    Sweep();
    EXPECT_FALSE(IsThere(name));
}

TEST_F(UploadSweep, LeavesWhatALivingProcessHas) {
    const std::string mine = Name(getpid(), host::ProcessStart(getpid()));
    const std::string reused = Name(getpid(), host::ProcessStart(getpid()) + 1);
    Make(mine, 2 * host::kAbandonedSeconds);
    Make(reused, 2 * host::kAbandonedSeconds);
    Sweep();
    EXPECT_TRUE(IsThere(mine));
    EXPECT_FALSE(IsThere(reused));
}

TEST_F(UploadSweep, TakesAProcessThatItsParentHasNotSeenEndForGone) {
    const Ending child;
    const std::string name = Name(child.Process(), child.Start());
    Make(name, 2 * host::kAbandonedSeconds);
    child.End();
    Sweep();
    EXPECT_FALSE(IsThere(name));
}

TEST_F(UploadSweep, LeavesWhatIsNoUpload) {
    const std::string name = Abandoned();
    const std::string others[] = {"webapi-upload-",
                                  "webapi-upload-1-2-3",
                                  name + "0",
                                  name.substr(0, name.size() - 1),
                                  "x" + name,
                                  "webapi-upload--1-2-0123456789abcdef01234567",
                                  "webapi-upload-x-2-0123456789abcdef01234567",
                                  "webapi-upload-99999999999-2-0123456789abcdef01234567",
                                  "webapi-upload-1-2-0123456789ABCDEF01234567",
                                  "other"};
    for (const std::string& other : others) {
        Make(other, 2 * host::kAbandonedSeconds);
    }
    const std::string target = Abandoned();
    fs::create_symlink(Path("other"), Path(target));
    Age(target, 2 * host::kAbandonedSeconds);
    const std::string folder = Abandoned();
    fs::create_directory(Path(folder));
    Age(folder, 2 * host::kAbandonedSeconds);
    Sweep();
    for (const std::string& other : others) {
        EXPECT_TRUE(IsThere(other)) << other;
    }
    EXPECT_TRUE(IsThere(target));
    EXPECT_TRUE(IsThere(folder));
}

TEST_F(UploadSweep, IsNotLedAstrayByItsMark) {
    const std::string name = Abandoned();
    Make(name, 2 * host::kAbandonedSeconds);
    Make("victim", 2 * host::kAbandonedSeconds);
    fs::create_symlink(Path("victim"), Path(".webapi-upload-sweep"));
    Age(".webapi-upload-sweep", 2 * host::kSweepSeconds);
    Sweep();
    EXPECT_TRUE(IsThere(name));
    EXPECT_LT(fs::last_write_time(Path("victim")),
              fs::file_time_type::clock::now() - std::chrono::hours(24));
    host::SweepUploads(Path("absent"));
}

TEST(UploadName, TellsNoStartOfAProcessThatHasEnded) {
    const Ending child;
    EXPECT_NE(child.Start(), 0u);
    EXPECT_EQ(host::ProcessStart(child.Process()), child.Start());
    child.End();
    EXPECT_EQ(host::ProcessStart(child.Process()), 0u);
}

TEST(UploadName, TellsTheStartOfAProcessWhoseFirstThreadHasEnded) {
    const Ending child([] {
        std::thread([] { (void)pause(); }).detach();
        (void)syscall(SYS_exit, 0);  // of this thread alone
    });
    const unsigned long long start = child.Start();
    for (int look = 0; look < 100; ++look) {
        ASSERT_EQ(host::ProcessStart(child.Process()), start);
        (void)usleep(1000);
    }
}

TEST(UploadName, TellsItsProcess) {
    const std::string name = host::NewUploadName();
    pid_t pid = 0;
    unsigned long long start = 0;
    ASSERT_TRUE(host::ParseUploadName(name, &pid, &start));
    EXPECT_EQ(pid, getpid());
    EXPECT_NE(start, 0u);
    EXPECT_EQ(start, host::ProcessStart(getpid()));
    EXPECT_NE(host::NewUploadName(), name);
    EXPECT_EQ(host::ProcessStart(-1), 0u);
}

class AbandonedUpload : public UploadTest {};

TEST_F(AbandonedUpload, IsSweptByTheFirstUploadOfAnotherDay) {
    const std::string file = Body().File("f", "n", std::string(100000, 'x')).Open();
    SayLength("10000000");
    Serve("", [&] {
        int ends[2];
        ASSERT_EQ(pipe(ends), 0);
        (void)dup2(ends[0], STDIN_FILENO);
        const pid_t victim = fork();
        if (victim == 0) {
            (void)LoadAll(Dir());
            _exit(0);
        }
        ASSERT_GT(write(ends[1], file.data(), 60000), 0);
        while (Left().empty()) {
            (void)usleep(1000);
        }
        (void)kill(victim, SIGKILL);
        (void)waitpid(victim, nullptr, 0);
    });
    ASSERT_EQ(Left().size(), 1u);
    struct timespec old[2] = {};
    for (const std::string& name : {Left()[0], std::string(".webapi-upload-sweep")}) {
        ASSERT_EQ(utimensat(AT_FDCWD, (Dir() + "/" + name).c_str(), old, 0), 0);
    }
    SayLength("");
    Serve(Body().File("f", "n", "").Whole(), [&] {
        const All all = LoadAll(Dir());
        (void)TLIBCSysUnlink(all.files.at("f").c_str());
    });
    EXPECT_TRUE(Left().empty());
}

}  // namespace
