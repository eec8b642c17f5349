#include "programs/webapi_server/Restore.h"

#include <errno.h>
#include <fcntl.h>
#include <locale.h>
#include <string.h>
#include <sys/prctl.h>
#include <sys/time.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstring>

namespace {

constexpr int kTimers[] = {ITIMER_REAL, ITIMER_VIRTUAL, ITIMER_PROF};

struct stat FactsOf(const char* path) {
    struct stat facts = {};
    (void)stat(path, &facts);
    return facts;
}

mode_t FileMask() {
    const mode_t mask = umask(0);
    (void)umask(mask);
    return mask;
}

// The system knows of that much of a set; what the C library shows behind it is
// of no meaning.
bool IsSame(const sigset_t& one, const sigset_t& other) {
    return std::memcmp(&one, &other, _NSIG / 8) == 0;
}

// The C library adds a flag of its own to what is put back.
constexpr int kRestorerFlag = 0x04000000;

bool IsSame(const struct sigaction& one, const struct sigaction& other) {
    return one.sa_sigaction == other.sa_sigaction &&
           ((one.sa_flags ^ other.sa_flags) & ~kRestorerFlag) == 0 &&
           IsSame(one.sa_mask, other.sa_mask);
}

bool IsSame(const struct rlimit& one, const struct rlimit& other) {
    return one.rlim_cur == other.rlim_cur && one.rlim_max == other.rlim_max;
}

bool IsRunning(const struct itimerval& timer) {
    return timer.it_value.tv_sec != 0 || timer.it_value.tv_usec != 0;
}

void StopTimers(std::vector<std::string>* changes) {
    for (const int which : kTimers) {
        struct itimerval timer = {};
        if (getitimer(static_cast<__itimer_which_t>(which), &timer) == 0 && IsRunning(timer)) {
            const struct itimerval none = {};
            (void)setitimer(static_cast<__itimer_which_t>(which), &none, nullptr);
            changes->emplace_back("a timer runs");
        }
    }
}

// Those that still run are background tasks and callbacks.
void ReapChildren() {
    while (waitpid(-1, nullptr, WNOHANG) > 0) {
    }
}

}  // namespace

ProcessState::ProcessState(const std::string& hostFolder)
    : folder_(open(".", O_PATH | O_DIRECTORY | O_CLOEXEC)),
      folderFacts_(FactsOf(".")),
      mask_(FileMask()),
      actions_(),
      blocked_(),
      nice_(getpriority(PRIO_PROCESS, 0)),
      limits_(),
      locale_(setlocale(LC_ALL, nullptr)),
      ids_(IdsNow()),
      threadFolder_(open("/proc/self/task", O_PATH | O_DIRECTORY | O_CLOEXEC)),
      threads_(Threads()),
      taskName_(),
      programName_(program_invocation_name),
      descriptors_(hostFolder) {
    for (int number = 1; number < NSIG; ++number) {
        (void)sigaction(number, nullptr, &actions_[number]);
    }
    (void)sigprocmask(SIG_SETMASK, nullptr, &blocked_);
    for (int which = 0; which < RLIM_NLIMITS; ++which) {
        (void)getrlimit(static_cast<__rlimit_resource_t>(which), &limits_[which]);
    }
    (void)prctl(PR_GET_NAME, taskName_);
}

ProcessState::~ProcessState() {
    if (folder_ >= 0) {
        (void)close(folder_);
    }
    if (threadFolder_ >= 0) {
        (void)close(threadFolder_);
    }
}

// Each thread is a folder in that one.
nlink_t ProcessState::Threads() const {
    struct stat facts = {};
    (void)fstat(threadFolder_, &facts);
    return facts.st_nlink;
}

