#ifndef TALO_PROGRAMS_WEBAPI_SERVER_CLOCK_H
#define TALO_PROGRAMS_WEBAPI_SERVER_CLOCK_H

#include <time.h>

// Of the clock that nobody sets.
inline long long MillisecondsNow() {
    struct timespec now = {};
    (void)clock_gettime(CLOCK_MONOTONIC, &now);
    return now.tv_sec * 1000LL + now.tv_nsec / 1000000;
}

#endif
