#include "hosts/linux/file/Resolve.h"

#include <errno.h>
#include <fcntl.h>
#include <linux/openat2.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <unistd.h>

namespace host {

namespace {

// The kernel gives up when somebody renames folders while it follows a link
// with "..": an attacker may do that for ever.
constexpr int kMaxTries = 64;

bool alwaysWalk = false;

std::string Joined(const std::vector<std::string>& parts) {
    std::string path;
    for (const std::string& part : parts) {
        path += path.empty() ? part : "/" + part;
    }
    return path.empty() ? "." : path;
}

int OpenByKernel(int folder, const std::vector<std::string>& parts, int flags) {
    const std::string path = Joined(parts);
    struct open_how how = {};
    how.flags = static_cast<unsigned>(flags | O_CLOEXEC);
    how.resolve = RESOLVE_BENEATH | RESOLVE_NO_MAGICLINKS;
    long opened = -1;
    for (int tries = 0; tries < kMaxTries; ++tries) {
        opened = syscall(SYS_openat2, folder, path.c_str(), &how, sizeof how);
        if (opened >= 0 || (errno != EAGAIN && errno != EINTR)) {
            break;
        }
    }
    if (opened < 0 && (errno == EXDEV || errno == EAGAIN)) {
        errno = ELOOP;
    }
    return static_cast<int>(opened);
}

// Some sandboxes answer EPERM to a call that they do not know.
bool KernelLacksIt(int error) {
    return error == ENOSYS || error == EPERM;
}

bool IsLink(int folder, const char* name) {
    struct stat facts = {};
    return fstatat(folder, name, &facts, AT_SYMLINK_NOFOLLOW) == 0 && S_ISLNK(facts.st_mode);
}

// O_PATH opens a link itself, and O_DIRECTORY calls one no folder.
int OpenNoLink(int folder, const std::string& name, int flags) {
    const int opened = openat(folder, name.c_str(), flags | O_NOFOLLOW | O_CLOEXEC);
    if (opened < 0) {
        if (errno == ENOTDIR) {
            errno = IsLink(folder, name.c_str()) ? ELOOP : ENOTDIR;
        }
        return -1;
    }
    struct stat facts = {};
    if ((flags & O_PATH) != 0 && fstat(opened, &facts) == 0 && S_ISLNK(facts.st_mode)) {
        (void)close(opened);
        errno = ELOOP;
        return -1;
    }
    return opened;
}

}  // namespace

int OpenByWalk(int folder, const std::vector<std::string>& parts, int flags) {
    if (parts.empty()) {
        return OpenNoLink(folder, ".", flags);
    }
    int at = folder;
    for (size_t index = 0; index < parts.size(); ++index) {
        const bool isLast = index + 1 == parts.size();
        const int next = OpenNoLink(at, parts[index], isLast ? flags : O_PATH | O_DIRECTORY);
        const int error = errno;
        if (at != folder) {
            (void)close(at);
        }
        errno = error;
        if (next < 0) {
            return -1;
        }
        at = next;
    }
    return at;
}

int OpenBeneath(int folder, const std::vector<std::string>& parts, int flags) {
    if (!alwaysWalk) {
        const int opened = OpenByKernel(folder, parts, flags);
        if (opened >= 0 || !KernelLacksIt(errno)) {
            return opened;
        }
    }
    return OpenByWalk(folder, parts, flags);
}

void AlwaysWalk(bool always) {
    alwaysWalk = always;
}

}  // namespace host
