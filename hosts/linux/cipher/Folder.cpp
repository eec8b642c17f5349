#include "hosts/linux/cipher/Folder.h"

#include <errno.h>
#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include "hosts/linux/util/HostLog.h"
#include "platform/System.h"

namespace host {

namespace {

constexpr char kSource[] = "Folder.cpp";

bool IsPrivate(const struct stat& facts) {
    return (facts.st_uid == 0 || facts.st_uid == geteuid()) &&
           (facts.st_mode & (S_IRWXG | S_IRWXO)) == 0;
}

}  // namespace

bool MakePrivateFolder(const std::string& dir) {
    struct stat facts = {};
    if (stat(dir.c_str(), &facts) != 0 &&
        (TALOFSMkdirP(dir.c_str(), 0, 1, -1, -1, 0700) < 0 || stat(dir.c_str(), &facts) != 0)) {
        HOST_LOG("cannot make %s: %m", dir.c_str());
        return false;
    }
    if (!S_ISDIR(facts.st_mode) || !IsPrivate(facts)) {
        HOST_LOG("cannot use %s: it is no folder of mode 0700, or somebody else's", dir.c_str());
        return false;
    }
    return true;
}

int OpenPrivateFile(const std::string& path, int flags) {
    const int file = open(path.c_str(), flags | O_CLOEXEC | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY,
                          S_IRUSR | S_IWUSR);
    struct stat facts = {};
    if (file < 0) {
        return -1;
    }
    const bool known = fstat(file, &facts) == 0;
    if (!known || !S_ISREG(facts.st_mode) || !IsPrivate(facts)) {
        (void)close(file);
        errno = EACCES;
        return -1;
    }
    return file;
}

bool LockFile(int file) {
    while (flock(file, LOCK_EX) != 0) {
        if (errno != EINTR) {
            return false;
        }
    }
    return true;
}

}  // namespace host
