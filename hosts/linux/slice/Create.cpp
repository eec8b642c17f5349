#include <errno.h>
#include <fcntl.h>
#include <sys/file.h>
#include <sys/statvfs.h>
#include <time.h>
#include <unistd.h>

#include "hosts/linux/file/Guard.h"
#include "hosts/linux/sdk/Slices.h"
#include "hosts/linux/slice/Body.h"
#include "hosts/linux/slice/Folder.h"
#include "hosts/linux/slice/Limits.h"
#include "hosts/linux/slice/Record.h"
#include "hosts/linux/slice/Sweep.h"
#include "hosts/linux/util/Descriptor.h"
#include "hosts/linux/util/SmallFile.h"

namespace talo {

namespace {

bool IsSensible(const SliceFile& file) {
    return !file.owner.empty() && file.owner.size() <= host::kMaxSliceOwnerBytes &&
           file.target.size() <= host::kMaxSliceTargetBytes &&
           (file.digest.empty() || IsSliceDigest(file.digest));
}

// A file that cannot fit is better refused now than after hours.
bool HasRoom(const std::string& folder, unsigned long long bytes) {
    struct statvfs facts = {};
    if (statvfs(folder.c_str(), &facts) != 0 || facts.f_frsize == 0) {
        return true;
    }
    return bytes / facts.f_frsize < facts.f_bavail || bytes == 0;
}

// Held while uploads are counted and one is added, so that two processes do not
// both take the last place.
bool LockFolder(int folder) {
    while (flock(folder, LOCK_EX) != 0) {
        if (errno != EINTR) {
            return false;
        }
    }
    return true;
}

}  // namespace

// Nobody else knows the id yet, and a sweep passes by what is new.
SliceResult SliceUpload::Hold(const std::string& folder, const std::string& id) {
    const std::string record = host::SliceRecordPath(folder, id);
    const bool written = host::ReplaceFile(record, host::FormatSliceRecord(file_));
    record_ = written ? host::OpenOwnFile(record, O_RDONLY) : -1;
    if (record_ < 0 || flock(record_, LOCK_EX | LOCK_NB) != 0) {
        const SliceResult result = host::ResultOf(errno);
        (void)unlink(record.c_str());
        (void)unlink(host::SliceDataPath(folder, id).c_str());
        LetGo();
        return result;
    }
    folder_ = folder;
    id_ = id;
    return SliceResult::kDone;
}

SliceResult SliceUpload::Create(const SliceFile& file) {
    return host::Guarded(SliceResult::kFailed, [&] {
        LetGo();
        const host::SliceLimits limits = host::ConfiguredSliceLimits();
        if (!IsSensible(file)) {
            return SliceResult::kFailed;
        }
        if (file.length > limits.maxBytes) {
            return SliceResult::kTooLong;
        }
        if (!host::MakeOwnerFolder(file.owner)) {
            return SliceResult::kFailed;
        }
        SweepSliceUploads();
        const std::string folder = host::OwnerFolder(file.owner);
        const host::Descriptor lock(open(folder.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
        if (lock.Get() < 0 || !LockFolder(lock.Get())) {
            return host::ResultOf(errno);
        }
        size_t unfinished = 0;
        host::SweepOwner(folder, limits.keepSeconds, time(nullptr), &unfinished);
        host::ForgetComplete(folder, limits.perUser);
        if (unfinished >= limits.perUser) {
            return SliceResult::kTooMany;
        }
        if (!HasRoom(folder, file.length)) {
            return SliceResult::kNoSpace;
        }
        const std::string id = host::NewSliceId();
        data_ = id.empty()
                    ? -1
                    : open(host::SliceDataPath(folder, id).c_str(),
                           O_RDWR | O_CREAT | O_EXCL | O_CLOEXEC | O_NOFOLLOW, S_IRUSR | S_IWUSR);
        if (data_ < 0) {
            return host::ResultOf(errno);
        }
        file_ = file;
        file_.created = time(nullptr);
        file_.complete = false;
        return Hold(folder, id);
    });
}

}  // namespace talo
