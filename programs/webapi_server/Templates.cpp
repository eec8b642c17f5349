#include "programs/webapi_server/Templates.h"

#include <signal.h>
#include <sys/socket.h>
#include <sys/wait.h>
#include <syslog.h>
#include <unistd.h>

#include <algorithm>

#include "programs/webapi_server/Clock.h"

namespace {

constexpr long long kMostPreparing = 60000;
constexpr long long kMostPending = 20000;
constexpr long long kSoundLife = 10000;
constexpr long long kFirstPause = 100;
constexpr int kMostDoublings = 7;
constexpr long long kMostEnding = 2000;

}  // namespace

Templates::Templates(const Poller& poller, const Inherited& inherited, TemplateEvents& events)
    : poller_(poller), inherited_(inherited), events_(events) {}

Templates::~Templates() {
    for (Handle& handle : all_) {
        Drop(handle);
    }
}

void Templates::Reload(const char* reason, long long now) {
    if (!isWanted_) {
        syslog(LOG_NOTICE, "loads descriptions and libraries: %s", reason);
    }
    isWanted_ = true;
    Tick(now);
}

int Templates::Generation() const {
    for (const Handle& handle : all_) {
        if (handle.state == State::kCurrent) {
            return handle.generation;
        }
    }
    return 0;
}

bool Templates::Order(const StartOrder& order, int workerControl) {
    Handle* const current = Find(State::kCurrent);
    if (current == nullptr ||
        !SendMessage(current->control, &order, sizeof order, workerControl, MSG_DONTWAIT)) {
        return false;
    }
    if (current->pending++ == 0) {
        current->pendingSince = MillisecondsNow();
    }
    return true;
}

void Templates::Tick(long long now) {
    Handle* const preparing = Find(State::kPreparing);
    if (preparing == nullptr) {
        if (isWanted_ && now >= notBefore_) {
            Launch(now);
        }
    } else if (now - preparing->since > kMostPreparing) {
        syslog(LOG_ERR, "loading takes too long");
        (void)kill(preparing->pid, SIGKILL);
        End(*preparing, now);
    }
    for (Handle& handle : all_) {
        if (handle.pending > 0 && now - handle.pendingSince > kMostPending) {
            syslog(LOG_ERR, "the template does not start the workers that it is asked for");
            (void)kill(handle.pid, SIGKILL);
            End(handle, now);
        }
    }
}

void Templates::OnMessage(const Event& event, long long now) {
    Handle& handle = all_[static_cast<size_t>(event.index) % all_.size()];
    if (handle.state == State::kNone || handle.serial != event.serial) {
        return;
    }
    TemplateReport report = {};
    int descriptor = -1;
    const ssize_t got =
        ReceiveMessage(handle.control, &report, sizeof report, &descriptor, MSG_DONTWAIT);
    if (got == sizeof report) {
        OnReport(handle, report, descriptor, now);
    } else if (got >= 0) {
        End(handle, now);
    }
}

void Templates::OnReport(Handle& handle, const TemplateReport& report, int descriptor,
                         long long now) {
    switch (report.kind) {
        case Report::kReady:
            BecomeCurrent(handle, now);
            return;
        case Report::kChanged:
            if (handle.state == State::kCurrent && Find(State::kPreparing) == nullptr) {
                Reload("something has changed", now);
            }
            return;
        case Report::kEnded:
            events_.OnEnded(report);
            return;
        case Report::kStarted:
            events_.OnStarted(report, descriptor);
            break;
        case Report::kFailed:
            events_.OnFailed(report);
            break;
    }
    --handle.pending;
    handle.pendingSince = now;
    if (handle.state == State::kRetiring) {
        Retire(handle);
    }
}

