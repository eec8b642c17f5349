#include "programs/webapi_server/Deadline.h"

#include <algorithm>

#include "programs/webapi_server/Progress.h"

namespace {

constexpr long long kMostQuiet = 15000;  // a worker with a request that it has not begun
constexpr long long kMostSilent = 600000;

bool IsQuietForLong(Watch* watch, long long now) {
    if (watch->quietSince == 0) {
        watch->quietSince = now;
    }
    return now - watch->quietSince > kMostQuiet;
}

// The number of bytes costs a look into a file: not at every turn.
void LookForProgress(long long began, long long allowed, pid_t worker, Watch* watch,
                     long long now) {
    if (now - std::max(began, watch->progressAt) <= allowed / 4) {
        return;
    }
    const unsigned long long transferred = TransferredBytes(worker);
    if (transferred != watch->transferred) {
        watch->transferred = transferred;
        watch->progressAt = now;
    }
}

bool IsPast(long long began, long long allowed, const Watch& watch, long long now) {
    return now - std::max(began, watch.progressAt) > allowed;
}

}  // namespace

bool IsPastDeadline(const Slot& slot, pid_t worker, Watch* watch, long long now) {
    const long long began = slot.began;
    if (began == 0) {
        // It reads the request, or puts itself back after it.
        return IsQuietForLong(watch, now);
    }
    watch->quietSince = 0;
    const long long allowed = slot.allowedMs;
    if (allowed <= 0) {
        return false;
    }
    if (slot.transfers == 1) {
        LookForProgress(began, allowed, worker, watch, now);
    }
    return IsPast(began, allowed, *watch, now);
}

bool IsPastOrphansDeadline(const Slot& slot, pid_t worker, Watch* watch, long long now) {
    const long long began = slot.began;
    if (began == 0 || slot.allowedMs > 0) {
        return IsPastDeadline(slot, worker, watch, now);
    }
    LookForProgress(began, kMostSilent, worker, watch, now);
    return IsPast(began, kMostSilent, *watch, now);
}
