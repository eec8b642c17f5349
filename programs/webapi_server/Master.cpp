#include "programs/webapi_server/Master.h"

#include <errno.h>
#include <signal.h>
#include <sys/signalfd.h>
#include <sys/socket.h>
#include <sys/wait.h>
#include <syslog.h>
#include <unistd.h>

#include <algorithm>
#include <utility>

#include "programs/webapi_server/Clock.h"

namespace {

constexpr int kMostEvents = 64;
constexpr int kMostAccepted = 64;  // in one go
constexpr int kMostCounted = 1024;
constexpr long long kCountPause = 500;
constexpr long long kTick = 100;
constexpr long long kIdleTick = 1000;
constexpr long long kAcceptPause = 100;
constexpr long long kMostDraining = 30000;
constexpr long long kAfterDraining = 2000;
constexpr int kLookAgain = 2;  // who waits while workers do may begin soon
constexpr long long kRefusalLogPause = 10000;

sigset_t SignalsOfMaster() {
    sigset_t signals;
    (void)sigemptyset(&signals);
    for (int signal : {SIGTERM, SIGINT, SIGHUP, SIGCHLD}) {
        (void)sigaddset(&signals, signal);
    }
    return signals;
}

}  // namespace

void HoldSignals(sigset_t* before) {
    const sigset_t signals = SignalsOfMaster();
    (void)sigprocmask(SIG_BLOCK, &signals, before);
}

Master::Master(Listener& listener, const Settings& settings, const OriginalProcess& original)
    : listener_(listener),
      slots_(2 * settings.maxWorkers),
      queue_(settings.queue),
      farewell_(poller_),
      workers_(poller_, slots_, settings, queue_, farewell_),
      templates_(poller_, {listener, slots_, settings, original}, workers_),
      now_(MillisecondsNow()) {
    workers_.SetTemplates(&templates_);
}

Master::~Master() {
    Waiting waiting;
    while (queue_.Take(&waiting)) {
        (void)close(waiting.connection);
    }
    if (signals_ >= 0) {
        (void)close(signals_);
    }
}

bool Master::Run() {
    if (!Begin()) {
        syslog(LOG_ERR, "cannot begin: %m");
        return false;
    }
    syslog(LOG_NOTICE, "started");
    Event events[kMostEvents] = {};
    while (drainUntil_ == 0 || !IsDrained()) {
        const int count = poller_.Wait(events, kMostEvents, MillisecondsToWait());
        now_ = MillisecondsNow();
        for (int index = 0; index < count; ++index) {
            Handle(events[index]);
        }
        // Behind the others: workers may have become idle.
        if (std::exchange(hasClients_, false)) {
            Accept();
        }
        if (now_ >= nextTick_) {
            Tick();
        }
        HandOut();
        if (drainUntil_ == 0 || queue_.Size() > 0) {
            workers_.Grow(now_);
        }
        ShareClients();
    }
    templates_.EndAll();
    ReapChildren();
    syslog(LOG_NOTICE, "ended");
    return true;
}

bool Master::Begin() {
    const sigset_t signals = SignalsOfMaster();
    signals_ = signalfd(-1, &signals, SFD_CLOEXEC | SFD_NONBLOCK);
    isAccepting_ =
        signals_ >= 0 && slots_.IsMapped() && poller_.Add(signals_, {Source::kSignals, 0, 0});
    WatchClients(isAccepting_);
    if (isWatching_) {
        templates_.Reload("start", now_);
    }
    return isWatching_;
}

void Master::WatchClients(bool wanted) {
    if (wanted && !isWatching_) {
        isWatching_ = poller_.AddLastInLine(listener_.Get(), {Source::kListener, 0, 0});
    } else if (!wanted && isWatching_) {
        poller_.Remove(listener_.Get());
        isWatching_ = false;
    }
}

// Who connects wakes one of the workers that wait for it, and the master only where
// there is none: it stands last in line. While the processors have enough to do it does
// not either, and the client waits in the socket for the next worker that is done.
void Master::ShareClients() {
    if (workers_.Follow(now_)) {
        WatchClients(false);
    }
    if (!isWatching_) {
        WatchClients(isAccepting_ && workers_.MayBegin(now_));
    }
    workers_.LetTake(isAccepting_ && queue_.Size() == 0, now_);
}

// A worker that ends may have been woken for a client just then, and one that comes
// back may have left one behind: nobody else is woken for these.
void Master::Handle(const Event& event) {
    switch (event.source) {
        case Source::kListener:
            hasClients_ = true;
            break;
        case Source::kSignals:
            ReadSignals();
            break;
        case Source::kTemplate:
            templates_.OnMessage(event, now_);
            break;
        case Source::kControl:
            workers_.OnControl(event, now_);
            hasClients_ = isWatching_;
            break;
        case Source::kProcess:
            workers_.OnProcess(event, now_);
            hasClients_ = isWatching_;
            break;
        case Source::kFarewell:
            farewell_.OnReadable(event);
            break;
    }
}

