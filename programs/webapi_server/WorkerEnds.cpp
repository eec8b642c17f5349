// How workers end: by themselves, past a deadline, or by a fault in what they called.

#include <ctype.h>
#include <errno.h>
#include <signal.h>
#include <string.h>
#include <sys/socket.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <syslog.h>
#include <unistd.h>

#include <utility>

#include "programs/webapi_server/Clock.h"
#include "programs/webapi_server/Workers.h"

namespace {

constexpr int kMostReturns = 16;
constexpr long long kMostStarting = 20000;
constexpr long long kMostLeaving = 5000;
constexpr long long kStatusComesWithin = 2000;

// Nobody has read of the request yet: it can be served by another worker.
bool IsUntouched(const Slot& slot, int connection) {
    if (slot.began != 0 || slot.answerBegun != 0) {
        return false;
    }
    char first = 0;
    const ssize_t got = recv(connection, &first, 1, MSG_PEEK | MSG_DONTWAIT);
    // Nothing may have come yet.
    return got == 1 ? isdigit(first) != 0 : got < 0 && errno == EAGAIN;
}

}  // namespace

void Workers::OnProcess(const Event& event, long long now) {
    const int index = pool_.Find(event.index, event.serial);
    if (index >= 0 && pool_.At(index).state != WorkerState::kEnded) {
        End(index, now);
    }
}

void Workers::Tick(long long now) {
    for (int index = 0; index < pool_.Size(); ++index) {
        PooledWorker& worker = pool_.At(index);
        const long long inState = now - worker.since;
        switch (worker.state) {
            case WorkerState::kBusy:
                FollowOne(index, now);
                if (slots_.At(index)->IsWaiting() && !worker.isCalled) {
                    BeginWatch(worker, now);
                }
                if (worker.isTimedOut ||
                    IsPastDeadline(*slots_.At(index), worker.pid, &worker.watch, now)) {
                    EndInTime(index);
                }
                break;
            case WorkerState::kStarting:
            case WorkerState::kLeaving:
                if (inState >
                    (worker.state == WorkerState::kLeaving ? kMostLeaving : kMostStarting)) {
                    Kill(index);
                }
                break;
            case WorkerState::kEnded:
                if (inState > kStatusComesWithin) {
                    Finish(index);
                }
                break;
            case WorkerState::kIdle:
            case WorkerState::kFree:
                break;
        }
    }
    DismissOlder(now);
    const int surplus = pool_.Surplus(templates_->Generation(), queue_.Size(), now);
    if (surplus >= 0) {
        Dismiss(surplus, now);
    }
}

void Workers::EndInTime(int index) {
    PooledWorker& worker = pool_.At(index);
    if (!std::exchange(worker.isTimedOut, true)) {
        syslog(LOG_ERR, "API %s: worker %d takes longer than it may, and is ended",
               ApiOf(index).c_str(), static_cast<int>(worker.pid));
    }
    Kill(index);
}

// At once, and with what it started: it had its time, and a method that hangs may
// well hang in its signal handlers too. The connection is answered when it is gone,
// so that there are never two answers.
void Workers::Kill(int index) const {
    const PooledWorker& worker = pool_.At(index);
    if (worker.process < 0 || worker.pid <= 1) {
        return;
    }
    (void)kill(-worker.pid, SIGKILL);
    (void)syscall(SYS_pidfd_send_signal, worker.process, SIGKILL, nullptr, 0);
}

void Workers::EndAllInTime() {
    for (int index = 0; index < pool_.Size(); ++index) {
        if (pool_.At(index).state == WorkerState::kBusy) {
            EndInTime(index);
        }
    }
}

void Workers::End(int index, long long now) {
    PooledWorker& worker = pool_.At(index);
    if (worker.state == WorkerState::kBusy) {
        FollowOne(index, now);
    }
    if (worker.connection >= 0) {
        SettleConnection(index, now);
    }
    CloseDescriptors(worker);
    if (!worker.wasIdle) {
        PauseStarting(now);
    }
    pool_.SetState(index, WorkerState::kEnded, now);
    if (worker.hasStatus) {
        Finish(index);
    }
}

void Workers::SettleConnection(int index, long long now) {
    PooledWorker& worker = pool_.At(index);
    const Slot& slot = *slots_.At(index);
    const int connection = worker.connection;
    worker.connection = -1;
    if (worker.isTimedOut && slot.answerBegun == 0) {
        farewell_.Say(connection, ReplyStatus::kTimedOut, now);
    } else if (slot.answerBegun != 0) {
        farewell_.Close(connection, now);
    } else if (worker.returns < kMostReturns && IsUntouched(slot, connection)) {
        queue_.PutBack({connection, worker.returns + 1});
    } else {
        worker.isUnanswered = true;
        farewell_.Say(connection, ReplyStatus::kCrashed, now);
    }
}

void Workers::TakeStatus(int index, int status) {
    PooledWorker& worker = pool_.At(index);
    worker.hasStatus = true;
    worker.status = status;
    if (worker.state == WorkerState::kEnded) {
        Finish(index);
    }
}

// Its name is in the slot, which is not given away before this.
void Workers::Finish(int index) {
    const PooledWorker& worker = pool_.At(index);
    const int pid = static_cast<int>(worker.pid);
    if (worker.isTimedOut) {
        // Told already.
    } else if (worker.hasStatus && WIFSIGNALED(worker.status)) {
        syslog(LOG_ERR, "API %s: worker %d ended by signal %d (%s)", ApiOf(index).c_str(), pid,
               WTERMSIG(worker.status), strsignal(WTERMSIG(worker.status)));
    } else if (worker.isUnanswered) {
        syslog(LOG_ERR, "API %s: worker %d ended without an answer, status %d",
               ApiOf(index).c_str(), pid, worker.hasStatus ? WEXITSTATUS(worker.status) : -1);
    }
    pool_.Free(index);
}

std::string Workers::ApiOf(int index) const {
    const char* const api = slots_.At(index)->api;
    std::string name(api, strnlen(api, sizeof Slot::api));
    for (char& letter : name) {
        letter = letter > ' ' && letter < 0x7f ? letter : '?';
    }
    return name.empty() ? "(none)" : name;
}
