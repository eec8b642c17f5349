#ifndef TALO_PROGRAMS_WEBAPI_SERVER_SLOT_H
#define TALO_PROGRAMS_WEBAPI_SERVER_SLOT_H

#include <signal.h>
#include <sys/types.h>

#include <atomic>

// What a worker shows to the master, in memory that both map. The worker writes,
// the master reads, except that the master clears a slot before it gives it away,
// and that `mayTake` is the master's.
struct Slot {
    std::atomic<pid_t> pid;
    std::atomic<long long> began;       // of the request, CLOCK_MONOTONIC ms; 0 when idle
    std::atomic<long long> allowedMs;   // until it is ended; 0 without limit
    std::atomic<int> transfers;         // 1: an upload or a download; progress extends the limit
    volatile sig_atomic_t answerBegun;  // the first byte of the reply is about to leave
    char api[128];                      // zero-terminated, for the log
    std::atomic<int> mayTake;           // 1: when done, a worker may take who connects by itself
    std::atomic<unsigned> turns;        // how often, since the master handed over, it was done
                                        // and went on by itself, or took a client
    std::atomic<long long> takenAt;     // the last client, CLOCK_MONOTONIC ms
    std::atomic<int> connection;        // the descriptor of whom it took; 0 when done

    // For clients, by itself.
    bool IsWaiting() const {
        return turns != 0 && connection == 0 && began == 0;
    }
};

// The control socket (SOCK_SEQPACKET) between the two. The master sends kServe with
// the connection as its ancillary descriptor, kLeave, or kCome to one that waits for
// clients by itself and may not any more; the worker sends kIdle when it is ready for
// another request of the master's. A worker that ends just closes its side.
enum ControlMessage : char { kServe = 's', kLeave = 'l', kCome = 'c', kIdle = 'i' };

#endif
