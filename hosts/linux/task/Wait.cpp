#include "hosts/linux/task/Wait.h"

#include <unistd.h>

#include <algorithm>

#include "hosts/linux/task/ChangeMark.h"
#include "hosts/linux/task/Clock.h"
#include "hosts/linux/task/OpenedStore.h"
#include "hosts/linux/task/Records.h"

namespace host {

namespace {

// To fall asleep and wake up is what most of a look costs: some 20 microseconds.
constexpr long long kPauseUs = 3500;

// Now and then the store is asked though nothing seems to have changed.
constexpr long long kAskEveryMs = 250;

constexpr unsigned long kLongestSeconds = 10ul * 366 * 24 * 3600;

// What was seen last.
struct Seen {
    bool valid = false;
    unsigned long long generation = 0;
    ChangeMark mark = {};
    long long askAgain = 0;
};

// The store is free between two looks: other threads use it, and may fork.
TaloTaskAnswer Look(long long number, const std::string& name, Seen* seen, bool* has) {
    const OpenedStore store;
    if (store.Get() == nullptr) {
        return kTaskFailed;
    }
    // The mark is read before the property: a change in between shows next time.
    Seen now;
    now.valid = ReadChangeMark(store.Get(), &now.mark);
    now.generation = store.Generation();
    const long long moment = SteadyMilliseconds();
    if (now.valid && seen->valid && now.generation == seen->generation && now.mark == seen->mark &&
        moment < seen->askAgain) {
        return kTaskDone;
    }
    now.askAgain = moment + kAskEveryMs;
    *seen = now;
    return HasProperty(store.Get(), number, name, has);
}

}  // namespace

TaloTaskAnswer WaitForProperty(long long number, const std::string& name, unsigned long seconds) {
    // Not a moment less: the clock's milliseconds are whole ones.
    const long long until = SteadyMilliseconds() + 1 +
                            static_cast<long long>(std::min(seconds, kLongestSeconds)) * 1000;
    Seen seen;
    for (;;) {
        bool has = false;
        const TaloTaskAnswer answer = Look(number, name, &seen, &has);
        if (has || answer != kTaskDone) {
            return answer;
        }
        const long long left = until - SteadyMilliseconds();
        if (left <= 0) {
            return kTaskMissing;
        }
        (void)usleep(static_cast<useconds_t>(std::min(1000 * left, kPauseUs)));
    }
}

}  // namespace host
