#include <errno.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include "hosts/linux/file/Errors.h"
#include "hosts/linux/file/FileTime.h"
#include "hosts/linux/file/Guard.h"
#include "hosts/linux/file/Parent.h"
#include "hosts/linux/file/Rename.h"
#include "hosts/linux/sdk/Places.h"
#include "hosts/linux/util/Descriptor.h"

namespace talo {

namespace {

constexpr size_t kBlockBytes = 256u << 10;

bool WriteAll(int file, const char* bytes, size_t size) {
    while (size > 0) {
        const ssize_t put = write(file, bytes, size);
        if (put < 0 && errno == EINTR) {
            continue;
        }
        if (put <= 0) {
            return false;
        }
        bytes += put;
        size -= static_cast<size_t>(put);
    }
    return true;
}

bool CopyAll(int from, int to) {
    std::vector<char> block(kBlockBytes);
    for (;;) {
        const ssize_t got = read(from, block.data(), block.size());
        if (got < 0 && errno == EINTR) {
            continue;
        }
        if (got <= 0) {
            return got == 0;
        }
        if (!WriteAll(to, block.data(), static_cast<size_t>(got))) {
            return false;
        }
    }
}

FileError TakeInByCopy(int upload, const Place& place, bool overwrite, long long mtime) {
    NewFile file;
    const FileError result = file.Begin(place);
    if (result != FileError::kNone) {
        return result;
    }
    if (!CopyAll(upload, file.Descriptor())) {
        return host::ErrorOf(errno);
    }
    return file.Finish(place, overwrite, mtime);
}

}  // namespace

FileError Place::TakeIn(const std::string& path, bool overwrite, long long mtime) const {
    return host::Guarded(FileError::kFailed, [&] {
        const host::Descriptor upload(
            open(path.c_str(), O_RDONLY | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY | O_CLOEXEC));
        struct stat facts = {};
        if (upload.Get() < 0 || fstat(upload.Get(), &facts) != 0) {
            return host::ErrorOf(errno);
        }
        if (!S_ISREG(facts.st_mode)) {
            return FileError::kNotFile;
        }
        const host::Parent parent(root_, parts_);
        if (parent.Get() < 0) {
            return parent.Error();
        }
        if (fchmod(upload.Get(), host::kFileMode) != 0 || !host::SetFileTime(upload.Get(), mtime)) {
            return host::ErrorOf(errno);
        }
        FileError result =
            host::RenameEntry(AT_FDCWD, path.c_str(), parent.Get(), parent.Name(), overwrite);
        if (result == FileError::kOtherFileSystem) {
            result = TakeInByCopy(upload.Get(), *this, overwrite, mtime);
            if (result == FileError::kNone) {
                (void)unlink(path.c_str());
            }
        }
        return result;
    });
}

}  // namespace talo
