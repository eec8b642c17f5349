#ifndef TALO_PROGRAMS_WEBAPI_SERVER_POOL_H
#define TALO_PROGRAMS_WEBAPI_SERVER_POOL_H

#include <sys/types.h>

#include <vector>

#include "programs/webapi_server/Deadline.h"

enum class WorkerState {
    kFree,      // there is none
    kStarting,  // ordered of the template
    kIdle,      // waits for a request
    kBusy,      // has one
    kLeaving,   // was told to go
    kEnded,     // is gone, its status is not known yet
};
constexpr int kWorkerStates = 6;

// One worker as the master knows it.
struct PooledWorker {
    WorkerState state = WorkerState::kFree;
    long long since = 0;  // of the state, ms
    int generation = 0;   // of the template it is from
    unsigned serial = 0;  // no other worker has it
    pid_t pid = 0;
    int process = -1;  // its process descriptor
    int control = -1;
    int connection = -1;    // of the request that it has, where the master has it too
    unsigned turns = 0;     // as its slot told when that was looked at last
    bool isInLine = false;  // for clients, by itself
    bool isCalled = false;  // from there
    int returns = 0;        // of that, from workers before
    bool isTimedOut = false;
    bool isUnanswered = false;  // its last request
    bool wasIdle = false;
    bool hasStatus = false;
    int status = 0;
    Watch watch;  // over its request
};

// Who works, and how many should. Knows nothing of processes: it only counts.
//
// There are twice as many places as workers: those of a template that was replaced
// may still have requests to finish.
class Pool {
  public:
    // `atOnce` is how many requests may be new at the same time.
    Pool(int minWorkers, int maxWorkers, int atOnce);

    int Size() const {
        return static_cast<int>(workers_.size());
    }
    PooledWorker& At(int index) {
        return workers_[static_cast<size_t>(index)];
    }
    const PooledWorker& At(int index) const {
        return workers_[static_cast<size_t>(index)];
    }

    // A place for a worker that starts; -1 when there is none.
    int Reserve(int generation, long long now);
    void SetState(int index, WorkerState state, long long now);
    void Free(int index);

    // Whether it began lately, as most do that are not done yet.
    bool IsNew(int index, long long now) const;

    // A busy one has gone on with another request since then.
    void BeginAnother(int index, long long since);

    // The one that was idle for the shortest time, of the newest generation: it has
    // the most of its memory at hand, and the others can leave. -1 when none is.
    int ChooseIdle() const;

    // Whether one more may begin now. Most requests take less than some milliseconds
    // of a processor: more of them at once than processors would only take turns, and
    // throw each other out of its caches. Who takes longer waits for something.
    bool MayBegin(long long now) const;

    // The place of a worker that was not replaced since; -1 when it was.
    int Find(int index, unsigned serial) const;
    int FindProcess(pid_t pid) const;

    // How many more should start while so many requests wait for one: some are always
    // ready ahead, below the maximum.
    int ToStart(int generation, int waiting) const;

    // One that may leave, since there are more than needed and it was idle for long;
    // or -1.
    int Surplus(int generation, int waiting, long long now) const;

    int Count(WorkerState state) const;
    int Count(WorkerState state, int generation) const;

  private:
    int Target(int generation, int waiting) const;

    int min_;
    int max_;
    int atOnce_;
    unsigned serial_ = 0;
    std::vector<PooledWorker> workers_;
    int counts_[kWorkerStates] = {};
};

#endif
