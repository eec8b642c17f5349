#include "programs/webapi_server/Workers.h"

#include <errno.h>
#include <sys/socket.h>
#include <sys/syscall.h>
#include <sys/sysinfo.h>
#include <syslog.h>
#include <unistd.h>

#include <algorithm>

#include "programs/webapi_server/Clock.h"

namespace {

constexpr long long kFirstPause = 100;
constexpr int kMostDoublings = 6;
constexpr int kAtOncePerProcessor = 2;

// Most requests are over by then.
constexpr long long kFetchAfter = 2;

// Requests follow each other that are no further apart.
constexpr long long kSuccession = 50;

// A duplicate of another process's; -1 where the system refuses that.
int DescriptorOf(int process, int number) {
    return static_cast<int>(syscall(SYS_pidfd_getfd, process, number, 0));
}

bool IsSocket(int descriptor) {
    int type = 0;
    socklen_t size = sizeof type;
    return getsockopt(descriptor, SOL_SOCKET, SO_TYPE, &type, &size) == 0;
}

// Of whom the worker took at this turn and still has; -1 when that has changed
// meanwhile: a later one's would pass for done with at the next look.
int FetchConnection(const PooledWorker& worker, const Slot& slot) {
    const int number = slot.connection;
    const int connection = number > 0 ? DescriptorOf(worker.process, number) : -1;
    const bool isSame = slot.connection == number && slot.turns == worker.turns;
    if (connection >= 0 && !(isSame && IsSocket(connection))) {
        (void)close(connection);
        return -1;
    }
    return connection;
}

}  // namespace

Workers::Workers(const Poller& poller, SlotTable& slots, const Settings& settings,
                 ConnectionQueue& queue, Farewell& farewell)
    : poller_(poller),
      slots_(slots),
      settings_(settings),
      queue_(queue),
      farewell_(farewell),
      pool_(settings.minWorkers, settings.maxWorkers,
            std::min(kAtOncePerProcessor * get_nprocs(), settings.maxWorkers)) {}

Workers::~Workers() {
    for (int index = 0; index < pool_.Size(); ++index) {
        CloseDescriptors(pool_.At(index));
        if (pool_.At(index).connection >= 0) {
            (void)close(pool_.At(index).connection);
        }
    }
}

bool Workers::HandOver(const Waiting& waiting, long long now) {
    return MayBegin(now) && HandOverAtOnce(waiting, now);
}

bool Workers::HandOverAtOnce(const Waiting& waiting, long long now) {
    for (int index = pool_.ChooseIdle(); index >= 0; index = pool_.ChooseIdle()) {
        PooledWorker& worker = pool_.At(index);
        slots_.Clear(index);
        slots_.At(index)->mayTake =
            mayTake_ && worker.generation == templates_->Generation() ? 1 : 0;
        const char message = kServe;
        if (SendMessage(worker.control, &message, sizeof message, waiting.connection,
                        MSG_DONTWAIT)) {
            worker.connection = waiting.connection;
            worker.returns = waiting.returns;
            worker.turns = 0;
            worker.isCalled = false;
            BeginWatch(worker, now);
            pool_.SetState(index, WorkerState::kBusy, now);
            isQuick_ = now - lastBegun_ < kSuccession;
            lastBegun_ = now;
            return true;
        }
        // It has just ended.
        pool_.SetState(index, WorkerState::kLeaving, now);
    }
    return false;
}

void Workers::BeginWatch(PooledWorker& worker, long long now) const {
    worker.watch.quietSince = now;
    worker.watch.progressAt = 0;
    worker.isTimedOut = false;
}

bool Workers::MayBegin(long long now) {
    for (int index = 0; index < pool_.Size(); ++index) {
        if (pool_.At(index).state == WorkerState::kBusy) {
            pool_.BeginAnother(index, slots_.At(index)->takenAt);
        }
    }
    return pool_.MayBegin(now);
}

void Workers::LetTake(bool isWanted, long long now) {
    mayTake_ = isWanted && canFetch_ && isQuick_ && now - lastBegun_ < kSuccession;
    for (int index = 0; index < pool_.Size() && AreBusy(); ++index) {
        if (pool_.At(index).state != WorkerState::kBusy) {
            continue;
        }
        const bool may = MayTake(index, now);
        Slot& slot = *slots_.At(index);
        if ((slot.mayTake != 0) != may) {
            slot.mayTake = may ? 1 : 0;
        }
        PooledWorker& worker = pool_.At(index);
        worker.isCalled = worker.isCalled && !may;
        if (!may && slot.IsWaiting()) {
            Call(worker);
        }
    }
}