void Master::Accept() {
    if (!workers_.MayBegin(now_)) {
        WatchClients(false);
        return;
    }
    for (int count = 0; isAccepting_ && count < kMostAccepted && AcceptOne(); ++count) {
    }
}

// Those in the socket can only be counted by taking them, which wakes somebody for each.
void Master::CountClients() {
    nextCount_ = now_ + kCountPause;
    for (int count = 0; isAccepting_ && count < kMostCounted && AcceptOne(); ++count) {
    }
}

bool Master::AcceptOne() {
    const int connection = accept4(listener_.Get(), nullptr, nullptr, SOCK_CLOEXEC);
    if (connection >= 0) {
        const Waiting waiting = {connection, 0};
        const bool isNext = queue_.Size() == 0;
        if (!(isNext && workers_.HandOver(waiting, now_)) && !queue_.Add(waiting) &&
            !workers_.HandOverAtOnce(waiting, now_)) {
            Refuse(connection);
        }
        return true;
    }
    if (errno == EMFILE || errno == ENFILE || errno == ENOMEM || errno == ENOBUFS) {
        // Who waits stays in the socket's own queue until there is something to spare.
        syslog(LOG_ERR, "cannot accept: %m");
        isAccepting_ = false;
        WatchClients(false);
        acceptNotBefore_ = now_ + kAcceptPause;
    }
    return errno == ECONNABORTED || errno == EINTR;
}

void Master::Refuse(int connection) {
    farewell_.Say(connection, ReplyStatus::kOverloaded, now_);
    ++refusals_;
    if (now_ >= nextRefusalLog_) {
        syslog(LOG_WARNING, "too many requests wait: %d refused", refusals_);
        refusals_ = 0;
        nextRefusalLog_ = now_ + kRefusalLogPause;
    }
}

void Master::HandOut() {
    for (Waiting waiting; queue_.Take(&waiting);) {
        if (!workers_.HandOver(waiting, now_)) {
            queue_.PutBack(waiting);
            return;
        }
    }
}

void Master::ReadSignals() {
    for (struct signalfd_siginfo got = {}; read(signals_, &got, sizeof got) == sizeof got;) {
        if (got.ssi_signo == SIGCHLD) {
            ReapChildren();
        } else if (got.ssi_signo != SIGHUP) {
            StartDraining();
        } else if (drainUntil_ == 0) {
            templates_.Reload("asked for", now_);
        }
    }
}

// Templates, the workers of those that went before them, and what workers left behind.
void Master::ReapChildren() {
    int status = 0;
    for (pid_t pid = 0; (pid = waitpid(-1, &status, WNOHANG)) > 0;) {
        workers_.OnOrphan(pid, status);
        templates_.OnChildEnded(pid);
    }
}

// Whoever has connected is served still; asked a second time, only who can be at once.
void Master::StartDraining() {
    if (drainUntil_ != 0) {
        drainUntil_ = now_;
        return;
    }
    syslog(LOG_NOTICE, "ends after the requests that are under way");
    drainUntil_ = now_ + kMostDraining;
    if (listener_.IsOwn()) {
        listener_.Unlink();
        while (isAccepting_ && AcceptOne()) {
        }
    }
    isAccepting_ = false;
    WatchClients(false);
    workers_.LetTake(false, now_);
    listener_.Close();
}

bool Master::IsDrained() {
    if (now_ >= drainUntil_) {
        for (Waiting waiting; queue_.Take(&waiting);) {
            Refuse(waiting.connection);
        }
        workers_.EndAllInTime();
    }
    if (queue_.Size() == 0) {
        workers_.DismissAll(now_);
    }
    if (now_ >= drainUntil_ + kAfterDraining) {
        return true;
    }
    return queue_.Size() == 0 && workers_.AreGone() && farewell_.IsEmpty();
}

void Master::Tick() {
    nextTick_ = now_ + kTick;
    workers_.Tick(now_);
    templates_.Tick(now_);
    farewell_.Tick(now_);
    if (!isAccepting_ && drainUntil_ == 0 && now_ >= acceptNotBefore_) {
        isAccepting_ = true;
    }
    if (!isWatching_ && now_ >= nextCount_) {
        CountClients();
    }
}

int Master::MillisecondsToWait() const {
    const bool isQuiet = !workers_.AreBusy() && queue_.Size() == 0 && farewell_.IsEmpty() &&
                         drainUntil_ == 0 && isAccepting_ && templates_.Generation() != 0;
    if ((isAccepting_ && !isWatching_) || workers_.MayBeBehind() ||
        (queue_.Size() > 0 && workers_.HaveIdle())) {
        return kLookAgain;
    }
    const long long until = isQuiet ? nextTick_ - kTick + kIdleTick : nextTick_;
    return static_cast<int>(std::clamp(until - now_, 0LL, kIdleTick));
}
