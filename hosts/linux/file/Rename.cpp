#include "hosts/linux/file/Rename.h"

#include <errno.h>
#include <fcntl.h>
#include <stdio.h>
#include <sys/stat.h>
#include <unistd.h>

#include "hosts/linux/file/Errors.h"

namespace host {

namespace {

using talo::FileError;

// The kernel's word for a folder that would become a part of itself.
FileError RenameErrorOf(int error) {
    return error == EINVAL ? FileError::kIntoItself : ErrorOf(error);
}

// An empty folder is made first, which fails when there is something, and then
// replaced.
FileError RenameFolderByReplacing(int fromFolder, const char* from, int toFolder, const char* to) {
    if (mkdirat(toFolder, to, S_IRWXU) != 0) {
        return ErrorOf(errno);
    }
    if (renameat(fromFolder, from, toFolder, to) == 0) {
        return FileError::kNone;
    }
    const int error = errno;
    (void)unlinkat(toFolder, to, AT_REMOVEDIR);
    return RenameErrorOf(error);
}

// A second name is given, which fails when there is something, and the first
// one taken away.
FileError RenameFileByLinking(int fromFolder, const char* from, int toFolder, const char* to) {
    if (linkat(fromFolder, from, toFolder, to, 0) != 0) {
        return ErrorOf(errno);
    }
    if (unlinkat(fromFolder, from, 0) == 0) {
        return FileError::kNone;
    }
    const int error = errno;
    (void)unlinkat(toFolder, to, 0);
    return ErrorOf(error);
}

// For file systems that cannot do it in one step.
FileError RenameInTwoSteps(int fromFolder, const char* from, int toFolder, const char* to) {
    struct stat facts = {};
    if (fstatat(fromFolder, from, &facts, AT_SYMLINK_NOFOLLOW) != 0) {
        return ErrorOf(errno);
    }
    return S_ISDIR(facts.st_mode) ? RenameFolderByReplacing(fromFolder, from, toFolder, to)
                                  : RenameFileByLinking(fromFolder, from, toFolder, to);
}

}  // namespace

FileError RenameEntry(int fromFolder, const char* from, int toFolder, const char* to,
                      bool overwrite) {
    if (overwrite) {
        return renameat(fromFolder, from, toFolder, to) == 0 ? FileError::kNone
                                                             : RenameErrorOf(errno);
    }
    if (renameat2(fromFolder, from, toFolder, to, RENAME_NOREPLACE) == 0) {
        return FileError::kNone;
    }
    return errno == EINVAL || errno == ENOSYS ? RenameInTwoSteps(fromFolder, from, toFolder, to)
                                              : ErrorOf(errno);
}

}  // namespace host
