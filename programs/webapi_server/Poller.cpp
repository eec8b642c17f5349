#include "programs/webapi_server/Poller.h"

#include <sys/epoll.h>
#include <unistd.h>

#include <algorithm>
#include <cstdint>

namespace {

constexpr int kMostEvents = 64;
constexpr int kSourceShift = 56;
constexpr int kIndexShift = 32;
constexpr uint64_t kIndexMask = 0xffffff;

}  // namespace

Poller::Poller() : epoll_(epoll_create1(EPOLL_CLOEXEC)) {}

Poller::~Poller() {
    (void)close(epoll_);
}

bool Poller::Add(int descriptor, Event event) const {
    return Add(descriptor, event, EPOLLIN);
}

bool Poller::AddLastInLine(int descriptor, Event event) const {
    return Add(descriptor, event, EPOLLIN | EPOLLEXCLUSIVE);
}

bool Poller::Add(int descriptor, Event event, unsigned events) const {
    struct epoll_event wanted = {};
    wanted.events = events;
    wanted.data.u64 = static_cast<uint64_t>(event.source) << kSourceShift |
                      static_cast<uint64_t>(static_cast<unsigned>(event.index)) << kIndexShift |
                      event.serial;
    return epoll_ctl(epoll_, EPOLL_CTL_ADD, descriptor, &wanted) == 0;
}

void Poller::Remove(int descriptor) const {
    (void)epoll_ctl(epoll_, EPOLL_CTL_DEL, descriptor, nullptr);
}

int Poller::Wait(Event* events, int most, int milliseconds) const {
    struct epoll_event got[kMostEvents] = {};
    const int count = epoll_wait(epoll_, got, std::min(most, kMostEvents), milliseconds);
    for (int index = 0; index < count; ++index) {
        const uint64_t data = got[index].data.u64;
        events[index] = {static_cast<Source>(data >> kSourceShift),
                         static_cast<int>(data >> kIndexShift & kIndexMask),
                         static_cast<unsigned>(data)};
    }
    return std::max(count, 0);
}
