#include <errno.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include "hosts/linux/util/HostLog.h"
#include "platform/Paths.h"
#include "platform/System.h"

namespace {

constexpr char kSource[] = "Service.cpp";

int WaitFor(pid_t child) {
    int status = 0;
    while (waitpid(child, &status, 0) < 0) {
        if (errno != EINTR) {
            return -1;
        }
    }
    return WIFEXITED(status) && WEXITSTATUS(status) == 0 ? 0 : -1;
}

}  // namespace

// The service program is the integrator's: it gets the service and the action
// as words, without a shell in between.
extern "C" int TLIBNetService(int service, int action, int) {
    if (service != TALO_SERVICE_HTTPD || action != TALO_SERVICE_RESTART) {
        errno = EINVAL;
        return -1;
    }
    char program[] = TALO_SERVICE_PROGRAM;
    char serviceName[] = "httpd";
    char actionName[] = "restart";
    char* const arguments[] = {program, serviceName, actionName, nullptr};
    pid_t child = -1;
    const int error = posix_spawn(&child, program, nullptr, nullptr, arguments, environ);
    if (error != 0) {
        errno = error;
        HOST_LOG("cannot run %s: %m", program);
        return -1;
    }
    return WaitFor(child);
}
