#include "programs/webapi_server/Queue.h"

#include <unistd.h>

namespace {

// What is put back was taken off before, so that no more than all workers at once
// can come back.
constexpr size_t kPutBackRoom = 4096;

}  // namespace

ConnectionQueue::ConnectionQueue(int room)
    : room_(static_cast<size_t>(room)), ring_(room_ + kPutBackRoom) {}

bool ConnectionQueue::Add(Waiting waiting) {
    if (size_ >= room_) {
        return false;
    }
    ring_[(first_ + size_) % ring_.size()] = waiting;
    ++size_;
    return true;
}

void ConnectionQueue::PutBack(Waiting waiting) {
    if (size_ == ring_.size()) {
        (void)close(waiting.connection);
        return;
    }
    first_ = (first_ + ring_.size() - 1) % ring_.size();
    ring_[first_] = waiting;
    ++size_;
}

bool ConnectionQueue::Take(Waiting* waiting) {
    if (size_ == 0) {
        return false;
    }
    *waiting = ring_[first_];
    first_ = (first_ + 1) % ring_.size();
    --size_;
    return true;
}
