#include "hosts/linux/util/FileState.h"

#include <errno.h>
#include <time.h>

#include <algorithm>

namespace host {

namespace {

constexpr long long kNanosecondsPerSecond = 1000000000;
constexpr long long kSettledAfter = 2 * kNanosecondsPerSecond;  // the longest step

long long Nanoseconds(const struct timespec& time) {
    return time.tv_sec * kNanosecondsPerSecond + time.tv_nsec;
}

}  // namespace

FileState::FileState(const std::string& path) {
    const int keptErrno = errno;
    if (stat(path.c_str(), &facts_) != 0 || !S_ISREG(facts_.st_mode)) {
        facts_ = {};
    }
    errno = keptErrno;
}

bool FileState::IsKnown() const {
    return facts_.st_nlink != 0;
}

// A time in the future, after a clock was set back, is not settled either.
bool FileState::IsSettled() const {
    struct timespec now = {};
    (void)clock_gettime(CLOCK_REALTIME, &now);
    return std::max(Nanoseconds(facts_.st_mtim), Nanoseconds(facts_.st_ctim)) <=
           Nanoseconds(now) - kSettledAfter;
}

bool FileState::operator==(const FileState& other) const {
    return facts_.st_dev == other.facts_.st_dev && facts_.st_ino == other.facts_.st_ino &&
           facts_.st_size == other.facts_.st_size &&
           Nanoseconds(facts_.st_mtim) == Nanoseconds(other.facts_.st_mtim) &&
           Nanoseconds(facts_.st_ctim) == Nanoseconds(other.facts_.st_ctim);
}

const struct stat& FileState::Facts() const {
    return facts_;
}

}  // namespace host
