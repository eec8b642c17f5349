#include "programs/webapi_server/Changes.h"

#include <dirent.h>
#include <fcntl.h>
#include <string.h>
#include <sys/stat.h>
#include <unistd.h>

#include <memory>
#include <utility>

namespace {

constexpr int kMostUnsettledLooks = 10;
constexpr uint64_t kHashStart = 1469598103934665603u;
constexpr uint64_t kHashFactor = 1099511628211u;

uint64_t Mix(uint64_t hash, uint64_t value) {
    for (int shift = 0; shift < 64; shift += 8) {
        hash = (hash ^ (value >> shift & 0xff)) * kHashFactor;
    }
    return hash;
}

uint64_t Mix(uint64_t hash, const struct timespec& time) {
    return Mix(Mix(hash, static_cast<uint64_t>(time.tv_sec)), static_cast<uint64_t>(time.tv_nsec));
}

// Of one file; the sum over all is that of a set, in whatever order they are met.
uint64_t Identity(int folder, const char* name) {
    uint64_t hash = kHashStart;
    for (const char* letter = name; *letter != '\0'; ++letter) {
        hash = Mix(hash, static_cast<unsigned char>(*letter));
    }
    struct stat facts = {};
    if (fstatat(folder, name, &facts, 0) != 0) {
        return hash;
    }
    hash = Mix(Mix(Mix(hash, facts.st_dev), facts.st_ino), static_cast<uint64_t>(facts.st_size));
    return Mix(Mix(hash, facts.st_mtim), facts.st_ctim);
}

bool IsDescription(const char* name) {
    const size_t length = strlen(name);
    return strcmp(name, "lib.def") == 0 ||
           (length > 4 && name[0] != '.' && strcmp(name + length - 4, ".lib") == 0);
}

}  // namespace

Changes::Changes(std::string folder) : folder_(std::move(folder)), loaded_(Now()), last_(loaded_) {}

void Changes::AddLibrary(const std::string& path) {
    for (const std::string& known : libraries_) {
        if (known == path) {
            return;
        }
    }
    libraries_.push_back(path);
    const int folder = open(folder_.c_str(), O_PATH | O_DIRECTORY | O_CLOEXEC);
    const uint64_t added = Identity(folder, path.c_str());
    if (folder >= 0) {
        (void)close(folder);
    }
    loaded_ += added;
    last_ += added;
}

bool Changes::Look() {
    const uint64_t now = Now();
    if (now == loaded_) {
        last_ = now;
        unsettled_ = 0;
        return false;
    }
    const bool settled = now == std::exchange(last_, now);
    return settled || ++unsettled_ >= kMostUnsettledLooks;
}

uint64_t Changes::Now() const {
    const std::unique_ptr<DIR, int (*)(DIR*)> folder(opendir(folder_.c_str()), closedir);
    const int descriptor = folder != nullptr ? dirfd(folder.get()) : -1;
    uint64_t sum = 0;
    while (const struct dirent* entry = folder != nullptr ? readdir(folder.get()) : nullptr) {
        if (IsDescription(entry->d_name)) {
            sum += Identity(descriptor, entry->d_name);
        }
    }
    for (const std::string& library : libraries_) {
        sum += Identity(descriptor, library.c_str());
    }
    return sum;
}
