#include <errno.h>
#include <fcntl.h>
#include <stdio.h>
#include <strings.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <time.h>
#include <unistd.h>

#include <algorithm>
#include <utility>

#include "hosts/linux/file/Guard.h"
#include "hosts/linux/sdk/Slices.h"
#include "hosts/linux/slice/Body.h"
#include "hosts/linux/slice/Folder.h"
#include "hosts/linux/slice/Limits.h"
#include "hosts/linux/slice/Sweep.h"
#include "hosts/linux/util/Descriptor.h"
#include "hosts/linux/util/HostLog.h"

namespace talo {

namespace {

constexpr char kSource[] = "Upload.cpp";

bool IsUnused(long long lastUse) {
    return host::HasExpired(lastUse, host::ConfiguredSliceLimits().keepSeconds, time(nullptr));
}

// The folder is the owner's, so a record that names another one was moved there.
bool ReadOwnRecord(int record, const std::string& owner, SliceFile* file, long long* changed) {
    return host::ReadSliceRecord(record, file, changed) && file->owner == owner;
}

// An upload that is complete.
SliceResult FindComplete(const std::string& folder, const std::string& id, const std::string& owner,
                         SliceFile* file, unsigned long long* offset) {
    const host::Descriptor record(host::OpenOwnFile(host::SliceDonePath(folder, id), O_RDONLY));
    SliceFile read;
    long long changed = 0;
    if (record.Get() < 0 || !ReadOwnRecord(record.Get(), owner, &read, &changed) ||
        IsUnused(changed)) {
        return SliceResult::kNotFound;
    }
    read.complete = true;
    *offset = read.length;
    *file = std::move(read);
    return SliceResult::kDone;
}

// One that is not, out of its open files.
SliceResult FindUnfinished(int record, int data, const std::string& owner, SliceFile* file,
                           unsigned long long* offset) {
    SliceFile read;
    long long changed = 0;
    struct stat facts = {};
    if (!ReadOwnRecord(record, owner, &read, &changed) || fstat(data, &facts) != 0 ||
        IsUnused(std::max<long long>(changed, facts.st_mtime))) {
        return SliceResult::kNotFound;
    }
    if (static_cast<unsigned long long>(facts.st_size) > read.length) {
        HOST_LOG("an upload has more than its length");
        return SliceResult::kNotFound;
    }
    *offset = static_cast<unsigned long long>(facts.st_size);
    *file = std::move(read);
    return SliceResult::kDone;
}

// One whose data are gone while somebody holds it: they are being moved away.
SliceResult FindFinishing(int record, const std::string& owner, SliceFile* file,
                          unsigned long long* offset) {
    SliceFile read;
    long long changed = 0;
    if (!ReadOwnRecord(record, owner, &read, &changed)) {
        return SliceResult::kNotFound;
    }
    *offset = read.length;
    *file = std::move(read);
    return SliceResult::kDone;
}

}  // namespace

SliceUpload::SliceUpload() : offset_(0), record_(-1), data_(-1) {}

SliceUpload::~SliceUpload() {
    LetGo();
}

void SliceUpload::LetGo() {
    Close();
    folder_.clear();
    id_.clear();
    file_ = SliceFile();
    offset_ = 0;
}

void SliceUpload::Close() {
    for (int* file : {&data_, &record_}) {
        if (*file >= 0) {
            (void)close(*file);
        }
        *file = -1;
    }
}

// The lock comes first: what is read behind it stays true.
SliceResult SliceUpload::Open(const std::string& id, const std::string& owner) {
    return host::Guarded(SliceResult::kFailed, [&] {
        LetGo();
        SweepSliceUploads();
        const std::string folder = host::OwnerFolder(owner);
        if (folder.empty() || !IsSliceId(id)) {
            return SliceResult::kNotFound;
        }
        const std::string path = host::SliceRecordPath(folder, id);
        record_ = host::OpenOwnFile(path, O_RDONLY);
        if (record_ >= 0 && flock(record_, LOCK_EX | LOCK_NB) != 0) {
            const int error = errno;
            Close();
            return error == EWOULDBLOCK ? SliceResult::kBusy : host::ResultOf(error);
        }
        SliceResult result = SliceResult::kNotFound;
        if (record_ < 0 || !host::IsInPlace(path, record_)) {
            Close();
            result = FindComplete(folder, id, owner, &file_, &offset_);
        } else {
            data_ = host::OpenOwnFile(host::SliceDataPath(folder, id), O_RDWR);
            result = FindUnfinished(record_, data_, owner, &file_, &offset_);
        }
        if (result != SliceResult::kDone) {
            Close();
            return result;
        }
        folder_ = folder;
        id_ = id;
        if (record_ >= 0) {
            (void)futimens(record_, nullptr);
        }
        return result;
    });
}

const std::string& SliceUpload::Id() const {
    return id_;
}

const SliceFile& SliceUpload::File() const {
    return file_;
}

unsigned long long SliceUpload::Offset() const {
    return offset_;
}

SliceResult SliceUpload::Append(unsigned long long offset, unsigned long long bytes,
                                const std::string& digest) {
    return host::Guarded(SliceResult::kFailed, [&] {
        if (data_ < 0 && !file_.complete) {
            return SliceResult::kNotFound;
        }
        if (offset != offset_) {
            return SliceResult::kWrongOffset;
        }
        if (bytes > file_.length - offset_) {
            return SliceResult::kTooLong;
        }
        if (data_ < 0) {
            return SliceResult::kDone;
        }
        std::string found;
        unsigned long long copied = 0;
        SliceResult result = host::CopyBody(STDIN_FILENO, data_, offset, bytes,
                                            digest.empty() ? nullptr : &found, &copied);
        if (result == SliceResult::kDone && !digest.empty() &&
            strcasecmp(found.c_str(), digest.c_str()) != 0) {
            result = SliceResult::kWrongDigest;
        }
        // What the disk does not take is not to be counted upon.
        if (result != SliceResult::kWrongDigest && fdatasync(data_) != 0) {
            result = host::ResultOf(errno);
            copied = 0;
        }
        if (result == SliceResult::kWrongDigest || copied == 0) {
            copied = 0;
            if (ftruncate(data_, static_cast<off_t>(offset)) != 0) {
                return host::ResultOf(errno);
            }
        }
        offset_ = offset + copied;
        return result;
    });
}

SliceResult SliceUpload::Check() {
    return host::Guarded(SliceResult::kFailed, [&] {
        if (data_ < 0 || offset_ != file_.length) {
            return SliceResult::kFailed;
        }
        if (file_.digest.empty()) {
            return SliceResult::kDone;
        }
        std::string found;
        const SliceResult result = host::DigestFile(data_, file_.length, &found);
        if (result != SliceResult::kDone || strcasecmp(found.c_str(), file_.digest.c_str()) == 0) {
            return result;
        }
        (void)Abandon();
        return SliceResult::kWrongDigest;
    });
}

std::string SliceUpload::DataPath() const {
    return host::SliceDataPath(folder_, id_);
}

// A rename needs no room on the disk. The data are gone already, unless their
// creator only copied them.
bool SliceUpload::Complete() {
    return host::Guarded(false, [&] {
        if (data_ < 0 || offset_ != file_.length) {
            return false;
        }
        const std::string record = host::SliceRecordPath(folder_, id_);
        (void)futimens(record_, nullptr);
        (void)unlink(DataPath().c_str());
        const bool renamed = rename(record.c_str(), host::SliceDonePath(folder_, id_).c_str()) == 0;
        if (!renamed) {
            HOST_LOG("cannot remember a complete upload: %m");
        }
        Close();
        file_.complete = renamed;
        return renamed;
    });
}

bool SliceUpload::Abandon() {
    return host::Guarded(false, [&] {
        if (data_ < 0) {
            return false;
        }
        const bool gone = unlink(host::SliceRecordPath(folder_, id_).c_str()) == 0;
        (void)unlink(DataPath().c_str());
        Close();
        return gone;
    });
}

SliceResult FindSliceUpload(const std::string& id, const std::string& owner, SliceFile* file,
                            unsigned long long* offset) {
    return host::Guarded(SliceResult::kFailed, [&] {
        const std::string folder = host::OwnerFolder(owner);
        if (folder.empty() || !IsSliceId(id)) {
            return SliceResult::kNotFound;
        }
        const host::Descriptor record(
            host::OpenOwnFile(host::SliceRecordPath(folder, id), O_RDONLY));
        const host::Descriptor data(host::OpenOwnFile(host::SliceDataPath(folder, id), O_RDONLY));
        if (record.Get() >= 0 && data.Get() >= 0) {
            return FindUnfinished(record.Get(), data.Get(), owner, file, offset);
        }
        if (record.Get() >= 0 && flock(record.Get(), LOCK_SH | LOCK_NB) != 0) {
            return FindFinishing(record.Get(), owner, file, offset);
        }
        return FindComplete(folder, id, owner, file, offset);
    });
}

}  // namespace talo
