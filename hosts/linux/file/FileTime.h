#ifndef TALO_HOSTS_LINUX_FILE_FILETIME_H
#define TALO_HOSTS_LINUX_FILE_FILETIME_H

#include <sys/stat.h>

namespace host {

// What a file that came by the web API may be opened for by others.
constexpr mode_t kFileMode = 0644;

// Sets the time of the last change, in seconds since the epoch; a negative one
// leaves it. False with errno.
inline bool SetFileTime(int file, long long mtime) {
    struct timespec times[2] = {};
    times[0].tv_nsec = UTIME_OMIT;
    times[1].tv_sec = static_cast<time_t>(mtime);
    return mtime < 0 || futimens(file, times) == 0;
}

}  // namespace host

#endif
