#include "hosts/linux/cgi/UploadSweep.h"

#include <dirent.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <time.h>
#include <unistd.h>

#include <memory>

#include "hosts/linux/cgi/UploadName.h"
#include "hosts/linux/util/Descriptor.h"

namespace host {

namespace {

const char kStamp[] = ".webapi-upload-sweep";
constexpr int kMostEntries = 100000;  // a request does not wait for more

struct CloseFolder {
    void operator()(DIR* folder) const {
        (void)closedir(folder);
    }
};
using Folder = std::unique_ptr<DIR, CloseFolder>;

bool IsOlder(const struct stat& facts, long seconds) {
    const time_t now = time(nullptr);
    return facts.st_mtime < now - seconds || facts.st_mtime > now + seconds;
}

// Marks the folder as swept now. False when it was swept lately, or cannot be
// marked: then every request would sweep it.
bool TakeTurn(int folder) {
    struct stat facts = {};
    if (fstatat(folder, kStamp, &facts, AT_SYMLINK_NOFOLLOW) == 0 &&
        !IsOlder(facts, kSweepSeconds)) {
        return false;
    }
    const Descriptor stamp(
        openat(folder, kStamp, O_WRONLY | O_CREAT | O_NOFOLLOW | O_NONBLOCK | O_CLOEXEC, 0600));
    return stamp.Get() >= 0 && futimens(stamp.Get(), nullptr) == 0;
}

bool IsAbandoned(int folder, const char* name) {
    pid_t pid = 0;
    unsigned long long start = 0;
    struct stat facts = {};
    if (!ParseUploadName(name, &pid, &start) ||
        fstatat(folder, name, &facts, AT_SYMLINK_NOFOLLOW) != 0 || !S_ISREG(facts.st_mode) ||
        facts.st_uid != geteuid() || !IsOlder(facts, kAbandonedSeconds)) {
        return false;
    }
    const unsigned long long alive = ProcessStart(pid);
    return alive == 0 || alive != start;
}

}  // namespace

void SweepUploads(const std::string& dir) {
    const Folder folder(opendir(dir.c_str()));
    if (folder == nullptr || !TakeTurn(dirfd(folder.get()))) {
        return;
    }
    const int descriptor = dirfd(folder.get());
    const struct dirent* entry = nullptr;
    for (int count = 0; count < kMostEntries && (entry = readdir(folder.get())) != nullptr;
         ++count) {
        if (IsAbandoned(descriptor, entry->d_name)) {
            (void)unlinkat(descriptor, entry->d_name, 0);
        }
    }
}

}  // namespace host
