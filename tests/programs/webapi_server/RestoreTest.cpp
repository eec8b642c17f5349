#include "programs/webapi_server/Restore.h"

#include <errno.h>
#include <fcntl.h>
#include <grp.h>
#include <gtest/gtest.h>
#include <locale.h>
#include <pthread.h>
#include <sys/prctl.h>
#include <sys/stat.h>
#include <sys/time.h>
#include <sys/wait.h>
#include <syslog.h>
#include <unistd.h>

#include <cctype>
#include <cwchar>
#include <functional>
#include <iostream>
#include <string>
#include <thread>
#include <vector>

#include "tests/support/Child.h"
#include "tests/support/TempFolder.h"

namespace {

using Strings = std::vector<std::string>;

constexpr int kHighDescriptor = 200;

void Ignore(int) {}

void SetTimer(__itimer_which_t which) {
    const struct itimerval timer = {{0, 0}, {1000, 0}};
    (void)setitimer(which, &timer, nullptr);
}

bool TimersRest() {
    for (const auto which : {ITIMER_REAL, ITIMER_VIRTUAL, ITIMER_PROF}) {
        struct itimerval timer = {};
        if (getitimer(which, &timer) != 0 || timer.it_value.tv_sec != 0) {
            return false;
        }
    }
    return true;
}

struct sigaction ActionOf(int signal) {
    struct sigaction action = {};
    (void)sigaction(signal, nullptr, &action);
    return action;
}

bool IsBlocked(int signal) {
    sigset_t blocked;
    (void)sigprocmask(SIG_SETMASK, nullptr, &blocked);
    return sigismember(&blocked, signal) == 1;
}

void Block(int signal) {
    sigset_t set;
    (void)sigemptyset(&set);
    (void)sigaddset(&set, signal);
    (void)sigprocmask(SIG_BLOCK, &set, nullptr);
}

mode_t FileMask() {
    const mode_t mask = umask(0);
    (void)umask(mask);
    return mask;
}

std::string Folder() {
    char path[4096] = "";
    return getcwd(path, sizeof path) != nullptr ? path : "";
}

bool IsOpen(int descriptor) {
    return fcntl(descriptor, F_GETFD) >= 0;
}

void Open(int descriptor) {
    const int file = open("/dev/null", O_RDWR);
    (void)dup2(file, descriptor);
    (void)close(file);
}

rlim_t Limit(__rlimit_resource_t resource) {
    struct rlimit limit = {};
    (void)getrlimit(resource, &limit);
    return limit.rlim_cur;
}

void LowerLimit(__rlimit_resource_t resource, rlim_t value) {
    struct rlimit limit = {};
    (void)getrlimit(resource, &limit);
    limit.rlim_cur = value;
    (void)setrlimit(resource, &limit);
}

// What a method may leave behind, what is said of it, and how one sees that it is
// as it was.
struct Change {
    const char* name;
    std::function<void()> make;
    const char* words;
    std::function<bool()> isBack;
};

const Change kChanges[] = {
    {"the working directory", [] { (void)!chdir("/proc"); }, "the working directory",
     [] { return Folder() == "/"; }},
    {"the file mode mask", [] { (void)umask(0111); }, "file mode mask",
     [] { return FileMask() == 027; }},
    {"a handler", [] { (void)signal(SIGUSR2, Ignore); }, "signal 12",
     [] { return ActionOf(SIGUSR2).sa_handler == SIG_DFL; }},
    {"an ignored signal", [] { (void)signal(SIGCHLD, SIG_IGN); }, "signal 17",
     [] { return ActionOf(SIGCHLD).sa_handler == SIG_DFL; }},
    {"a signal that is no more ignored", [] { (void)signal(SIGPIPE, SIG_DFL); }, "signal 13",
     [] { return ActionOf(SIGPIPE).sa_handler == SIG_IGN; }},
    {"a handler of a real-time signal", [] { (void)signal(SIGRTMAX, Ignore); }, "signal 64",
     [] { return ActionOf(SIGRTMAX).sa_handler == SIG_DFL; }},
    {"what becomes of ended children",
     [] {
         struct sigaction action = {};
         action.sa_flags = SA_NOCLDWAIT;
         (void)sigaction(SIGCHLD, &action, nullptr);
     },
     "signal 17", [] { return (ActionOf(SIGCHLD).sa_flags & SA_NOCLDWAIT) == 0; }},
    {"a blocked signal", [] { Block(SIGTERM); }, "blocked", [] { return !IsBlocked(SIGTERM); }},
    {"priority", [] { (void)setpriority(PRIO_PROCESS, 0, 7); }, "priority",
     [] { return getpriority(PRIO_PROCESS, 0) == (geteuid() == 0 ? 0 : 7); }},
    {"the locale", [] { (void)setlocale(LC_ALL, "C.UTF-8"); }, "locale",
     [] { return setlocale(LC_ALL, nullptr) == std::string("C"); }},
    {"the thread's locale", [] { (void)uselocale(newlocale(LC_ALL_MASK, "C.UTF-8", nullptr)); },
     "locale", [] { return uselocale(nullptr) == LC_GLOBAL_LOCALE; }},
    {"the locale of C++", [] { (void)std::locale::global(std::locale("C.UTF-8")); }, "locale",
     [] { return std::locale() == std::locale::classic(); }},
    {"an open descriptor", [] { (void)!open("/dev/null", O_RDONLY); }, "(/dev/null) is still open",
     [] { return true; }},
    {"a high open descriptor", [] { Open(kHighDescriptor); }, "descriptor 200 (/dev/null)",
     [] { return !IsOpen(kHighDescriptor); }},
    {"a closed standard error", [] { (void)close(STDERR_FILENO); }, "descriptor 2 is closed",
     [] { return IsOpen(STDERR_FILENO); }},
    {"another standard error", [] { Open(STDERR_FILENO); }, "descriptor 2 is closed or another",
     [] {
         struct stat facts = {};
         struct stat null = {};
         return fstat(STDERR_FILENO, &facts) == 0 && stat("/dev/null", &null) == 0 &&
                facts.st_rdev != null.st_rdev;
     }},
    {"an alarm", [] { (void)alarm(1000); }, "a timer", TimersRest},
    {"a timer of processor time", [] { SetTimer(ITIMER_PROF); }, "a timer", TimersRest},
    {"a limit of files", [] { LowerLimit(RLIMIT_FSIZE, 4096); }, "limit 1 of resources",
     [] { return Limit(RLIMIT_FSIZE) != 4096; }},
    {"a limit of descriptors", [] { LowerLimit(RLIMIT_NOFILE, 0); }, "limit 7 of resources",
     [] { return Limit(RLIMIT_NOFILE) > 0; }},
    {"an unbuffered standard output", [] { (void)setvbuf(stdout, nullptr, _IONBF, 0); },
     "standard output has another buffer", [] { return true; }},
    {"a format of std::cout", [] { std::cout << std::hex; }, "stream of C++",
     [] { return (std::cout.flags() & std::ios::hex) == 0; }},
    {"exceptions of std::cin", [] { std::cin.exceptions(std::ios::eofbit); }, "stream of C++",
     [] { return std::cin.exceptions() == std::ios::goodbit; }},
    {"another buffer of std::cerr", [] { (void)std::cerr.rdbuf(nullptr); }, "stream of C++",
     [] { return std::cerr.rdbuf() != nullptr && std::cerr.good(); }},
};

// What is told of a failure on standard output would not outlast the next Restore.
class ToStandardError : public testing::EmptyTestEventListener {
    void OnTestPartResult(const testing::TestPartResult& result) override {
        const std::string text = std::string(result.summary()) + "\n";
        (void)!write(STDERR_FILENO, text.data(), text.size());
    }
};

void IgnoreOtherwise(int) {}

// Runs in a child, with what a worker has.
int InWorker(const std::function<void(ProcessState*)>& body) {
    const support::ChildResult result = support::InChild([&] {
        (void)!chdir("/");
        (void)umask(027);
        (void)signal(SIGPIPE, SIG_IGN);
        (void)signal(SIGUSR1, Ignore);
        (void)setlocale(LC_ALL, "C");
        testing::UnitTest::GetInstance()->listeners().Append(new ToStandardError);
        ProcessState state("/nowhere");
        body(&state);
        return 0;
    });
    return result.status;
}

std::string Joined(const Strings& changes) {
    std::string joined;
    for (const std::string& change : changes) {
        joined += change + "; ";
    }
    return joined;
}

// A row's name as gtest wants it.
std::string Named(const std::string& words) {
    std::string name;
    for (const char letter : words) {
        name += std::isalnum(static_cast<unsigned char>(letter)) != 0 ? letter : '_';
    }
    return name;
}

}  // namespace

