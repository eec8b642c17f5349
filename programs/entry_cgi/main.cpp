#include <fcntl.h>
#include <poll.h>
#include <signal.h>
#include <time.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>

#include "platform/Paths.h"
#include "webapi/WebEntry.h"

namespace {

// A reply that fits leaves in one write.
char outputBuffer[64 * 1024];

// What the web server handed over: descriptors 0, 1 and 2, each one open, and
// nothing else. Some servers leak theirs.
void TidyDescriptors() {
    for (int descriptor = 0; descriptor <= 2; ++descriptor) {
        if (fcntl(descriptor, F_GETFD) < 0) {
            (void)open("/dev/null", O_RDWR);
        }
    }
    (void)close_range(3, ~0U, 0);
}

// These mark the child that runs a background task. A web server's environment
// must not make a request pose as one.
void ForgetTaskIdentity() {
    for (const char* name : {"task_id", "task_user", "full_task_id"}) {
        (void)unsetenv(name);
    }
}

long MillisecondsNow() {
    struct timespec now = {};
    (void)clock_gettime(CLOCK_MONOTONIC, &now);
    return now.tv_sec * 1000 + now.tv_nsec / 1000000;
}

// Takes what is left of a body that nobody asked for: some servers lose the
// reply of a program that ends before it has read its input. Never waits for a
// client that sends nothing, and for one that dawdles no longer than a moment.
void DiscardInput() {
    constexpr long kMostBytes = 64L << 20;
    constexpr long kMostMilliseconds = 1000;
    static char discarded[64 * 1024];
    struct pollfd input = {STDIN_FILENO, POLLIN, 0};
    const long end = MillisecondsNow() + kMostMilliseconds;
    long total = 0;
    for (long left = 0;
         total < kMostBytes && left >= 0 && poll(&input, 1, static_cast<int>(left)) > 0;
         left = end - MillisecondsNow()) {
        const ssize_t count = read(STDIN_FILENO, discarded, sizeof discarded);
        if (count <= 0) {
            return;
        }
        total += count;
    }
}

}  // namespace

int main(int argc, char** argv) {
    TidyDescriptors();
    (void)signal(SIGPIPE, SIG_IGN);
    ForgetTaskIdentity();
    (void)setvbuf(stdout, outputBuffer, _IOFBF, sizeof outputBuffer);
    if (chdir(TALO_WEBAPI_DIR) != 0) {
        perror("entry.cgi: " TALO_WEBAPI_DIR);
    }
    TALO::WebEntry entry;
    entry.SetArgs(argc, argv);
    (void)entry.Run(Json::Value());
    DiscardInput();
    return 0;
}
