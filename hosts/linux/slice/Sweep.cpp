#include "hosts/linux/slice/Sweep.h"

#include <errno.h>
#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <time.h>
#include <unistd.h>

#include <algorithm>
#include <limits>
#include <set>
#include <utility>
#include <vector>

#include "hosts/linux/file/Guard.h"
#include "hosts/linux/slice/Folder.h"
#include "hosts/linux/slice/Limits.h"
#include "hosts/linux/util/Descriptor.h"

namespace host {

namespace {

constexpr long long kSweepEverySeconds = 3600;

// What a process that died left half made. A live one takes no such time.
constexpr long long kLeftoverSeconds = 3600;

// Its change tells when all was swept last.
constexpr char kMarker[] = ".swept";

std::string PathIn(const std::string& folder, const std::string& name) {
    return folder + "/" + name;
}

// The later change of record and data. False when there is neither.
bool LastUse(const std::string& folder, const std::string& id, long long* when, bool* hasRecord) {
    struct stat data = {};
    struct stat record = {};
    const bool hasData = lstat(SliceDataPath(folder, id).c_str(), &data) == 0;
    *hasRecord = lstat(SliceRecordPath(folder, id).c_str(), &record) == 0;
    const long long never = std::numeric_limits<long long>::min();
    *when =
        std::max<long long>(hasData ? data.st_mtime : never, *hasRecord ? record.st_mtime : never);
    return hasData || *hasRecord;
}

bool IsDue(const std::string& folder, const std::string& id, long long keepSeconds, long long now) {
    long long lastUse = 0;
    bool hasRecord = false;
    return LastUse(folder, id, &lastUse, &hasRecord) &&
           HasExpired(lastUse, hasRecord ? keepSeconds : kLeftoverSeconds, now);
}

// Asked once more under the lock: a slice may have arrived meanwhile. What is no
// record of ours cannot be locked, and nobody holds it.
bool SweepUpload(const std::string& folder, const std::string& id, long long keepSeconds,
                 long long now) {
    if (!IsDue(folder, id, keepSeconds, now)) {
        return false;
    }
    const Descriptor record(OpenOwnFile(SliceRecordPath(folder, id), O_RDONLY));
    if ((record.Get() >= 0 && flock(record.Get(), LOCK_EX | LOCK_NB) != 0) ||
        (record.Get() < 0 && (errno == EMFILE || errno == ENFILE)) ||
        !IsDue(folder, id, keepSeconds, now)) {
        return false;
    }
    (void)unlink(SliceRecordPath(folder, id).c_str());
    (void)unlink(SliceDataPath(folder, id).c_str());
    return true;
}

void RemoveOlder(const std::string& path, long long keepSeconds, long long now) {
    struct stat facts = {};
    if (lstat(path.c_str(), &facts) == 0 && HasExpired(facts.st_mtime, keepSeconds, now)) {
        (void)unlink(path.c_str());
    }
}

// Whether it is time to sweep all; then the next time begins.
bool TakeTurn(const std::string& folder, long long now) {
    const Descriptor marker(open(PathIn(folder, kMarker).c_str(),
                                 O_RDWR | O_CREAT | O_CLOEXEC | O_NOFOLLOW | O_NONBLOCK,
                                 S_IRUSR | S_IWUSR));
    struct stat facts = {};
    if (marker.Get() < 0 || flock(marker.Get(), LOCK_EX | LOCK_NB) != 0 ||
        fstat(marker.Get(), &facts) != 0) {
        return false;
    }
    const bool due = facts.st_mtime > now || now - facts.st_mtime >= kSweepEverySeconds;
    return due && futimens(marker.Get(), nullptr) == 0;
}

}  // namespace

bool HasExpired(long long lastUse, long long keepSeconds, long long now) {
    return lastUse < now && now - lastUse > keepSeconds;
}

void SweepOwner(const std::string& folder, long long keepSeconds, long long now,
                size_t* unfinished) {
    std::set<std::string> uploads;
    for (const std::string& name : NamesIn(folder)) {
        const SliceName read = ReadSliceName(name);
        if (read.kind == SliceNameKind::kRecord || read.kind == SliceNameKind::kData) {
            uploads.insert(read.id);
        } else if (read.kind == SliceNameKind::kDone) {
            RemoveOlder(PathIn(folder, name), keepSeconds, now);
        } else if (read.kind == SliceNameKind::kUnwritten) {
            RemoveOlder(PathIn(folder, name), kLeftoverSeconds, now);
        }
    }
    size_t left = 0;
    for (const std::string& id : uploads) {
        if (!SweepUpload(folder, id, keepSeconds, now)) {
            ++left;
        }
    }
    *unfinished = left;
}

void ForgetComplete(const std::string& folder, size_t most) {
    std::vector<std::pair<long long, std::string>> complete;
    for (const std::string& name : NamesIn(folder)) {
        struct stat facts = {};
        if (ReadSliceName(name).kind == SliceNameKind::kDone &&
            lstat(PathIn(folder, name).c_str(), &facts) == 0) {
            complete.emplace_back(facts.st_mtime, name);
        }
    }
    if (complete.size() <= most) {
        return;
    }
    std::sort(complete.begin(), complete.end());
    complete.resize(complete.size() - most);
    for (const auto& entry : complete) {
        (void)unlink(PathIn(folder, entry.second).c_str());
    }
}

}  // namespace host

namespace talo {

void SweepSliceUploads() {
    (void)host::Guarded(false, [] {
        const std::string folder = host::SliceFolder();
        const long long now = time(nullptr);
        if (!host::TakeTurn(folder, now)) {
            return false;
        }
        const long long keepSeconds = host::ConfiguredSliceLimits().keepSeconds;
        for (const std::string& name : host::NamesIn(folder)) {
            size_t unfinished = 0;
            if (name[0] != '.') {
                host::SweepOwner(host::PathIn(folder, name), keepSeconds, now, &unfinished);
            }
        }
        return true;
    });
}

}  // namespace talo