void Templates::Launch(long long now) {
    Handle* const handle = Find(State::kNone);
    int ends[2] = {-1, -1};
    if (handle == nullptr || socketpair(AF_UNIX, SOCK_SEQPACKET | SOCK_CLOEXEC, 0, ends) != 0) {
        notBefore_ = now + kFirstPause;
        return;
    }
    const bool loadsLibraries = !libraryFailed_;
    const pid_t pid = fork();
    if (pid == 0) {
        RunTemplate({{ends[1], inherited_.listener.Get()},
                     inherited_.listener.IsOwn(),
                     &inherited_.slots,
                     &inherited_.settings,
                     &inherited_.original,
                     loadsLibraries});
    }
    (void)close(ends[1]);
    *handle = {State::kPreparing, pid,           ends[0], ++generation_, 0, 0, now,
               ++serial_,         loadsLibraries};
    if (pid < 0 || !poller_.Add(ends[0], {Source::kTemplate, static_cast<int>(handle - all_.data()),
                                          serial_})) {
        syslog(LOG_ERR, "cannot make a template: %m");
        End(*handle, now);
        return;
    }
    isWanted_ = false;
}

void Templates::BecomeCurrent(Handle& handle, long long now) {
    if (!handle.loadsLibraries) {
        syslog(LOG_WARNING, "libraries are loaded when they are called: loading one ahead failed");
    }
    libraryFailed_ = false;
    Handle* const before = Find(State::kCurrent);
    handle.state = State::kCurrent;
    handle.since = now;
    if (before != nullptr) {
        before->state = State::kRetiring;
        Retire(*before);
    }
    events_.OnReady(handle.generation);
}

// Its workers are left to it until it has started all that were ordered; from then
// on they are the master's own children.
void Templates::Retire(Handle& handle) {
    if (handle.pending <= 0) {
        const StartOrder none = {-1, 0};
        (void)SendMessage(handle.control, &none, sizeof none, -1, MSG_DONTWAIT);
        Drop(handle);
    }
}

void Templates::OnChildEnded(pid_t pid) {
    leaving_.erase(std::remove(leaving_.begin(), leaving_.end(), pid), leaving_.end());
}

bool Templates::HaveLeft() {
    const auto isGone = [](pid_t pid) { return waitpid(pid, nullptr, WNOHANG) != 0; };
    leaving_.erase(std::remove_if(leaving_.begin(), leaving_.end(), isGone), leaving_.end());
    return leaving_.empty();
}

// One that is loading notices only when it has done so.
void Templates::EndAll() {
    for (Handle& handle : all_) {
        if (handle.state != State::kNone) {
            handle.pending = 0;
            Retire(handle);
        }
    }
    const long long end = MillisecondsNow() + kMostEnding;
    while (!HaveLeft() && MillisecondsNow() < end) {
        (void)usleep(1000);
    }
    for (const pid_t late : leaving_) {
        (void)kill(late, SIGKILL);
    }
}

void Templates::End(Handle& handle, long long now) {
    const bool wasPreparing = handle.state == State::kPreparing;
    const bool wasCurrent = handle.state == State::kCurrent;
    const int generation = handle.generation;
    if (wasPreparing || wasCurrent) {
        syslog(LOG_ERR, "the template has ended%s", wasPreparing ? " while loading" : "");
        failures_ = wasCurrent && now - handle.since > kSoundLife ? 0 : failures_ + 1;
        libraryFailed_ = libraryFailed_ || wasPreparing;
        notBefore_ = now + (kFirstPause << std::min(failures_, kMostDoublings));
        isWanted_ = true;
    }
    Drop(handle);
    events_.OnLost(generation);
}

void Templates::Drop(Handle& handle) {
    if (handle.control >= 0) {
        poller_.Remove(handle.control);
        (void)close(handle.control);
    }
    if (handle.pid > 0) {
        leaving_.push_back(handle.pid);
    }
    handle = Handle();
}

Templates::Handle* Templates::Find(State state) {
    for (Handle& handle : all_) {
        if (handle.state == state) {
            return &handle;
        }
    }
    return nullptr;
}
