#include "programs/webapi_server/Restore.h"

#include <errno.h>
#include <fcntl.h>
#include <grp.h>
#include <locale.h>
#include <malloc.h>
#include <string.h>
#include <sys/prctl.h>
#include <sys/time.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <charconv>
#include <cstring>
#include <fstream>
#include <iterator>

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

// Where there is no handler the rest means nothing, but for ended children.
bool IsSame(int signal, const struct sigaction& one, const struct sigaction& other) {
    if (one.sa_handler != other.sa_handler) {
        return false;
    }
    if (signal != SIGCHLD && (one.sa_handler == SIG_DFL || one.sa_handler == SIG_IGN)) {
        return true;
    }
    return ((one.sa_flags ^ other.sa_flags) & ~kRestorerFlag) == 0 &&
           IsSame(one.sa_mask, other.sa_mask);
}

// What the system tells of a set of signals: a digit for four of them.
bool Holds(std::string_view digits, int signal) {
    const size_t digit = static_cast<size_t>(signal - 1) / 4 + 1;
    if (digits.size() < digit) {
        return false;
    }
    unsigned bits = 0;
    const char* const at = digits.data() + digits.size() - digit;
    (void)std::from_chars(at, at + 1, bits, 16);
    return (bits >> ((signal - 1) % 4) & 1u) != 0;
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

std::vector<pid_t> Children() {
    const std::string path = "/proc/self/task/" + std::to_string(gettid()) + "/children";
    std::ifstream list(path);
    return std::vector<pid_t>(std::istream_iterator<pid_t>(list), std::istream_iterator<pid_t>());
}

// As background tasks are, and callbacks of before. One that a method has just begun
// may be about to be.
bool IsDetached(pid_t child) {
    constexpr int kMostMilliseconds = 100;
    for (int waited = 0; waited < kMostMilliseconds; ++waited) {
        const pid_t session = getsid(child);
        if (session == child || session < 0) {
            return true;
        }
        (void)usleep(1000);
    }
    return false;
}

void EndChildren(pid_t spared, std::vector<std::string>* changes) {
    pid_t ended = 0;
    while ((ended = waitpid(-1, nullptr, WNOHANG)) > 0) {
    }
    if (ended < 0) {
        return;
    }
    for (const pid_t child : Children()) {
        if (child != spared && !IsDetached(child)) {
            (void)kill(child, SIGKILL);
            (void)waitpid(child, nullptr, 0);
            changes->emplace_back("a child still runs");
        }
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
      threads_(0),
      taskName_(),
      programName_(program_invocation_name),
      descriptors_(hostFolder) {
    (void)status_.Read();
    told_ = Tell();
    threads_ = status_.Number("Threads");
    RecordSignals();
    (void)sigprocmask(SIG_SETMASK, nullptr, &blocked_);
    for (int which = 0; which < RLIM_NLIMITS; ++which) {
        (void)getrlimit(static_cast<__rlimit_resource_t>(which), &limits_[which]);
    }
    (void)prctl(PR_GET_NAME, taskName_);
}

// The others are as they are when nobody has asked for anything else.
void ProcessState::RecordSignals() {
    const std::string_view ignored = status_.Field("SigIgn");
    const std::string_view caught = status_.Field("SigCgt");
    for (int number = 1; number < NSIG; ++number) {
        const bool isCaught = caught.empty() || Holds(caught, number);
        if (isCaught || number == SIGCHLD || Holds(ignored, number)) {
            (void)sigaction(number, nullptr, &actions_[number]);
        }
        if (isCaught || number == SIGCHLD) {
            watched_.push_back(number);
        }
    }
}

ProcessState::~ProcessState() {
    if (folder_ >= 0) {
        (void)close(folder_);
    }
}

ProcessState::Told ProcessState::Tell() const {
    const auto field = [this](const char* name) { return std::string(status_.Field(name)); };
    return {field("Umask"), field("Uid") + field("Gid") + field("Groups"), field("SigBlk"),
            field("SigIgn") + field("SigCgt")};
}

long long ProcessState::PrivateKiB() const {
    return status_.Number("RssAnon");
}

void ProcessState::ReturnMemory() {
    (void)malloc_trim(0);
    (void)status_.Read();
}

// What the system tells as before is as before; the rest is looked at one by one.
std::vector<std::string> ProcessState::Restore(pid_t spared) {
    std::vector<std::string> changes;
    (void)status_.Read();
    const Told now = Tell();
    StopTimers(&changes);
    RestoreSignals(now, &changes);
    if (now.blocked.empty() || now.blocked != told_.blocked) {
        RestoreBlocked(&changes);
    }
    // Whatever comes next may want a descriptor.
    RestoreLimits(&changes);
    descriptors_.Restore(&changes);
    streams_.Restore(&changes);
    RestoreFolder(&changes);
    if (now.mask.empty() || now.mask != told_.mask) {
        RestoreMask(&changes);
    }
    if (getpriority(PRIO_PROCESS, 0) != nice_) {
        (void)setpriority(PRIO_PROCESS, 0, nice_);
        changes.emplace_back("the priority is another");
    }
    RestoreLocale(&changes);
    if (now.ids.empty() || now.ids != told_.ids) {
        RestoreIds(&changes);
    }
    RestoreName();
    EndChildren(spared, &changes);
    // One that has just been waited for may have been counted still.
    if (status_.Number("Threads") > threads_ && status_.Read() &&
        status_.Number("Threads") > threads_) {
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

void ProcessState::RestoreMask(std::vector<std::string>* changes) const {
    if (FileMask() != mask_) {
        (void)umask(mask_);
        changes->emplace_back("the file mode mask is another");
    }
}

void ProcessState::RestoreSignal(int number, std::vector<std::string>* changes) const {
    struct sigaction action = {};
    if (sigaction(number, nullptr, &action) == 0 && !IsSame(number, action, actions_[number])) {
        (void)sigaction(number, &actions_[number], nullptr);
        changes->push_back("signal " + std::to_string(number) + " is handled otherwise");
    }
}

// The system tells which signals are ignored and which have a handler, not what the
// handler is, nor what else is to happen when a child ends. The C library keeps two
// signals to itself: of those nothing is known, then and now.
void ProcessState::RestoreSignals(const Told& now, std::vector<std::string>* changes) {
    if (!now.actions.empty() && now.actions == told_.actions) {
        for (const int number : watched_) {
            RestoreSignal(number, changes);
        }
        return;
    }
    for (int number = 1; number < NSIG; ++number) {
        RestoreSignal(number, changes);
    }
    if (status_.Read()) {
        told_.actions = Tell().actions;
    }
}

void ProcessState::RestoreBlocked(std::vector<std::string>* changes) const {
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

bool ProcessState::Ids::operator==(const Ids& other) const {
    return std::equal(user, user + 3, other.user) && std::equal(group, group + 3, other.group) &&
           more == other.more;
}

ProcessState::Ids ProcessState::IdsNow() {
    Ids ids = {};
    (void)getresuid(&ids.user[0], &ids.user[1], &ids.user[2]);
    (void)getresgid(&ids.group[0], &ids.group[1], &ids.group[2]);
    const int count = getgroups(0, nullptr);
    ids.more.resize(count > 0 ? static_cast<size_t>(count) : 0);
    const int filled = getgroups(static_cast<int>(ids.more.size()), ids.more.data());
    ids.more.resize(filled > 0 ? static_cast<size_t>(filled) : 0);
    return ids;
}

void ProcessState::RestoreIds(std::vector<std::string>* changes) const {
    const Ids now = IdsNow();
    if (now == ids_) {
        return;
    }
    // The user's comes first: without it there is no right to the groups'.
    const bool back = setresuid(ids_.user[0], ids_.user[1], ids_.user[2]) == 0 &&
                      setresgid(ids_.group[0], ids_.group[1], ids_.group[2]) == 0 &&
                      setgroups(ids_.more.size(), ids_.more.data()) == 0;
    changes->emplace_back(back ? "the user or group is another"
                               : "the user or group is another, for good");
}

// The framework names the process after its request, and shortens the argument a
// little each time that it puts its name back.
void ProcessState::RestoreName() const {
    std::memcpy(program_invocation_name, programName_.data(), programName_.size());
    (void)prctl(PR_SET_NAME, taskName_);
}
