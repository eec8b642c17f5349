#ifndef TALO_PROGRAMS_WEBAPI_SERVER_WORKERS_H
#define TALO_PROGRAMS_WEBAPI_SERVER_WORKERS_H

#include <string>

#include "programs/webapi_server/Farewell.h"
#include "programs/webapi_server/Pool.h"
#include "programs/webapi_server/Queue.h"
#include "programs/webapi_server/SlotTable.h"
#include "programs/webapi_server/Templates.h"

// The master's side of the workers: starts them, hands requests over, sees to it that
// each request is answered whatever becomes of its worker. The master has a duplicate
// of every connection that it hands over until the worker is done with it. Of one that
// a worker has taken by itself it gets a duplicate out of the worker's process, unless
// that is done first, as with nearly all: for some milliseconds only the worker has it,
// and the web server answers for one that is killed just then.
class Workers : public TemplateEvents {
  public:
    Workers(const Poller& poller, SlotTable& slots, const Settings& settings,
            ConnectionQueue& queue, Farewell& farewell);
    ~Workers() override;
    Workers(const Workers&) = delete;
    Workers& operator=(const Workers&) = delete;

    // Must outlive this, and be there before anything starts.
    void SetTemplates(Templates* templates) {
        templates_ = templates;
    }

    // Hands the connection to an idle worker. False when there is none, or enough
    // requests have just begun.
    bool HandOver(const Waiting& waiting, long long now);
    bool HandOverAtOnce(const Waiting& waiting, long long now);

    bool HaveIdle() const {
        return pool_.Count(WorkerState::kIdle) > 0;
    }

    // Whether one more request may begin now.
    bool MayBegin(long long now);

    // Whether workers that are done may take who connects by themselves. They do while
    // requests follow each other, and never where the system does not let the master
    // have their connections.
    void LetTake(bool isWanted, long long now);

    // Sees what they have taken. True when one has newly stood in line for clients.
    bool Follow(long long now);

    // Whether one may have a connection that the master does not have yet.
    bool MayBeBehind() const {
        return isBehind_ || (mayTake_ && AreBusy());
    }

    // Starts what is wanted while so many requests wait.
    void Grow(long long now);

    void OnControl(const Event& event, long long now);
    void OnProcess(const Event& event, long long now);

    // A child of the master has ended: perhaps a worker whose template went before.
    void OnOrphan(pid_t pid, int status);

    // Deadlines, and whatever else only time tells.
    void Tick(long long now);

    // Tells those who have no request to go.
    void DismissAll(long long now);

    // Those who have one have had their time.
    void EndAllInTime();

    bool AreBusy() const {
        return pool_.Count(WorkerState::kBusy) > 0;
    }
    bool AreGone() const {
        return pool_.Count(WorkerState::kFree) + pool_.Count(WorkerState::kEnded) == pool_.Size();
    }

    void OnReady(int generation) override;
    void OnStarted(const TemplateReport& report, int process) override;
    void OnFailed(const TemplateReport& report) override;
    void OnEnded(const TemplateReport& report) override;
    void OnLost(int generation) override;

  private:
    bool Start(int generation, long long now);
    bool MayTake(int index, long long now) const;
    void Call(PooledWorker& worker) const;
    void SeeWhetherToFetch(int process);
    void FollowOne(int index, long long now);
    void LetGoOfConnection(PooledWorker& worker, long long now);
    void BeginWatch(PooledWorker& worker, long long now) const;
    void BecomeIdle(int index, long long now);
    void Dismiss(int index, long long now);
    void DismissOlder(long long now);
    void EndInTime(int index);
    void Kill(int index) const;
    void End(int index, long long now);
    void SettleConnection(int index, long long now);
    void TakeStatus(int index, int status);
    void Finish(int index);
    void CloseDescriptors(PooledWorker& worker) const;
    void PauseStarting(long long now);
    std::string ApiOf(int index) const;

    const Poller& poller_;
    SlotTable& slots_;
    const Settings& settings_;
    ConnectionQueue& queue_;
    Farewell& farewell_;
    Templates* templates_ = nullptr;
    Pool pool_;
    bool mayTake_ = false;
    bool isBehind_ = false;
    long long lastBegun_ = 0;
    bool isQuick_ = false;  // that one followed another
    bool canFetch_ = false;
    long long startNotBefore_ = 0;
    int startFailures_ = 0;  // in a row
};

#endif
