#include "src/base/FileIdentity.h"

#include <errno.h>
#include <sys/stat.h>
#include <time.h>

#include <algorithm>

namespace TALO {

namespace {

constexpr std::int64_t kNanosecondsPerSecond = 1000000000;
constexpr std::int64_t kSettledAfter = 2 * kNanosecondsPerSecond;

std::int64_t Nanoseconds(const struct timespec& time) {
    return time.tv_sec * kNanosecondsPerSecond + time.tv_nsec;
}

bool LookAtDisk(const char* path, FileIdentity* identity) {
    const int keptErrno = errno;
    struct stat facts = {};
    const bool known = stat(path, &facts) == 0 && S_ISREG(facts.st_mode);
    errno = keptErrno;
    if (!known) {
        return false;
    }
    identity->device = facts.st_dev;
    identity->inode = facts.st_ino;
    identity->size = facts.st_size;
    identity->modified = Nanoseconds(facts.st_mtim);
    identity->changed = Nanoseconds(facts.st_ctim);
    return true;
}

FileIdentifier currentIdentifier = LookAtDisk;

}  // namespace

bool operator==(const FileIdentity& left, const FileIdentity& right) {
    return left.device == right.device && left.inode == right.inode && left.size == right.size &&
           left.modified == right.modified && left.changed == right.changed;
}

bool IdentifyFile(const char* path, FileIdentity* identity) {
    return currentIdentifier(path, identity);
}

FileIdentifier SetFileIdentifier(FileIdentifier identifier) {
    FileIdentifier before = currentIdentifier;
    currentIdentifier = identifier != nullptr ? identifier : LookAtDisk;
    return before;
}

// A time in the future, after a clock was set back, is not settled either.
bool IsSettled(const FileIdentity& identity) {
    struct timespec now = {};
    (void)clock_gettime(CLOCK_REALTIME, &now);
    return std::max(identity.modified, identity.changed) <= Nanoseconds(now) - kSettledAfter;
}

}  // namespace TALO
