#ifndef TALO_HOSTS_LINUX_SDK_PLACES_H
#define TALO_HOSTS_LINUX_SDK_PLACES_H

#include <functional>
#include <string>
#include <vector>

#include "hosts/linux/sdk/Shares.h"
#include "platform/Platform.h"

// Files and folders in a share. Whatever links a path meets, and whoever swaps
// them meanwhile, nothing outside of the share's folder is read, changed or
// shown: every step is taken from the share's open folder, by descriptors.
// Nothing throws; outputs stay untouched on failure.
namespace talo {

enum class FileError {
    kNone,
    kNotFound,
    kExists,
    kNotFolder,
    kNotFile,  // a folder, or something that is neither file nor folder
    kLink,     // a link that leads out of the share, or may not be followed
    kNotEmpty,
    kNoSpace,
    kOtherFileSystem,
    kIntoItself,
    kTooMany,  // names in a folder
    kRefused,  // by the system: read only, no permission, in use
    kStopped,  // by the caller
    kFailed,   // anything else; logged
};

constexpr size_t kMaxComponentBytes = 255;
constexpr size_t kMaxPathBytes = 4096;

// Reading a folder takes memory for its names.
constexpr size_t kMaxFolderNames = 1000000;

// A path as a client writes it: "/SHARE/FOLDER/FILE", or "/" for the place of
// the shares. No component is empty, ".", "..", longer than 255 bytes or one of
// the names that new files have until they are whole; there is no NUL, the text
// is valid UTF-8 and no longer than 4,096 bytes.
struct VirtualPath {
    std::string share;  // "" for "/"
    std::vector<std::string> parts;
};
TALO_PLATFORM bool ParseVirtualPath(const std::string& text, VirtualPath* path);

// Whether a text may be a component of such a path.
TALO_PLATFORM bool IsComponent(const std::string& text);

// Whether a name in a folder is a new file that is not whole yet.
TALO_PLATFORM bool IsUnfinishedName(const std::string& name);

enum class FileType { kFile, kFolder, kLink, kOther };

// A link that stays in the share shows what it leads to, any other shows as
// kLink.
struct FileFacts {
    FileType type = FileType::kOther;
    bool isLink = false;
    unsigned long long size = 0;  // bytes, 0 for all but files
    long long mtime = 0;          // seconds since the epoch
};

struct NamedFacts {
    std::string name;
    FileFacts facts;
};

// One entry of a tree that is walked. `path` is relative to the tree's top,
// which itself is not an entry; names are bytes and need not be UTF-8. Links are
// not followed, and entries of type kLink.
struct TreeEntry {
    std::string path;
    FileFacts facts;
    int file = -1;  // a file's content when the walk opens files; the walk closes it
};

// Answers false to stop.
using TreeVisit = std::function<bool(const TreeEntry& entry)>;

// A place in a share that may or may not exist yet. Holds the share's folder
// open; copies are not made.
class TALO_PLATFORM Place {
  public:
    Place();
    ~Place();
    Place(const Place&) = delete;
    Place& operator=(const Place&) = delete;

    // `parts` as of a VirtualPath.
    FileError Open(const Share& share, const std::vector<std::string>& parts);

    // Descriptors for reading, the caller's to close.
    FileError OpenFile(int* file) const;
    FileError OpenFolder(int* folder) const;

    // Of what is there; through a link when that stays in the share.
    FileError Stat(FileFacts* facts) const;

    // The names in the folder, unsorted, without those that are not whole yet.
    FileError List(std::vector<std::string>* names) const;
    // The facts of names in the folder, in their order; what has gone is left out.
    FileError StatAll(const std::vector<std::string>& names, std::vector<NamedFacts>* found) const;

    FileError MakeFolder() const;

    // Links are renamed and removed themselves, never what they lead to.
    FileError Rename(const Place& to, bool overwrite) const;
    // A file, a link or an empty folder.
    FileError Remove() const;
    // A folder with all that is in it. Stops at the first failure; what has been
    // removed until then is. `visit` sees every entry just before it goes.
    FileError RemoveTree(const TreeVisit& visit) const;

    // Every entry below the folder, a folder before what is in it, in byte order
    // of the paths where a folder's path counts with a final "/". Fails at what
    // cannot be read.
    FileError Walk(bool openFiles, const TreeVisit& visit) const;

    // Takes an uploaded file: moves it here when it lies in the same file system,
    // else copies it, so that others see nothing or the whole of it. The file is
    // gone from `path` after a success. A negative mtime leaves the time at which
    // it was written.
    FileError TakeIn(const std::string& path, bool overwrite, long long mtime) const;

  private:
    friend class NewFile;
    std::vector<std::string> parts_;
    int root_;
};

// A new file that appears at its place whole, or never.
//
//     talo::NewFile file;
//     if (file.Begin(place) == talo::FileError::kNone && WriteTo(file.Descriptor())) {
//         return file.Finish(place, false, -1);
//     }
class TALO_PLATFORM NewFile {
  public:
    NewFile();
    ~NewFile();  // an unfinished file is gone
    NewFile(const NewFile&) = delete;
    NewFile& operator=(const NewFile&) = delete;

    FileError Begin(const Place& place);
    int Descriptor() const;  // for reading and writing; -1 before Begin

    // Writes through to the disk, and gives the file its name.
    FileError Finish(const Place& place, bool overwrite, long long mtime);

  private:
    void Drop();
    int folder_;
    int file_;
    std::string name_;  // its name until then, "" while it has none
};

}  // namespace talo

#endif