class ProcessStateChange : public testing::TestWithParam<Change> {};

TEST_P(ProcessStateChange, IsFoundAndPutBack) {
    const Change& change = GetParam();
    EXPECT_EQ(0, InWorker([&](ProcessState* state) {
                  EXPECT_EQ(Strings(), state->Restore());
                  change.make();
                  const Strings changes = state->Restore();
                  EXPECT_EQ(1u, changes.size()) << Joined(changes);
                  EXPECT_NE(std::string::npos, Joined(changes).find(change.words))
                      << Joined(changes);
                  EXPECT_TRUE(change.isBack());
                  if (geteuid() == 0 || std::string(change.name) != "priority") {
                      EXPECT_EQ(Strings(), state->Restore());
                  }
              }));
}

INSTANTIATE_TEST_SUITE_P(EachKind, ProcessStateChange, testing::ValuesIn(kChanges),
                         [](const auto& row) { return Named(row.param.name); });

TEST(ProcessState, FindsAnotherHandlerInThePlaceOfOne) {
    EXPECT_EQ(0, InWorker([](ProcessState* state) {
                  (void)signal(SIGUSR1, IgnoreOtherwise);
                  EXPECT_EQ(Strings{"signal 10 is handled otherwise"}, state->Restore());
                  EXPECT_EQ(Ignore, ActionOf(SIGUSR1).sa_handler);
              }));
}

