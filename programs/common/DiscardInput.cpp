#include "programs/common/DiscardInput.h"

#include <limits.h>
#include <poll.h>
#include <string.h>
#include <strings.h>
#include <time.h>
#include <unistd.h>

#include <algorithm>
#include <cstdlib>

namespace {

long MillisecondsNow() {
    struct timespec now = {};
    (void)clock_gettime(CLOCK_MONOTONIC, &now);
    return now.tv_sec * 1000 + now.tv_nsec / 1000000;
}

// What web servers pass on while it comes.
bool IsUpload() {
    const char* const type = getenv("CONTENT_TYPE");
    const char* const name = getenv("HTTP_X_TYPE_NAME");
    return (type != nullptr && strstr(type, "multipart/form-data") != nullptr) ||
           (name != nullptr && strcasecmp(name, "sliceupload") == 0);
}

}  // namespace

void DiscardInput(bool ends) {
    const bool isComing = ends || IsUpload();
    const long mostBytes = isComing ? LONG_MAX : 64L << 20;
    const long mostMilliseconds = isComing ? 10000 : 1000;
    constexpr long kPause = 1000;  // of whoever sends
    static char discarded[64 * 1024];
    struct pollfd input = {STDIN_FILENO, POLLIN, 0};
    const long end = MillisecondsNow() + mostMilliseconds;
    long total = 0;
    for (long left = isComing ? kPause : 0;
         total < mostBytes && left >= 0 && poll(&input, 1, static_cast<int>(left)) > 0;
         left = std::min(kPause, end - MillisecondsNow())) {
        const ssize_t count = read(STDIN_FILENO, discarded, sizeof discarded);
        if (count <= 0) {
            return;
        }
        total += count;
    }
}
