#include "programs/webapi_server/RequestBody.h"

#include <poll.h>
#include <stdlib.h>
#include <sys/ioctl.h>
#include <sys/socket.h>
#include <unistd.h>

long long LengthOfBody() {
    const char* const text = getenv("CONTENT_LENGTH");
    return strtoll(text != nullptr ? text : "0", nullptr, 10);
}

void EndInputBehindBody() {
    constexpr long long kSmall = 64LL * 1024;
    constexpr int kMostMilliseconds = 1000;
    const long long length = LengthOfBody();
    int here = 0;
    for (int waited = 0; ioctl(STDIN_FILENO, FIONREAD, &here) == 0; ++waited) {
        if (here >= length) {
            (void)shutdown(STDIN_FILENO, SHUT_RD);
            return;
        }
        if (length > kSmall || waited == kMostMilliseconds) {
            return;
        }
        (void)usleep(1000);
    }
}

bool IsBodyStillComing() {
    constexpr int kMostMilliseconds = 20;
    struct pollfd input = {STDIN_FILENO, POLLIN, 0};
    char first = 0;
    return poll(&input, 1, kMostMilliseconds) > 0 && recv(STDIN_FILENO, &first, 1, MSG_PEEK) > 0;
}