// Those of a template that was replaced should come to their end. Whose request lasts
// has given its place to another.
bool Workers::MayTake(int index, long long now) const {
    return mayTake_ && pool_.At(index).generation == templates_->Generation() &&
           (slots_.At(index)->IsWaiting() || pool_.IsNew(index, now));
}

void Workers::Call(PooledWorker& worker) const {
    const char message = kCome;
    worker.isCalled =
        worker.isCalled || SendMessage(worker.control, &message, sizeof message, -1, MSG_DONTWAIT);
}

bool Workers::Follow(long long now) {
    if (!mayTake_ && !isBehind_) {
        return false;
    }
    isBehind_ = false;
    bool isNewInLine = false;
    for (int index = 0; index < pool_.Size() && AreBusy(); ++index) {
        PooledWorker& worker = pool_.At(index);
        if (worker.state == WorkerState::kBusy) {
            FollowOne(index, now);
            isBehind_ = isBehind_ || (worker.connection < 0 && !slots_.At(index)->IsWaiting());
            isNewInLine = isNewInLine || (worker.turns != 0 && !worker.isInLine);
            worker.isInLine = worker.isInLine || worker.turns != 0;
        }
    }
    return isNewInLine;
}

// One that has gone on by itself is done with the connection before.
void Workers::FollowOne(int index, long long now) {
    PooledWorker& worker = pool_.At(index);
    const Slot& slot = *slots_.At(index);
    const unsigned turns = slot.turns;
    if (turns != worker.turns) {
        LetGoOfConnection(worker, now);
        worker.turns = turns;
        worker.returns = 0;
        BeginWatch(worker, now);
        lastBegun_ = std::clamp<long long>(slot.takenAt, lastBegun_, now);
    }
    if (worker.connection < 0 && now - slot.takenAt >= kFetchAfter) {
        worker.connection = FetchConnection(worker, slot);
    }
}

// Of a request that could not be read, the rest may still be there.
void Workers::LetGoOfConnection(PooledWorker& worker, long long now) {
    if (worker.connection >= 0) {
        farewell_.Close(worker.connection, now);
        worker.connection = -1;
    }
}

void Workers::Grow(long long now) {
    const int generation = templates_->Generation();
    if (generation == 0 || now < startNotBefore_) {
        return;
    }
    // Who waits only for others to be done needs no worker of its own.
    const int waiting = MayBegin(now) ? queue_.Size() : 0;
    for (int count = pool_.ToStart(generation, waiting); count > 0; --count) {
        if (!Start(generation, now)) {
            return;
        }
    }
}

bool Workers::Start(int generation, long long now) {
    int ends[2] = {-1, -1};
    const int index = pool_.Reserve(generation, now);
    if (index < 0) {
        return false;
    }
    PooledWorker& worker = pool_.At(index);
    slots_.Clear(index);
    bool ordered = false;
    if (socketpair(AF_UNIX, SOCK_SEQPACKET | SOCK_CLOEXEC, 0, ends) == 0) {
        worker.control = ends[0];
        ordered = poller_.Add(ends[0], {Source::kControl, index, worker.serial}) &&
                  templates_->Order({index, worker.serial}, ends[1]);
        (void)close(ends[1]);
    }
    if (!ordered) {
        CloseDescriptors(worker);
        pool_.Free(index);
        PauseStarting(now);
    }
    return ordered;
}

void Workers::OnControl(const Event& event, long long now) {
    const int index = pool_.Find(event.index, event.serial);
    if (index < 0 || pool_.At(index).control < 0) {
        return;
    }
    char message = 0;
    int descriptor = -1;
    const ssize_t got = ReceiveMessage(pool_.At(index).control, &message, sizeof message,
                                       &descriptor, MSG_DONTWAIT);
    if (descriptor >= 0) {
        (void)close(descriptor);
    }
    if (got == 1 && message == kIdle) {
        BecomeIdle(index, now);
    } else if (got == 0 || (got < 0 && errno != EAGAIN)) {
        // The process descriptor tells of the end; this one would not be quiet.
        poller_.Remove(pool_.At(index).control);
        if (pool_.At(index).process < 0) {
            End(index, now);
        }
    }
}

