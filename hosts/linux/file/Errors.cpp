#include "hosts/linux/file/Errors.h"

#include <errno.h>
#include <string.h>

#include "hosts/linux/util/HostLog.h"

namespace host {

namespace {

using talo::FileError;

constexpr char kSource[] = "Errors.cpp";

struct ErrorRow {
    int error;
    FileError meaning;
};

constexpr ErrorRow kErrors[] = {
    {ENOENT, FileError::kNotFound}, {ENAMETOOLONG, FileError::kNotFound},
    {EEXIST, FileError::kExists},   {ENOTDIR, FileError::kNotFolder},
    {EISDIR, FileError::kNotFile},  {ENXIO, FileError::kNotFile},
    {ELOOP, FileError::kLink},      {ENOTEMPTY, FileError::kNotEmpty},
    {ENOSPC, FileError::kNoSpace},  {EDQUOT, FileError::kNoSpace},
    {EFBIG, FileError::kNoSpace},   {EXDEV, FileError::kOtherFileSystem},
    {EACCES, FileError::kRefused},  {EPERM, FileError::kRefused},
    {EROFS, FileError::kRefused},   {EBUSY, FileError::kRefused},
    {ETXTBSY, FileError::kRefused},
};

}  // namespace

FileError ErrorOf(int error) {
    for (const ErrorRow& row : kErrors) {
        if (row.error == error) {
            return row.meaning;
        }
    }
    HOST_LOG("a file operation failed: %s", strerror(error));
    return FileError::kFailed;
}

}  // namespace host
