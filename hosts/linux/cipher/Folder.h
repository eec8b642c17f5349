#ifndef TALO_HOSTS_LINUX_CIPHER_FOLDER_H
#define TALO_HOSTS_LINUX_CIPHER_FOLDER_H

#include <string>

#include "hosts/linux/util/Descriptor.h"

namespace host {

// Makes a folder, mode 0700, and makes sure that nobody else gets into it. False,
// logged, otherwise.
bool MakePrivateFolder(const std::string& dir);

// Opens a regular file of ours that nobody else can read or write; -1 with errno
// set, EACCES for one that others can. A link is not followed.
int OpenPrivateFile(const std::string& path, int flags);

// Waits for the lock on an open file. False with errno set.
bool LockFile(int file);

}  // namespace host

#endif
