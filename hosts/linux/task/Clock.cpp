#include "hosts/linux/task/Clock.h"

#include <time.h>
#include <unistd.h>

namespace host {

long long SteadyMilliseconds() {
    struct timespec now = {};
    (void)clock_gettime(CLOCK_MONOTONIC, &now);
    return static_cast<long long>(now.tv_sec) * 1000 + now.tv_nsec / 1000000;
}

long long SecondsOfDay() {
    return static_cast<long long>(time(nullptr));
}

int Spread(int limit) {
    struct timespec now = {};
    (void)clock_gettime(CLOCK_MONOTONIC, &now);
    const unsigned long long mixed =
        (static_cast<unsigned long long>(now.tv_nsec) + static_cast<unsigned>(getpid())) *
        6364136223846793005ull;
    return static_cast<int>((mixed >> 33) % static_cast<unsigned>(limit));
}

}  // namespace host
