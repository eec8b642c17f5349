#ifndef TALO_HOSTS_LINUX_FILE_RENAME_H
#define TALO_HOSTS_LINUX_FILE_RENAME_H

#include "hosts/linux/sdk/Places.h"

namespace host {

// Renames between two open folders. Without `overwrite` nothing that is there is
// ever replaced, not even what appears in the same moment. With it a file
// replaces a file, and a folder an empty folder.
talo::FileError RenameEntry(int fromFolder, const char* from, int toFolder, const char* to,
                            bool overwrite);

}  // namespace host

#endif
