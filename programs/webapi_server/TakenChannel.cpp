#include "programs/webapi_server/TakenChannel.h"

#include <sys/socket.h>
#include <unistd.h>

#include "programs/webapi_server/Message.h"

TakenChannel::TakenChannel() {
    if (socketpair(AF_UNIX, SOCK_SEQPACKET | SOCK_CLOEXEC, 0, ends_) != 0) {
        ends_[0] = ends_[1] = -1;
    }
}

TakenChannel::~TakenChannel() {
    if (IsOpen()) {
        (void)close(ends_[0]);
        (void)close(ends_[1]);
    }
}

bool TakenChannel::Read(TakenReport* report, int* connection) const {
    for (;;) {
        const ssize_t got =
            ReceiveMessage(ends_[0], report, sizeof *report, connection, MSG_DONTWAIT);
        if (got == sizeof *report && *connection >= 0) {
            return true;
        }
        if (*connection >= 0) {
            (void)close(*connection);
        }
        if (got <= 0) {
            return false;
        }
    }
}
