#include "programs/webapi_server/RestoreDescriptors.h"

#include <dirent.h>
#include <fcntl.h>
#include <limits.h>
#include <sys/stat.h>
#include <syslog.h>
#include <unistd.h>

#include <cstdlib>
#include <utility>

namespace {

// SQLite has up to three files of a database open; a journal comes and goes.
constexpr int kMostOfHost = 6;

constexpr int kMostSideBySide = 32;

// The numbers that are open, but for that of the look itself.
bool OpenDescriptors(std::vector<int>* numbers) {
    const int folder = open("/proc/self/fd", O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    if (folder < 0) {
        return false;
    }
    alignas(struct dirent64) char block[4096];
    ssize_t size = 0;
    while ((size = getdents64(folder, block, sizeof block)) > 0) {
        for (ssize_t at = 0; at < size;) {
            const auto* entry = reinterpret_cast<const struct dirent64*>(block + at);
            at += entry->d_reclen;
            if (entry->d_name[0] != '.') {
                const int number = atoi(entry->d_name);
                if (number != folder) {
                    numbers->push_back(number);
                }
            }
        }
    }
    (void)close(folder);
    return size == 0;
}

std::string Target(int descriptor) {
    char target[PATH_MAX];
    const std::string name = "/proc/self/fd/" + std::to_string(descriptor);
    const ssize_t size = readlink(name.c_str(), target, sizeof target);
    return std::string(target, size > 0 ? static_cast<size_t>(size) : 0);
}

}  // namespace

// The connection to the system's log opens by itself, and whenever it likes.
RestoreDescriptors::RestoreDescriptors(std::string hostFolder)
    : hostFolder_(std::move(hostFolder) + "/"),
      errors_(fcntl(STDERR_FILENO, F_DUPFD_CLOEXEC, STDERR_FILENO + 1)),
      folder_(open("/proc/self/fd", O_PATH | O_DIRECTORY | O_CLOEXEC)) {
    closelog();
    count_ = Count();
    // A worker has them side by side: to list them all would take longer.
    long long left = count_;
    for (int number = 0; number < kMostSideBySide && left > 0; ++number) {
        left -= Record(number) ? 1 : 0;
    }
    if (count_ <= 0 || left > 0) {
        std::vector<int> numbers;
        (void)OpenDescriptors(&numbers);
        for (const int number : numbers) {
            (void)Record(number);
        }
    }
}

bool RestoreDescriptors::Record(int number) {
    struct stat facts = {};
    if (fstat(number, &facts) != 0) {
        return false;
    }
    if (number >= STDERR_FILENO) {
        known_[number] = {facts.st_dev, facts.st_ino};
    }
    return true;
}

RestoreDescriptors::~RestoreDescriptors() {
    if (errors_ >= 0) {
        (void)close(errors_);
    }
    if (folder_ >= 0) {
        (void)close(folder_);
    }
}

// Linux 6.2 and later show it as the folder's size.
long long RestoreDescriptors::Count() const {
    struct stat facts = {};
    return fstat(folder_, &facts) == 0 ? facts.st_size : 0;
}

void RestoreDescriptors::Restore(std::vector<std::string>* changes) {
    closelog();
    const size_t before = changes->size();
    CheckKnown(changes);
    // The known ones are all there: as many as ever are none but these.
    const bool same = changes->size() == before && count_ > 0 && Count() == count_;
    if (!same) {
        CloseNew(changes);
    }
}

bool RestoreDescriptors::IsAsBefore(int descriptor, const Identity& before) const {
    struct stat facts = {};
    return fstat(descriptor, &facts) == 0 && facts.st_dev == before.device &&
           facts.st_ino == before.number;
}

void RestoreDescriptors::CheckKnown(std::vector<std::string>* changes) const {
    for (const auto& entry : known_) {
        if (!IsAsBefore(entry.first, entry.second)) {
            if (entry.first == STDERR_FILENO) {
                (void)dup2(errors_, STDERR_FILENO);
            }
            changes->push_back("descriptor " + std::to_string(entry.first) +
                               " is closed or another");
        }
    }
}

void RestoreDescriptors::CloseNew(std::vector<std::string>* changes) const {
    std::vector<int> numbers;
    if (!OpenDescriptors(&numbers)) {
        changes->emplace_back("the open descriptors cannot be counted");
        CloseAllBetween();
        return;
    }
    int ofHost = 0;
    for (const int number : numbers) {
        if (number <= STDERR_FILENO || known_.count(number) != 0) {
            continue;
        }
        const std::string target = Target(number);
        if (target.compare(0, hostFolder_.size(), hostFolder_) == 0 && ++ofHost <= kMostOfHost) {
            continue;
        }
        (void)close(number);
        changes->push_back("descriptor " + std::to_string(number) + " (" + target +
                           ") is still open");
    }
}

void RestoreDescriptors::CloseAllBetween() const {
    unsigned first = STDERR_FILENO + 1;
    for (const auto& entry : known_) {
        const auto number = static_cast<unsigned>(entry.first);
        if (number > first) {
            (void)close_range(first, number - 1, 0);
        }
        first = number >= first ? number + 1 : first;
    }
    (void)close_range(first, ~0U, 0);
}
