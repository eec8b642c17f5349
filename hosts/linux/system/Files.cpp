#include <errno.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <exception>
#include <string>

#include "platform/System.h"

namespace {

// "a/b/" is the folder "a/b", not something in it.
std::string WithoutFinalSlashes(const std::string& path) {
    const size_t last = path.find_last_not_of('/');
    return path.substr(0, last == std::string::npos ? 1 : last + 1);
}

// A parent that cannot be made shows when the folder in it cannot.
void MakeParents(const std::string& folder) {
    for (size_t slash = folder.find('/', 1); slash != std::string::npos;
         slash = folder.find('/', slash + 1)) {
        (void)mkdir(folder.substr(0, slash).c_str(), 0755);
    }
}

// Not through the umask: who asks for a mode means it.
int MakeFolder(const std::string& folder, int uid, int gid, mode_t mode) {
    const char* path = folder.c_str();
    struct stat facts = {};
    if (mkdir(path, mode) != 0) {
        return stat(path, &facts) == 0 && S_ISDIR(facts.st_mode) ? 0 : -1;
    }
    if (chmod(path, mode) != 0) {
        return -1;
    }
    return uid < 0 && gid < 0 ? 0 : chown(path, static_cast<uid_t>(uid), static_cast<gid_t>(gid));
}

}  // namespace

extern "C" {

int TLIBCFileExist(const char* path) {
    struct stat facts = {};
    return path != nullptr && stat(path, &facts) == 0 && S_ISREG(facts.st_mode) ? 1 : 0;
}

int TLIBCFileUTime(const char* path, int now, long when) {
    if (path == nullptr) {
        errno = EINVAL;
        return -1;
    }
    struct timespec times[2] = {};
    times[0].tv_sec = times[1].tv_sec = when;
    times[0].tv_nsec = times[1].tv_nsec = now != 0 ? UTIME_NOW : 0;
    return utimensat(AT_FDCWD, path, times, 0);
}

int TALOFSMkdirP(const char* path, int, int parents, int uid, int gid, mode_t mode) {
    try {
        const std::string folder = WithoutFinalSlashes(path != nullptr ? path : "");
        if (parents != 0) {
            MakeParents(folder);
        }
        return MakeFolder(folder, uid, gid, mode & 07777);
    } catch (const std::exception&) {
        errno = ENOMEM;
        return -1;
    }
}

int TLIBCSysUnlink(const char* path) {
    if (path == nullptr) {
        errno = EINVAL;
        return -1;
    }
    return unlink(path);
}

}  // extern "C"
