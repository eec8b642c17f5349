#ifndef TALO_PROGRAMS_WEBAPI_SERVER_QUEUE_H
#define TALO_PROGRAMS_WEBAPI_SERVER_QUEUE_H

#include <cstddef>
#include <vector>

// A connection that waits for a worker.
struct Waiting {
    int connection = -1;
    int returns = 0;  // from workers that ended before they looked at it
};

// The connections that wait, first come first served. The room is taken once: it
// bounds what a crowd of clients costs.
class ConnectionQueue {
  public:
    explicit ConnectionQueue(int room);

    // False when there is no room; the connection is the caller's still.
    bool Add(Waiting waiting);

    // In front of all others, even when the room is full.
    void PutBack(Waiting waiting);

    // False when none waits.
    bool Take(Waiting* waiting);

    int Size() const {
        return static_cast<int>(size_);
    }

  private:
    size_t room_;
    std::vector<Waiting> ring_;  // larger than the room, for what is put back
    size_t first_ = 0;
    size_t size_ = 0;
};

#endif