void Workers::BecomeIdle(int index, long long now) {
    PooledWorker& worker = pool_.At(index);
    if (worker.state == WorkerState::kBusy) {
        LetGoOfConnection(worker, now);
    } else if (worker.state != WorkerState::kStarting) {
        return;
    }
    worker.wasIdle = true;
    startFailures_ = 0;
    pool_.SetState(index, WorkerState::kIdle, now);
    DismissOlder(now);
}

// Those of a template that was replaced, once there is another to serve.
void Workers::DismissOlder(long long now) {
    const int generation = templates_->Generation();
    if (generation == 0 ||
        pool_.Count(WorkerState::kIdle, generation) + pool_.Count(WorkerState::kBusy, generation) ==
            0) {
        return;
    }
    for (int index = 0; index < pool_.Size(); ++index) {
        if (pool_.At(index).state == WorkerState::kIdle &&
            pool_.At(index).generation != generation) {
            Dismiss(index, now);
        }
    }
}

void Workers::Dismiss(int index, long long now) {
    const char message = kLeave;
    (void)SendMessage(pool_.At(index).control, &message, sizeof message, -1, MSG_DONTWAIT);
    pool_.SetState(index, WorkerState::kLeaving, now);
}

void Workers::DismissAll(long long now) {
    for (int index = 0; index < pool_.Size(); ++index) {
        const WorkerState state = pool_.At(index).state;
        if (state == WorkerState::kIdle || state == WorkerState::kStarting) {
            Dismiss(index, now);
        }
    }
}

void Workers::PauseStarting(long long now) {
    startNotBefore_ = now + (kFirstPause << std::min(startFailures_, kMostDoublings));
    ++startFailures_;
}

void Workers::CloseDescriptors(PooledWorker& worker) const {
    for (int* descriptor : {&worker.control, &worker.process}) {
        if (*descriptor >= 0) {
            poller_.Remove(*descriptor);
            (void)close(*descriptor);
            *descriptor = -1;
        }
    }
}

void Workers::OnReady(int) {
    startNotBefore_ = 0;
}

void Workers::OnStarted(const TemplateReport& report, int process) {
    const int index = pool_.Find(report.slot, report.serial);
    if (index >= 0 && pool_.At(index).process < 0 && pool_.At(index).state != WorkerState::kEnded) {
        pool_.At(index).pid = report.pid;
        pool_.At(index).process = process;
        if (process >= 0) {
            SeeWhetherToFetch(process);
            (void)poller_.Add(process, {Source::kProcess, index, report.serial});
        }
    } else if (process >= 0) {
        (void)close(process);
    }
}

// All workers are alike, and each has a standard input.
void Workers::SeeWhetherToFetch(int process) {
    const int descriptor = canFetch_ ? -1 : DescriptorOf(process, STDIN_FILENO);
    if (descriptor >= 0) {
        (void)close(descriptor);
        canFetch_ = true;
    }
}

void Workers::OnFailed(const TemplateReport& report) {
    const int index = pool_.Find(report.slot, report.serial);
    if (index >= 0) {
        errno = report.status;
        syslog(LOG_ERR, "cannot start a worker: %m");
        CloseDescriptors(pool_.At(index));
        pool_.Free(index);
        PauseStarting(MillisecondsNow());
    }
}

void Workers::OnEnded(const TemplateReport& report) {
    const int index = pool_.Find(report.slot, report.serial);
    if (index >= 0) {
        TakeStatus(index, report.status);
    }
}

void Workers::OnLost(int generation) {
    const long long now = MillisecondsNow();
    for (int index = 0; index < pool_.Size(); ++index) {
        const PooledWorker& worker = pool_.At(index);
        if (worker.state == WorkerState::kStarting && worker.generation == generation &&
            worker.process < 0) {
            CloseDescriptors(pool_.At(index));
            // Not free at once: it may have been forked, and knows its slot.
            pool_.SetState(index, WorkerState::kEnded, now);
        }
    }
}

void Workers::OnOrphan(pid_t pid, int status) {
    const int index = pool_.FindProcess(pid);
    if (index >= 0) {
        TakeStatus(index, status);
    }
}
