#include <errno.h>
#include <signal.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include "hosts/linux/util/HostLog.h"
#include "platform/Paths.h"
#include "platform/System.h"

namespace {

constexpr char kSource[] = "Service.cpp";

// Starts a program with the signals that we ignore back at their defaults.
int Spawn(pid_t* child, char* const arguments[]) {
    posix_spawnattr_t attributes;
    const int error = posix_spawnattr_init(&attributes);
    if (error != 0) {
        return error;
    }
    sigset_t ignored;
    (void)sigemptyset(&ignored);
    (void)sigaddset(&ignored, SIGPIPE);
    (void)posix_spawnattr_setsigdefault(&attributes, &ignored);
    (void)posix_spawnattr_setflags(&attributes, POSIX_SPAWN_SETSIGDEF);
    const int result = posix_spawn(child, arguments[0], nullptr, &attributes, arguments, environ);
    (void)posix_spawnattr_destroy(&attributes);
    return result;
}

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
    const int error = Spawn(&child, arguments);
    if (error != 0) {
        errno = error;
        HOST_LOG("cannot run %s: %m", program);
        return -1;
    }
    return WaitFor(child);
}