std::vector<std::string> ProcessState::Restore() {
    std::vector<std::string> changes;
    StopTimers(&changes);
    RestoreSignals(&changes);
    // Whatever comes next may want a descriptor.
    RestoreLimits(&changes);
    descriptors_.Restore(&changes);
    streams_.Restore(&changes);
    RestoreFolder(&changes);
    if (FileMask() != mask_) {
        (void)umask(mask_);
        changes.emplace_back("the file mode mask is another");
    }
    if (getpriority(PRIO_PROCESS, 0) != nice_) {
        (void)setpriority(PRIO_PROCESS, 0, nice_);
        changes.emplace_back("the priority is another");
    }
    RestoreLocale(&changes);
    RestoreIds(&changes);
    RestoreName();
    ReapChildren();
    if (Threads() > threads_) {
        changes.emplace_back("a thread still runs");
    }
    return changes;
}

void ProcessState::RestoreFolder(std::vector<std::string>* changes) const {
    const struct stat facts = FactsOf(".");
    if (facts.st_dev != folderFacts_.st_dev || facts.st_ino != folderFacts_.st_ino) {
        (void)fchdir(folder_);
        changes->emplace_back("the working directory is another");
    }
}

// The C library keeps two signals to itself: of those nothing is known, then and
// now.
void ProcessState::RestoreSignals(std::vector<std::string>* changes) const {
    for (int number = 1; number < NSIG; ++number) {
        struct sigaction action = {};
        if (sigaction(number, nullptr, &action) == 0 && !IsSame(action, actions_[number])) {
            (void)sigaction(number, &actions_[number], nullptr);
            changes->push_back("signal " + std::to_string(number) + " is handled otherwise");
        }
    }
    sigset_t blocked;
    (void)sigemptyset(&blocked);
    (void)sigprocmask(SIG_SETMASK, &blocked_, &blocked);
    if (!IsSame(blocked, blocked_)) {
        changes->emplace_back("other signals are blocked");
    }
}

void ProcessState::RestoreLimits(std::vector<std::string>* changes) const {
    for (int which = 0; which < RLIM_NLIMITS; ++which) {
        const auto resource = static_cast<__rlimit_resource_t>(which);
        struct rlimit limit = {};
        if (getrlimit(resource, &limit) == 0 && !IsSame(limit, limits_[which])) {
            (void)setrlimit(resource, &limits_[which]);
            changes->push_back("limit " + std::to_string(which) + " of resources is another");
        }
    }
}

// Of the C library for all threads and for this one, and of the C++ library, in
// the order in which each leaves the next alone.
void ProcessState::RestoreLocale(std::vector<std::string>* changes) const {
    bool changed = uselocale(LC_GLOBAL_LOCALE) != LC_GLOBAL_LOCALE;
    if (!(std::locale() == streamLocale_)) {
        (void)std::locale::global(streamLocale_);
        changed = true;
    }
    if (setlocale(LC_ALL, nullptr) != locale_) {
        (void)setlocale(LC_ALL, locale_.c_str());
        changed = true;
    }
    if (changed) {
        changes->emplace_back("the locale is another");
    }
}

ProcessState::Ids ProcessState::IdsNow() {
    Ids ids = {};
    (void)getresuid(&ids.user[0], &ids.user[1], &ids.user[2]);
    (void)getresgid(&ids.group[0], &ids.group[1], &ids.group[2]);
    return ids;
}

void ProcessState::RestoreIds(std::vector<std::string>* changes) const {
    const Ids now = IdsNow();
    if (std::memcmp(&now, &ids_, sizeof now) == 0) {
        return;
    }
    // The user's comes first: without it there is no right to the group's.
    const bool back = setresuid(ids_.user[0], ids_.user[1], ids_.user[2]) == 0 &&
                      setresgid(ids_.group[0], ids_.group[1], ids_.group[2]) == 0;
    changes->emplace_back(back ? "the user or group is another"
                               : "the user or group is another, for good");
}

// The framework names the process after its request, and shortens the argument a
// little each time that it puts its name back.
void ProcessState::RestoreName() const {
    std::memcpy(program_invocation_name, programName_.data(), programName_.size());
    (void)prctl(PR_SET_NAME, taskName_);
}
