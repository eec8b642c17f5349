#include <fcntl.h>
#include <unistd.h>

#include "platform/System.h"

namespace {

void DetachStandardDescriptors() {
    const int nowhere = open("/dev/null", O_RDWR | O_CLOEXEC);
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