// The C library handles a signal of its own once there has been a thread.
TEST(ProcessState, SaysNothingOfAThreadThatHasEnded) {
    EXPECT_EQ(0, InWorker([](ProcessState* state) {
                  std::thread([] {}).join();
                  EXPECT_EQ(Strings(), state->Restore());
                  (void)signal(SIGUSR2, Ignore);
                  EXPECT_EQ(Strings{"signal 12 is handled otherwise"}, state->Restore());
              }));
}

TEST(ProcessState, FindsAStreamThatCannotBePutBack) {
    EXPECT_EQ(0, InWorker([](ProcessState* state) {
                  (void)std::fclose(stdin);
                  EXPECT_EQ(Strings{"standard input is spoilt"}, state->Restore());
              }));
    EXPECT_EQ(0, InWorker([](ProcessState* state) {
                  (void)fwide(stdin, 1);
                  EXPECT_EQ(Strings{"standard input is spoilt"}, state->Restore());
              }));
}

TEST(ProcessState, FindsAThreadThatStillRuns) {
    EXPECT_EQ(0, InWorker([](ProcessState* state) {
                  pthread_t thread;
                  ASSERT_EQ(0, pthread_create(
                                   &thread, nullptr,
                                   [](void*) -> void* {
                                       (void)pause();
                                       return nullptr;
                                   },
                                   nullptr));
                  EXPECT_EQ(Strings{"a thread still runs"}, state->Restore());
              }));
}

TEST(ProcessState, FindsAnotherUser) {
    if (geteuid() != 0) {
        GTEST_SKIP() << "only root may change it";
    }
    EXPECT_EQ(0, InWorker([](ProcessState* state) {
                  ASSERT_EQ(0, setegid(65534));
                  ASSERT_EQ(0, seteuid(65534));
                  EXPECT_EQ(Strings{"the user or group is another"}, state->Restore());
                  EXPECT_EQ(0u, geteuid());
                  EXPECT_EQ(0u, getegid());
              }));
}

TEST(ProcessState, FindsMoreGroups) {
    if (geteuid() != 0) {
        GTEST_SKIP() << "only root may change them";
    }
    EXPECT_EQ(0, InWorker([](ProcessState* state) {
                  const int before = getgroups(0, nullptr);
                  const gid_t more[] = {65533, 65534};
                  ASSERT_EQ(0, setgroups(2, more));
                  EXPECT_EQ(Strings{"the user or group is another"}, state->Restore());
                  EXPECT_EQ(before, getgroups(0, nullptr));
              }));
}

TEST(ProcessState, TellsHowMuchMemoryThereIs) {
    EXPECT_EQ(0, InWorker([](ProcessState* state) {
                  const long long before = state->PrivateKiB();
                  EXPECT_GT(before, 0);
                  const std::vector<char> taken(size_t{8} << 20, 'x');
                  EXPECT_EQ(Strings(), state->Restore());
                  EXPECT_GE(state->PrivateKiB(), before + 8000 + taken[0] - 'x');
              }));
}

TEST(ProcessState, ClosesWhatItCannotCount) {
    EXPECT_EQ(0, InWorker([](ProcessState* state) {
                  int last = 0;
                  for (int next = 0; (next = dup(STDOUT_FILENO)) >= 0;) {
                      last = next;
                  }
                  EXPECT_EQ(Strings{"the open descriptors cannot be counted"}, state->Restore());
                  EXPECT_FALSE(IsOpen(last));
                  EXPECT_EQ(Strings(), state->Restore());
              }));
}

