#include "programs/webapi_server/Arrivals.h"

#include <errno.h>
#include <sys/epoll.h>
#include <unistd.h>

Arrivals::Arrivals(int listener, int control)
    : listener_(listener), control_(control), epoll_(epoll_create1(EPOLL_CLOEXEC)) {}

Arrivals::~Arrivals() {
    (void)close(epoll_);
}

bool Arrivals::StandInLine() {
    isInLine_ = isInLine_ || (Add(control_, EPOLLIN) && Add(listener_, EPOLLIN | EPOLLEXCLUSIVE));
    return isInLine_;
}

Arrival Arrivals::Await() const {
    constexpr int kBoth = 2;
    struct epoll_event got[kBoth] = {};
    int count = -1;
    do {
        count = epoll_wait(epoll_, got, kBoth, -1);
    } while (count < 0 && errno == EINTR);
    // The client first: nobody else was woken for it.
    for (int index = 0; index < count; ++index) {
        if (got[index].data.fd == listener_) {
            return Arrival::kClient;
        }
    }
    return count > 0 ? Arrival::kOrder : Arrival::kNone;
}

bool Arrivals::Add(int descriptor, unsigned events) const {
    struct epoll_event wanted = {};
    wanted.events = events;
    wanted.data.fd = descriptor;
    return epoll_ctl(epoll_, EPOLL_CTL_ADD, descriptor, &wanted) == 0;
}
