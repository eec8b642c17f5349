#include "hosts/linux/file/Tree.h"

#include <errno.h>
#include <fcntl.h>
#include <unistd.h>

#include <algorithm>

#include "hosts/linux/file/Errors.h"
#include "hosts/linux/util/Descriptor.h"

namespace host {

namespace {

using talo::FileError;

// Removing takes a folder's names in portions: there may be any number.
constexpr size_t kPortion = 10000;
constexpr int kOpenFolder = O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC;
constexpr int kOpenFile = O_RDONLY | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY | O_CLOEXEC;

// A folder on the way down. It is not held open: the way back goes by "..", and
// whoever has moved the folder meanwhile shows by another device or number.
struct Level {
    dev_t device = 0;
    ino_t number = 0;
    size_t pathLength = 0;           // of the folder's own path, with its final "/"
    std::vector<std::string> names;  // those of folders with a final "/" where they are sorted
    size_t next = 0;
    bool mayHoldMore = false;
};

std::string WithoutSlash(const std::string& name) {
    return name.back() == '/' ? name.substr(0, name.size() - 1) : name;
}

class Walk {
  public:
    Walk(TreeTask task, const talo::TreeVisit& visit) : task_(task), visit_(visit) {}
    ~Walk() {
        Hold(-1);
    }
    Walk(const Walk&) = delete;
    Walk& operator=(const Walk&) = delete;

    FileError Run(int top) {
        const int own = openat(top, ".", kOpenFolder);
        FileError result = own >= 0 ? Enter(own) : ErrorOf(errno);
        while (result == FileError::kNone && !levels_.empty()) {
            result = Step();
        }
        return result;
    }

  private:
    void Hold(int folder) {
        if (folder_ >= 0) {
            (void)close(folder_);
        }
        folder_ = folder;
    }

    FileError Step() {
        Level& level = levels_.back();
        if (level.next < level.names.size()) {
            return Meet(WithoutSlash(level.names[level.next++]));
        }
        return level.mayHoldMore ? Fill(&level) : Leave();
    }

    // Takes over the descriptor.
    FileError Enter(int folder) {
        Hold(folder);
        struct stat facts = {};
        if (fstat(folder, &facts) != 0) {
            return ErrorOf(errno);
        }
        Level level;
        level.device = facts.st_dev;
        level.number = facts.st_ino;
        level.pathLength = path_.size();
        const FileError result = Fill(&level);
        levels_.push_back(std::move(level));
        return result;
    }

    FileError Fill(Level* level) {
        level->next = 0;
        level->names.clear();
        if (task_ == TreeTask::kRemove) {
            const FileError result = ReadNames(folder_, kPortion, &level->names);
            level->mayHoldMore = result == FileError::kTooMany;
            return level->mayHoldMore ? FileError::kNone : result;
        }
        const FileError result = ReadNames(folder_, talo::kMaxFolderNames, &level->names);
        if (result == FileError::kNone) {
            Sort(&level->names);
        }
        return result;
    }

    void Sort(std::vector<std::string>* names) const {
        names->erase(std::remove_if(names->begin(), names->end(), talo::IsUnfinishedName),
                     names->end());
        for (std::string& name : *names) {
            struct stat facts = {};
            if (fstatat(folder_, name.c_str(), &facts, AT_SYMLINK_NOFOLLOW) == 0 &&
                S_ISDIR(facts.st_mode)) {
                name += '/';
            }
        }
        std::sort(names->begin(), names->end());
    }

    // What has gone meanwhile is passed over.
    FileError Meet(const std::string& name) {
        talo::TreeEntry entry;
        struct stat facts = {};
        if (fstatat(folder_, name.c_str(), &facts, AT_SYMLINK_NOFOLLOW) != 0) {
            return errno == ENOENT ? FileError::kNone : ErrorOf(errno);
        }
        path_.resize(levels_.back().pathLength);
        entry.path = path_ + name;
        entry.facts = FactsOf(facts);
        if (entry.facts.type == talo::FileType::kFolder) {
            return MeetFolder(name, entry);
        }
        if (task_ == TreeTask::kRead && entry.facts.type == talo::FileType::kFile) {
            return MeetFile(name, entry);
        }
        if (!visit_(entry)) {
            return FileError::kStopped;
        }
        return task_ == TreeTask::kRemove ? Remove(name, 0) : FileError::kNone;
    }

    FileError MeetFolder(const std::string& name, const talo::TreeEntry& entry) {
        if (task_ != TreeTask::kRemove && !visit_(entry)) {
            return FileError::kStopped;
        }
        const int folder = openat(folder_, name.c_str(), kOpenFolder);
        if (folder < 0) {
            return errno == ENOENT ? FileError::kNone : ErrorOf(errno);
        }
        path_ = entry.path + '/';
        return Enter(folder);
    }

    // The facts are those of what was opened, which may be another file by now.
    FileError MeetFile(const std::string& name, talo::TreeEntry entry) {
        const Descriptor file(openat(folder_, name.c_str(), kOpenFile));
        struct stat facts = {};
        if (file.Get() < 0) {
            return errno == ENOENT ? FileError::kNone : ErrorOf(errno);
        }
        if (fstat(file.Get(), &facts) != 0) {
            return ErrorOf(errno);
        }
        entry.facts = FactsOf(facts);
        if (entry.facts.type != talo::FileType::kFile) {
            return FileError::kNotFile;
        }
        entry.file = file.Get();
        return visit_(entry) ? FileError::kNone : FileError::kStopped;
    }

    FileError Remove(const std::string& name, int flags) const {
        return unlinkat(folder_, name.c_str(), flags) == 0 || errno == ENOENT ? FileError::kNone
                                                                              : ErrorOf(errno);
    }

    FileError Leave() {
        levels_.pop_back();
        if (levels_.empty()) {
            return FileError::kNone;
        }
        const Level& parent = levels_.back();
        const int folder = openat(folder_, "..", kOpenFolder);
        if (folder < 0) {
            return ErrorOf(errno);
        }
        Hold(folder);
        struct stat facts = {};
        if (fstat(folder, &facts) != 0 || facts.st_dev != parent.device ||
            facts.st_ino != parent.number) {
            return FileError::kNotFound;
        }
        return task_ == TreeTask::kRemove ? RemoveLeft(parent) : FileError::kNone;
    }

    FileError RemoveLeft(const Level& parent) {
        const std::string& name = parent.names[parent.next - 1];
        talo::TreeEntry entry;
        entry.path = path_.substr(0, parent.pathLength) + name;
        entry.facts.type = talo::FileType::kFolder;
        return visit_(entry) ? Remove(name, AT_REMOVEDIR) : FileError::kStopped;
    }

    TreeTask task_;
    const talo::TreeVisit& visit_;
    int folder_ = -1;  // the deepest level's
    std::string path_;
    std::vector<Level> levels_;
};

}  // namespace

talo::FileFacts FactsOf(const struct stat& facts) {
    talo::FileFacts made;
    made.type = S_ISREG(facts.st_mode)   ? talo::FileType::kFile
                : S_ISDIR(facts.st_mode) ? talo::FileType::kFolder
                : S_ISLNK(facts.st_mode) ? talo::FileType::kLink
                                         : talo::FileType::kOther;
    made.isLink = made.type == talo::FileType::kLink;
    made.size =
        made.type == talo::FileType::kFile ? static_cast<unsigned long long>(facts.st_size) : 0;
    made.mtime = facts.st_mtim.tv_sec;
    return made;
}

FileError WalkTree(int top, TreeTask task, const talo::TreeVisit& visit) {
    return Walk(task, visit).Run(top);
}

}  // namespace host
