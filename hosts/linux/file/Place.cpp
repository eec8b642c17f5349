#include <errno.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>

#include "hosts/linux/file/Errors.h"
#include "hosts/linux/file/Guard.h"
#include "hosts/linux/file/Parent.h"
#include "hosts/linux/file/Rename.h"
#include "hosts/linux/file/Resolve.h"
#include "hosts/linux/file/Tree.h"
#include "hosts/linux/sdk/Places.h"
#include "hosts/linux/util/Descriptor.h"
#include "hosts/linux/util/HostLog.h"

namespace talo {

namespace {

constexpr char kSource[] = "Place.cpp";
constexpr mode_t kFolderMode = 0755;

// Of the last of the parts, which lies in an open folder. A link is resolved from
// the share's folder on, as it may lead to anything in the share.
bool StatEntry(int root, int folder, const std::vector<std::string>& parts, FileFacts* facts) {
    struct stat own = {};
    if (fstatat(folder, parts.back().c_str(), &own, AT_SYMLINK_NOFOLLOW) != 0) {
        return false;
    }
    struct stat target = {};
    const bool isLink = S_ISLNK(own.st_mode);
    const host::Descriptor file(isLink ? host::OpenBeneath(root, parts, O_PATH) : -1);
    const bool leadsInside = file.Get() >= 0 && fstat(file.Get(), &target) == 0;
    *facts = host::FactsOf(leadsInside ? target : own);
    facts->isLink = isLink;
    return true;
}

FileError StatShare(int root, FileFacts* facts) {
    struct stat own = {};
    if (fstat(root, &own) != 0) {
        return host::ErrorOf(errno);
    }
    *facts = host::FactsOf(own);
    return FileError::kNone;
}

}  // namespace

Place::Place() : root_(-1) {}

Place::~Place() {
    if (root_ >= 0) {
        (void)close(root_);
    }
}

FileError Place::Open(const Share& share, const std::vector<std::string>& parts) {
    return host::Guarded(FileError::kFailed, [&] {
        std::vector<std::string> copied = parts;
        const int root = open(share.folder.c_str(), O_PATH | O_DIRECTORY | O_CLOEXEC);
        if (root < 0) {
            HOST_LOG("the folder of the share %s cannot be opened: %m", share.name.c_str());
            return host::ErrorOf(errno);
        }
        if (root_ >= 0) {
            (void)close(root_);
        }
        root_ = root;
        parts_.swap(copied);
        return FileError::kNone;
    });
}

FileError Place::OpenFile(int* file) const {
    return host::Guarded(FileError::kFailed, [&] {
        const int opened =
            host::OpenBeneath(root_, parts_, O_RDONLY | O_NONBLOCK | O_NOCTTY | O_CLOEXEC);
        struct stat facts = {};
        if (opened < 0) {
            return host::ErrorOf(errno);
        }
        if (fstat(opened, &facts) != 0 || !S_ISREG(facts.st_mode)) {
            (void)close(opened);
            return FileError::kNotFile;
        }
        *file = opened;
        return FileError::kNone;
    });
}

FileError Place::OpenFolder(int* folder) const {
    return host::Guarded(FileError::kFailed, [&] {
        const int opened = host::OpenBeneath(root_, parts_, O_RDONLY | O_DIRECTORY | O_CLOEXEC);
        if (opened < 0) {
            return host::ErrorOf(errno);
        }
        *folder = opened;
        return FileError::kNone;
    });
}

FileError Place::Stat(FileFacts* facts) const {
    return host::Guarded(FileError::kFailed, [&] {
        if (parts_.empty()) {
            return StatShare(root_, facts);
        }
        const host::Parent parent(root_, parts_);
        if (parent.Get() < 0) {
            return parent.Error();
        }
        return StatEntry(root_, parent.Get(), parts_, facts) ? FileError::kNone
                                                             : host::ErrorOf(errno);
    });
}

FileError Place::List(std::vector<std::string>* names) const {
    return host::Guarded(FileError::kFailed, [&] {
        int folder = -1;
        FileError result = OpenFolder(&folder);
        if (result != FileError::kNone) {
            return result;
        }
        const host::Descriptor holder(folder);
        std::vector<std::string> read;
        result = host::ReadNames(folder, kMaxFolderNames, &read);
        if (result == FileError::kNone) {
            read.erase(std::remove_if(read.begin(), read.end(), IsUnfinishedName), read.end());
            names->swap(read);
        }
        return result;
    });
}

FileError Place::StatAll(const std::vector<std::string>& names,
                         std::vector<NamedFacts>* found) const {
    return host::Guarded(FileError::kFailed, [&] {
        int folder = -1;
        const FileError result = OpenFolder(&folder);
        if (result != FileError::kNone) {
            return result;
        }
        const host::Descriptor holder(folder);
        std::vector<NamedFacts> entries;
        entries.reserve(names.size());
        std::vector<std::string> parts = parts_;
        for (const std::string& name : names) {
            NamedFacts entry{name, {}};
            parts.push_back(name);
            if (StatEntry(root_, folder, parts, &entry.facts)) {
                entries.push_back(std::move(entry));
            }
            parts.pop_back();
        }
        found->swap(entries);
        return FileError::kNone;
    });
}

FileError Place::MakeFolder() const {
    return host::Guarded(FileError::kFailed, [&] {
        const host::Parent parent(root_, parts_);
        if (parent.Get() < 0) {
            return parent.Error();
        }
        return mkdirat(parent.Get(), parent.Name(), kFolderMode) == 0 ? FileError::kNone
                                                                      : host::ErrorOf(errno);
    });
}

FileError Place::Rename(const Place& to, bool overwrite) const {
    return host::Guarded(FileError::kFailed, [&] {
        const host::Parent parent(root_, parts_);
        const host::Parent target(to.root_, to.parts_);
        if (parent.Get() < 0 || target.Get() < 0) {
            return parent.Get() < 0 ? parent.Error() : target.Error();
        }
        return host::RenameEntry(parent.Get(), parent.Name(), target.Get(), target.Name(),
                                 overwrite);
    });
}

FileError Place::Remove() const {
    return host::Guarded(FileError::kFailed, [&] {
        const host::Parent parent(root_, parts_);
        if (parent.Get() < 0) {
            return parent.Error();
        }
        if (unlinkat(parent.Get(), parent.Name(), 0) == 0) {
            return FileError::kNone;
        }
        // Either word is used for a folder.
        if (errno != EISDIR && errno != EPERM) {
            return host::ErrorOf(errno);
        }
        const int error = errno;
        if (unlinkat(parent.Get(), parent.Name(), AT_REMOVEDIR) == 0) {
            return FileError::kNone;
        }
        return errno == ENOTDIR ? host::ErrorOf(error) : host::ErrorOf(errno);
    });
}

FileError Place::RemoveTree(const TreeVisit& visit) const {
    return host::Guarded(FileError::kFailed, [&] {
        const host::Parent parent(root_, parts_);
        if (parent.Get() < 0) {
            return parent.Error();
        }
        const host::Descriptor top(
            openat(parent.Get(), parent.Name(), O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
        if (top.Get() < 0) {
            return host::ErrorOf(errno);
        }
        const FileError result = host::WalkTree(top.Get(), host::TreeTask::kRemove, visit);
        if (result != FileError::kNone) {
            return result;
        }
        return unlinkat(parent.Get(), parent.Name(), AT_REMOVEDIR) == 0 ? FileError::kNone
                                                                        : host::ErrorOf(errno);
    });
}

FileError Place::Walk(bool openFiles, const TreeVisit& visit) const {
    return host::Guarded(FileError::kFailed, [&] {
        int folder = -1;
        const FileError result = OpenFolder(&folder);
        if (result != FileError::kNone) {
            return result;
        }
        const host::Descriptor holder(folder);
        return host::WalkTree(folder, openFiles ? host::TreeTask::kRead : host::TreeTask::kLook,
                              visit);
    });
}

}  // namespace talo
