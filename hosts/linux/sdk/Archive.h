#ifndef TALO_HOSTS_LINUX_SDK_ARCHIVE_H
#define TALO_HOSTS_LINUX_SDK_ARCHIVE_H

#include <string>

#include "platform/Platform.h"

// Archives, by a library that is loaded when the first one is begun. Nothing
// throws.
namespace talo {

// Writes a zip archive to a descriptor as it comes, without seeking and without
// holding it anywhere. Files are stored as they are: most of what fills a disk
// does not get smaller.
//
//     talo::ZipWriter zip(STDOUT_FILENO);
//     if (zip.AddFile("a/b.txt", facts.mtime, facts.size, file) && zip.Finish()) ...
//
// After a failure, which is logged, every operation answers false, and what has
// been written lacks its directory: nobody takes it for whole. The same when the
// object goes without Finish.
class TALO_PLATFORM ZipWriter {
  public:
    // The descriptor stays the caller's.
    explicit ZipWriter(int output);
    ~ZipWriter();
    ZipWriter(const ZipWriter&) = delete;
    ZipWriter& operator=(const ZipWriter&) = delete;

    // Whether the library could be loaded; nothing has been written yet.
    bool IsOpen() const;

    // A path is relative and has no final "/".
    bool AddFolder(const std::string& path, long long mtime);
    // Exactly `size` bytes from the file's present position; fewer are a failure.
    bool AddFile(const std::string& path, long long mtime, unsigned long long size, int file);
    bool Finish();

  private:
    void* state_;
};

}  // namespace talo

#endif
