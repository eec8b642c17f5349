#include <errno.h>
#include <fcntl.h>
#include <sys/random.h>
#include <sys/stat.h>
#include <unistd.h>

#include "hosts/linux/file/Errors.h"
#include "hosts/linux/file/FileTime.h"
#include "hosts/linux/file/Guard.h"
#include "hosts/linux/file/Parent.h"
#include "hosts/linux/file/Rename.h"
#include "hosts/linux/file/Resolve.h"
#include "hosts/linux/file/UnfinishedName.h"
#include "hosts/linux/sdk/Places.h"
#include "hosts/linux/util/Descriptor.h"

namespace talo {

namespace {

constexpr int kMaxTries = 16;

bool RandomName(std::string* name) {
    constexpr char kDigits[] = "0123456789abcdef";
    unsigned char bytes[8];
    if (getrandom(bytes, sizeof bytes, 0) != static_cast<ssize_t>(sizeof bytes)) {
        return false;
    }
    *name = host::kUnfinishedPrefix;
    for (const unsigned char byte : bytes) {
        *name += kDigits[byte >> 4];
        *name += kDigits[byte & 15];
    }
    return true;
}

// What file systems without nameless files say.
bool NeedsName(int error) {
    return error == EOPNOTSUPP || error == EISDIR || error == ENOENT || error == EINVAL;
}

int OpenNamed(int folder, std::string* name) {
    for (int tries = 0; tries < kMaxTries && RandomName(name); ++tries) {
        const int file =
            openat(folder, name->c_str(), O_RDWR | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, 0600);
        if (file >= 0 || errno != EEXIST) {
            return file;
        }
    }
    return -1;
}

// Older kernels let only the superuser name a file by its descriptor; /proc does
// it for everybody where it is mounted.
bool GiveName(int file, int folder, const char* name) {
    if (linkat(file, "", folder, name, AT_EMPTY_PATH) == 0) {
        return true;
    }
    if (errno == EEXIST) {
        return false;
    }
    const std::string path = "/proc/self/fd/" + std::to_string(file);
    return linkat(AT_FDCWD, path.c_str(), folder, name, AT_SYMLINK_FOLLOW) == 0;
}

// So that the name is there after a power failure too.
void Settle(int folder) {
    const host::Descriptor open(openat(folder, ".", O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    if (open.Get() >= 0) {
        (void)fsync(open.Get());
    }
}

}  // namespace

NewFile::NewFile() : folder_(-1), file_(-1) {}

NewFile::~NewFile() {
    Drop();
}

void NewFile::Drop() {
    if (!name_.empty()) {
        (void)unlinkat(folder_, name_.c_str(), 0);
        name_.clear();
    }
    if (file_ >= 0) {
        (void)close(file_);
    }
    if (folder_ >= 0) {
        (void)close(folder_);
    }
    file_ = folder_ = -1;
}

int NewFile::Descriptor() const {
    return file_;
}

FileError NewFile::Begin(const Place& place) {
    return host::Guarded(FileError::kFailed, [&] {
        Drop();
        const host::Parent parent(place.root_, place.parts_);
        if (parent.Get() < 0) {
            return parent.Error();
        }
        int file = openat(parent.Get(), ".", O_TMPFILE | O_RDWR | O_CLOEXEC, 0600);
        std::string name;
        if (file < 0 && NeedsName(errno)) {
            file = OpenNamed(parent.Get(), &name);
        }
        if (file < 0) {
            return host::ErrorOf(errno);
        }
        file_ = file;
        folder_ = fcntl(parent.Get(), F_DUPFD_CLOEXEC, 0);
        if (folder_ < 0) {
            const FileError result = host::ErrorOf(errno);
            if (!name.empty()) {
                (void)unlinkat(parent.Get(), name.c_str(), 0);
            }
            Drop();
            return result;
        }
        name_.swap(name);
        return FileError::kNone;
    });
}

FileError NewFile::Finish(const Place& place, bool overwrite, long long mtime) {
    return host::Guarded(FileError::kFailed, [&] {
        if (file_ < 0 || place.parts_.empty()) {
            return FileError::kFailed;
        }
        if (fchmod(file_, host::kFileMode) != 0 || !host::SetFileTime(file_, mtime) ||
            fsync(file_) != 0) {
            return host::ErrorOf(errno);
        }
        const char* target = place.parts_.back().c_str();
        if (name_.empty()) {
            if (GiveName(file_, folder_, target)) {
                Settle(folder_);
                Drop();
                return FileError::kNone;
            }
            if (errno != EEXIST || !overwrite) {
                return host::ErrorOf(errno);
            }
            std::string name;
            if (!RandomName(&name) || !GiveName(file_, folder_, name.c_str())) {
                return host::ErrorOf(errno);
            }
            name_.swap(name);
        }
        const FileError result =
            host::RenameEntry(folder_, name_.c_str(), folder_, target, overwrite);
        if (result == FileError::kNone) {
            name_.clear();
            Settle(folder_);
        }
        Drop();
        return result;
    });
}

}  // namespace talo
