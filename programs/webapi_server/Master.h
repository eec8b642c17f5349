#ifndef TALO_PROGRAMS_WEBAPI_SERVER_MASTER_H
#define TALO_PROGRAMS_WEBAPI_SERVER_MASTER_H

#include <signal.h>

#include "programs/webapi_server/Listen.h"
#include "programs/webapi_server/Workers.h"

// Lets the signals that a Master reads wait until it runs; *before gets the mask that
// was there.
void HoldSignals(sigset_t* before);

// The process that supervises: hands connections to workers or lets them wait, while
// requests follow each other leaves it to workers to take the next, and answers in place
// of a worker that cannot. It reads no request and loads no API library. One thread,
// which waits for nobody in particular.
class Master {
  public:
    Master(Listener& listener, const Settings& settings, const OriginalProcess& original);
    ~Master();
    Master(const Master&) = delete;
    Master& operator=(const Master&) = delete;

    // Behind HoldSignals. Until SIGTERM or SIGINT, and the requests that were there by
    // then are served. False when it could not begin.
    bool Run();

  private:
    bool Begin();
    void Handle(const Event& event);
    void WatchClients(bool wanted);
    void ShareClients();
    void Accept();
    void CountClients();
    bool AcceptOne();
    void Refuse(int connection);
    void HandOut();
    void ReadSignals();
    void ReapChildren();
    void StartDraining();
    bool IsDrained();
    void Tick();
    int MillisecondsToWait() const;

    Listener& listener_;
    Poller poller_;
    SlotTable slots_;
    ConnectionQueue queue_;
    Farewell farewell_;
    Workers workers_;
    Templates templates_;
    int signals_ = -1;
    long long now_;
    long long nextTick_ = 0;
    bool isAccepting_ = false;
    bool isWatching_ = false;  // for clients for whom no worker waits
    bool hasClients_ = false;  // to accept
    long long acceptNotBefore_ = 0;
    long long nextCount_ = 0;   // of those who wait in the socket
    long long drainUntil_ = 0;  // 0: goes on
    long long nextRefusalLog_ = 0;
    int refusals_ = 0;
};

#endif
