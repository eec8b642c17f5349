#ifndef TALO_SRC_BASE_FILEIDENTITY_H
#define TALO_SRC_BASE_FILEIDENTITY_H

#include <cstdint>

namespace TALO {

// What tells one content of a file from another without reading it.
struct FileIdentity {
    std::uint64_t device = 0;
    std::uint64_t inode = 0;
    std::int64_t size = 0;
    std::int64_t modified = 0;  // nanoseconds since the epoch
    std::int64_t changed = 0;   // the same; nobody can set it back
};

bool operator==(const FileIdentity& left, const FileIdentity& right);

// False, and `identity` untouched, when the path leads to no regular file: what
// it stands for is unknown then, whatever the platform reads there. Keeps errno.
bool IdentifyFile(const char* path, FileIdentity* identity);

// Who says what a path leads to, null for the file system; answers who did. For
// tests whose files are in memory: one of that name on the disk is another one.
using FileIdentifier = bool (*)(const char* path, FileIdentity* identity);
FileIdentifier SetFileIdentifier(FileIdentifier identifier);

// Whether both times lie so far back that a change from now on must show in them.
// Times advance in steps, of up to two seconds in some file systems: a file that
// is written twice within one step looks the same after the second time.
bool IsSettled(const FileIdentity& identity);

}  // namespace TALO

#endif
