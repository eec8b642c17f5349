#ifndef TALO_PROGRAMS_WEBAPI_SERVER_TAKENCHANNEL_H
#define TALO_PROGRAMS_WEBAPI_SERVER_TAKENCHANNEL_H

#include "programs/webapi_server/Slot.h"

// Over which workers tell of the connections that they took by themselves. Nobody is
// woken for that: the master reads it now and then, and whenever it looks at a worker.
// Few can lie there unread, and who finds no room waits.
class TakenChannel {
  public:
    TakenChannel();
    ~TakenChannel();
    TakenChannel(const TakenChannel&) = delete;
    TakenChannel& operator=(const TakenChannel&) = delete;

    bool IsOpen() const {
        return ends_[0] >= 0;
    }
    int WorkersEnd() const {
        return ends_[1];
    }

    // The next one; the connection is the caller's. False when there is none.
    bool Read(TakenReport* report, int* connection) const;

  private:
    int ends_[2] = {-1, -1};
};

#endif
