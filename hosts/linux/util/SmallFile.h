#ifndef TALO_HOSTS_LINUX_UTIL_SMALLFILE_H
#define TALO_HOSTS_LINUX_UTIL_SMALLFILE_H

#include <cstddef>
#include <string>

namespace host {

// Reads a regular file of at most `maxBytes`. On failure `content` stays
// untouched and `reason` says why.
bool ReadSmallFile(const char* path, size_t maxBytes, std::string* content, std::string* reason);

// The same for an open descriptor, which stays the caller's.
bool ReadSmallFile(int file, size_t maxBytes, std::string* content, std::string* reason);

// Replaces a file at once: readers see the old content or the new one, and
// nothing of either is lost when the machine stops in between. Mode 0600.
bool ReplaceFile(const std::string& path, const std::string& content);

}  // namespace host

#endif
