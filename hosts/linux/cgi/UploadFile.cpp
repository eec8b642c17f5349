#include "hosts/linux/cgi/UploadFile.h"

#include <errno.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include "hosts/linux/cgi/UploadName.h"

namespace host {

namespace {
constexpr int kAttempts = 10;  // at a name that is free
}

std::unique_ptr<UploadFile> UploadFile::Create(const std::string& dir) {
    for (int attempt = 0; attempt < kAttempts; ++attempt) {
        const std::string name = NewUploadName();
        if (name.empty()) {
            return nullptr;
        }
        std::string path = dir;
        path.append("/").append(name);
        const int file =
            open(path.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, 0600);
        if (file >= 0) {
            std::unique_ptr<UploadFile> created(new UploadFile(path, file));
            return fchmod(file, 0600) == 0 ? std::move(created) : nullptr;
        }
        if (errno != EEXIST) {
            return nullptr;
        }
    }
    return nullptr;
}

UploadFile::~UploadFile() {
    if (file_ >= 0) {
        (void)close(file_);
    }
    if (!kept_) {
        (void)unlink(path_.c_str());
    }
}

bool UploadFile::Write(const char* data, size_t size) {
    for (size_t written = 0; written < size;) {
        const ssize_t put = write(file_, data + written, size - written);
        if (put < 0 && errno == EINTR) {
            continue;
        }
        if (put <= 0) {
            errno = put == 0 ? ENOSPC : errno;
            return false;
        }
        written += static_cast<size_t>(put);
    }
    size_ += size;
    return true;
}

// Some file systems say only here that there was no room.
bool UploadFile::Close() {
    const int file = file_;
    file_ = -1;
    return close(file) == 0 || errno == EINTR;
}

}  // namespace host
