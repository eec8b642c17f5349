#include "programs/webapi_server/Sockets.h"

#include <fcntl.h>
#include <syslog.h>
#include <unistd.h>

namespace {

int OutOfTheWay(int descriptor) {
    return descriptor >= 0 ? fcntl(descriptor, F_DUPFD_CLOEXEC, kTakenSocket + 1) : -1;
}

void Put(int descriptor, int number) {
    if (descriptor >= 0) {
        (void)dup3(descriptor, number, O_CLOEXEC);
    }
}

}  // namespace

void KeepOnly(const Sockets& sockets) {
    closelog();
    const Sockets aside = {OutOfTheWay(sockets.control), OutOfTheWay(sockets.listener),
                           OutOfTheWay(sockets.taken)};
    (void)close_range(kControlSocket, kTakenSocket, 0);
    Put(aside.control, kControlSocket);
    Put(aside.listener, kListenerSocket);
    Put(aside.taken, kTakenSocket);
    (void)close_range(kTakenSocket + 1, ~0U, 0);
}
