#include <fcntl.h>
#include <unistd.h>

#include "platform/System.h"

namespace {

void DetachStandardDescriptors() {
    // Not close-on-exec: where a standard descriptor was closed, this one takes
    // its place and has to outlive an exec.
    const int nowhere = open("/dev/null", O_RDWR);
    for (int descriptor = STDIN_FILENO; descriptor <= STDERR_FILENO; ++descriptor) {
        if (nowhere < 0) {
            (void)close(descriptor);
        } else {
            (void)dup2(nowhere, descriptor);
        }
    }
    if (nowhere > STDERR_FILENO) {
        (void)close(nowhere);
    }
}

}  // namespace

extern "C" int TLIBCProcFork(void) {
    const pid_t child = fork();
    if (child == 0) {
        DetachStandardDescriptors();
    }
    return child;
}
