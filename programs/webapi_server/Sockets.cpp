#include "programs/webapi_server/Sockets.h"

#include <fcntl.h>
#include <syslog.h>
#include <unistd.h>

namespace {

int OutOfTheWay(int descriptor) {
    return fcntl(descriptor, F_DUPFD_CLOEXEC, kListenerSocket + 1);
}

void Put(int descriptor, int number) {
    (void)dup3(descriptor, number, O_CLOEXEC);
}

}  // namespace

// Standard input is nowhere: it takes the place of a listener that is closed, so that
// nothing else gets its number.
void KeepOnly(const Sockets& sockets) {
    closelog();
    const int listener = sockets.listener >= 0 ? sockets.listener : STDIN_FILENO;
    const Sockets aside = {OutOfTheWay(sockets.control), OutOfTheWay(listener)};
    (void)close_range(kControlSocket, kListenerSocket, 0);
    Put(aside.control, kControlSocket);
    Put(aside.listener, kListenerSocket);
    (void)close_range(kListenerSocket + 1, ~0U, 0);
}
