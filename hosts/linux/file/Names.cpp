#include <dirent.h>
#include <errno.h>
#include <fcntl.h>
#include <unistd.h>

#include "hosts/linux/file/Errors.h"
#include "hosts/linux/file/Tree.h"

namespace host {

namespace {

using talo::FileError;

class OpenNames {
  public:
    // A descriptor of its own, so that the place in the folder is its own too.
    explicit OpenNames(int folder) {
        const int own = openat(folder, ".", O_RDONLY | O_DIRECTORY | O_CLOEXEC);
        names_ = own >= 0 ? fdopendir(own) : nullptr;
        if (own >= 0 && names_ == nullptr) {
            (void)close(own);
        }
    }
    ~OpenNames() {
        if (names_ != nullptr) {
            (void)closedir(names_);
        }
    }
    OpenNames(const OpenNames&) = delete;
    OpenNames& operator=(const OpenNames&) = delete;
    DIR* Get() const {
        return names_;
    }

  private:
    DIR* names_ = nullptr;
};

bool IsOwnOrParent(const std::string& name) {
    return name == "." || name == "..";
}

}  // namespace

FileError ReadNames(int folder, size_t most, std::vector<std::string>* names) {
    const OpenNames open(folder);
    if (open.Get() == nullptr) {
        return ErrorOf(errno);
    }
    std::vector<std::string> read;
    while (read.size() <= most) {
        errno = 0;
        const struct dirent* entry = readdir(open.Get());
        if (entry == nullptr) {
            if (errno != 0) {
                return ErrorOf(errno);
            }
            names->swap(read);
            return FileError::kNone;
        }
        if (!IsOwnOrParent(entry->d_name)) {
            read.emplace_back(entry->d_name);
        }
    }
    read.pop_back();
    names->swap(read);
    return FileError::kTooMany;
}

}  // namespace host