TEST(ProcessState, ToleratesDescriptorsOfTheHostsFolder) {
    const support::TempFolder folder;
    EXPECT_EQ(0, support::InChild([&] {
                     ProcessState state(folder.Path("store"));
                     (void)mkdir(folder.Path("store").c_str(), 0700);
                     const int own = creat(folder.Path("store/db").c_str(), 0600);
                     EXPECT_EQ(Strings(), state.Restore());
                     EXPECT_TRUE(IsOpen(own));
                     const int other = creat(folder.Path("store.txt").c_str(), 0600);
                     EXPECT_EQ(1u, state.Restore().size());
                     EXPECT_FALSE(IsOpen(other));
                     return 0;
                 }).status);
}

TEST(ProcessState, SaysNothingOfWhatEveryRequestLeaves) {
    EXPECT_EQ(0, InWorker([](ProcessState* state) {
                  (void)prctl(PR_SET_NAME, "renamed");
                  openlog("renamed", LOG_PID | LOG_NDELAY, LOG_USER);
                  std::cin.setstate(std::ios::eofbit);
                  const pid_t child = fork();
                  if (child == 0) {
                      _exit(0);
                  }
                  siginfo_t ended = {};
                  ASSERT_EQ(0, waitid(P_PID, static_cast<id_t>(child), &ended, WEXITED | WNOWAIT));
                  EXPECT_EQ(Strings(), state->Restore());
                  char name[17] = "";
                  (void)prctl(PR_GET_NAME, name);
                  EXPECT_STRNE("renamed", name);
                  EXPECT_TRUE(std::cin.good());
                  EXPECT_EQ(-1, waitpid(child, nullptr, WNOHANG));
                  EXPECT_EQ(ECHILD, errno);
              }));
}

// As background tasks do, perhaps a moment later.
TEST(ProcessState, LetsAChildOfASessionOfItsOwnBe) {
    EXPECT_EQ(0, InWorker([](ProcessState* state) {
                  const pid_t child = fork();
                  if (child == 0) {
                      (void)usleep(10000);
                      (void)setsid();
                      (void)pause();
                      _exit(0);
                  }
                  EXPECT_EQ(Strings(), state->Restore());
                  EXPECT_EQ(0, kill(child, SIGKILL));
                  EXPECT_EQ(child, waitpid(child, nullptr, 0));
              }));
}

// A callback's process, which has not come to its own session yet.
TEST(ProcessState, SparesTheChildThatItIsTold) {
    EXPECT_EQ(0, InWorker([](ProcessState* state) {
                  const pid_t child = fork();
                  if (child == 0) {
                      (void)pause();
                      _exit(0);
                  }
                  EXPECT_EQ(Strings(), state->Restore(child));
                  EXPECT_EQ(0, kill(child, SIGKILL));
                  EXPECT_EQ(child, waitpid(child, nullptr, 0));
              }));
}

TEST(ProcessState, EndsAChildThatStillRuns) {
    EXPECT_EQ(0, InWorker([](ProcessState* state) {
                  const pid_t child = fork();
                  if (child == 0) {
                      (void)pause();
                      _exit(0);
                  }
                  EXPECT_EQ(Strings{"a child still runs"}, state->Restore());
                  EXPECT_EQ(-1, kill(child, 0));
              }));
}

TEST(ProcessState, PutsBackTheArgumentThatTheFrameworkWritesTo) {
    EXPECT_EQ(0, InWorker([](ProcessState* state) {
                  const std::string before = program_invocation_name;
                  memset(program_invocation_name, 0, before.size());
                  EXPECT_EQ(Strings(), state->Restore());
                  EXPECT_EQ(before, program_invocation_name);
              }));
}

TEST(ProcessState, DropsWhatIsLeftInTheBuffers) {
    EXPECT_EQ(0, support::InChild(
                     [] {
                         ProcessState state("/nowhere");
                         EXPECT_EQ('o', std::getchar());
                         (void)std::fputs("half a reply", stdout);
                         EXPECT_EQ(Strings(), state.Restore());
                         EXPECT_EQ(EOF, std::getchar());
                         EXPECT_EQ(Strings(), state.Restore());
                         EXPECT_EQ(0, std::feof(stdin));
                         return 0;
                     },
                     "of a request")
                     .status);
}
