#include <fcntl.h>
#include <limits.h>
#include <poll.h>
#include <signal.h>
#include <string.h>
#include <time.h>
#include <unistd.h>

#include <algorithm>
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
// An upload that was refused has a client that is still sending for certain: it
// gets longer, however much it sends.
void DiscardInput() {
    const char* const type = getenv("CONTENT_TYPE");
    const bool isUpload = type != nullptr && strstr(type, "multipart/form-data") != nullptr;
    const long mostBytes = isUpload ? LONG_MAX : 64L << 20;
    const long mostMilliseconds = isUpload ? 10000 : 1000;
    constexpr long kPause = 1000;  // of an upload's client
    static char discarded[64 * 1024];
    struct pollfd input = {STDIN_FILENO, POLLIN, 0};
    const long end = MillisecondsNow() + mostMilliseconds;
    long total = 0;
    for (long left = isUpload ? kPause : 0;
         total < mostBytes && left >= 0 && poll(&input, 1, static_cast<int>(left)) > 0;
         left = std::min(kPause, end - MillisecondsNow())) {
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
