#ifndef TALO_HOSTS_LINUX_UTIL_TRUSTEDFILE_H
#define TALO_HOSTS_LINUX_UTIL_TRUSTEDFILE_H

#include <cstddef>
#include <string>

namespace host {

// Reads a file of the configuration that settles rights: whoever can write it can
// give himself all of them. So it has to be a regular file, no link, of root or
// the process's own user, that nobody else may write, of at most `most` bytes. One
// that is not there is empty. False, logged, for any other; `content` is then
// untouched.
bool ReadTrustedFile(const std::string& path, size_t most, std::string* content);

// The same for a file with secrets: one that others than its owner may read is
// refused too.
bool ReadSecretFile(const std::string& path, size_t most, std::string* content);

}  // namespace host

#endif
