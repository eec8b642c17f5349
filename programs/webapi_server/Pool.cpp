#include "programs/webapi_server/Pool.h"

#include <algorithm>

namespace {

// Longer than the pauses of a client that looks again and again.
constexpr long long kIdleStay = 10000;

// What a request needs that waits for nothing, and something over.
constexpr long long kNew = 5;

constexpr int kAhead = 2;

}  // namespace

Pool::Pool(int minWorkers, int maxWorkers, int atOnce)
    : min_(minWorkers),
      max_(maxWorkers),
      atOnce_(atOnce),
      workers_(2 * static_cast<size_t>(maxWorkers)) {
    counts_[static_cast<int>(WorkerState::kFree)] = Size();
}

int Pool::Reserve(int generation, long long now) {
    for (int index = 0; index < Size(); ++index) {
        if (At(index).state == WorkerState::kFree) {
            At(index) = PooledWorker();
            At(index).generation = generation;
            At(index).serial = ++serial_;
            SetState(index, WorkerState::kStarting, now);
            return index;
        }
    }
    return -1;
}

void Pool::SetState(int index, WorkerState state, long long now) {
    PooledWorker& worker = At(index);
    --counts_[static_cast<int>(worker.state)];
    ++counts_[static_cast<int>(state)];
    worker.state = state;
    worker.since = now;
}

void Pool::Free(int index) {
    SetState(index, WorkerState::kFree, 0);
    At(index).serial = 0;
}

void Pool::BeginAnother(int index, long long since) {
    At(index).since = std::max(At(index).since, since);
}

int Pool::ChooseIdle() const {
    if (Count(WorkerState::kIdle) == 0) {
        return -1;
    }
    int chosen = -1;
    for (int index = 0; index < Size(); ++index) {
        const PooledWorker& worker = At(index);
        if (worker.state != WorkerState::kIdle) {
            continue;
        }
        if (chosen < 0 || worker.generation > At(chosen).generation ||
            (worker.generation == At(chosen).generation && worker.since > At(chosen).since)) {
            chosen = index;
        }
    }
    return chosen;
}

bool Pool::IsNew(int index, long long now) const {
    return At(index).state == WorkerState::kBusy && now - At(index).since < kNew;
}

bool Pool::MayBegin(long long now) const {
    if (Count(WorkerState::kBusy) < atOnce_) {
        return true;
    }
    int count = 0;
    for (int index = 0; index < Size(); ++index) {
        count += IsNew(index, now) ? 1 : 0;
    }
    return count < atOnce_;
}

int Pool::Find(int index, unsigned serial) const {
    return index >= 0 && index < Size() && serial != 0 && At(index).serial == serial ? index : -1;
}

int Pool::FindProcess(pid_t pid) const {
    for (int index = 0; index < Size(); ++index) {
        if (At(index).state != WorkerState::kFree && At(index).pid == pid) {
            return index;
        }
    }
    return -1;
}

int Pool::ToStart(int generation, int waiting) const {
    const int present = Count(WorkerState::kStarting, generation) +
                        Count(WorkerState::kIdle, generation) +
                        Count(WorkerState::kBusy, generation);
    return std::max(0, Target(generation, waiting) - present);
}

int Pool::Surplus(int generation, int waiting, long long now) const {
    const int present =
        Count(WorkerState::kIdle, generation) + Count(WorkerState::kBusy, generation);
    if (present <= Target(generation, waiting)) {
        return -1;
    }
    int oldest = -1;
    for (int index = 0; index < Size(); ++index) {
        const PooledWorker& worker = At(index);
        if (worker.state == WorkerState::kIdle && worker.generation == generation &&
            now - worker.since >= kIdleStay && (oldest < 0 || worker.since < At(oldest).since)) {
            oldest = index;
        }
    }
    return oldest;
}

int Pool::Count(WorkerState state) const {
    return counts_[static_cast<int>(state)];
}

int Pool::Count(WorkerState state, int generation) const {
    if (Count(state) == 0) {
        return 0;
    }
    return static_cast<int>(std::count_if(
        workers_.begin(), workers_.end(), [state, generation](const PooledWorker& worker) {
            return worker.state == state && worker.generation == generation;
        }));
}

int Pool::Target(int generation, int waiting) const {
    const int ahead = std::max(kAhead, waiting);
    return std::clamp(Count(WorkerState::kBusy, generation) + ahead, min_, max_);
}
