#include "hosts/linux/file/Parent.h"

#include <errno.h>
#include <fcntl.h>

#include "hosts/linux/file/Errors.h"
#include "hosts/linux/file/Resolve.h"

namespace host {

namespace {

int OpenParent(int root, const std::vector<std::string>& parts, talo::FileError* error) {
    if (parts.empty()) {
        *error = talo::FileError::kRefused;
        return -1;
    }
    const std::vector<std::string> folder(parts.begin(), parts.end() - 1);
    const int opened = OpenBeneath(root, folder, O_PATH | O_DIRECTORY);
    *error = opened >= 0 ? talo::FileError::kNone : ErrorOf(errno);
    return opened;
}

}  // namespace

Parent::Parent(int root, const std::vector<std::string>& parts)
    : name_(parts.empty() ? std::string() : parts.back()),
      error_(talo::FileError::kNone),
      folder_(OpenParent(root, parts, &error_)) {}

int Parent::Get() const {
    return folder_.Get();
}

const char* Parent::Name() const {
    return name_.c_str();
}

talo::FileError Parent::Error() const {
    return error_;
}

}  // namespace host
