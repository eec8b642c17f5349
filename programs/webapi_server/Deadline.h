#ifndef TALO_PROGRAMS_WEBAPI_SERVER_DEADLINE_H
#define TALO_PROGRAMS_WEBAPI_SERVER_DEADLINE_H

#include <sys/types.h>

#include "programs/webapi_server/Slot.h"

// What is remembered of a worker with a request between two looks at its slot.
struct Watch {
    long long quietSince = 0;  // it shows no request, ms
    long long progressAt = 0;  // bytes were seen to move, ms
    unsigned long long transferred = 0;
};

// Whether the worker has had the time that it shows in its slot, at this look. An
// upload or a download that moves bytes gets more.
bool IsPastDeadline(const Slot& slot, pid_t worker, Watch* watch, long long now);

// The same for a worker that nobody else looks after: without a limit, it has ten
// minutes from one byte that it moves to the next.
bool IsPastOrphansDeadline(const Slot& slot, pid_t worker, Watch* watch, long long now);

#endif
