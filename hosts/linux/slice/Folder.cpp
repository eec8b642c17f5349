#include "hosts/linux/slice/Folder.h"

#include <dirent.h>
#include <fcntl.h>
#include <sys/random.h>
#include <sys/stat.h>
#include <unistd.h>

#include <memory>

#include "hosts/linux/conf/KeyValueFile.h"
#include "hosts/linux/slice/Record.h"
#include "hosts/linux/util/HostLog.h"
#include "hosts/linux/util/SmallFile.h"
#include "platform/Paths.h"
#include "platform/System.h"

namespace host {

namespace {

constexpr char kSource[] = "Folder.cpp";

// An id is this letter, which keeps it from ever being JSON, and 20 random bytes.
constexpr char kIdLetter = 'u';
constexpr size_t kIdBytes = 20;
constexpr size_t kIdSize = 1 + 2 * kIdBytes;

constexpr char kHexDigits[] = "0123456789abcdef";
constexpr char kDataSuffix[] = ".data";
constexpr char kDoneSuffix[] = ".done";
// What a record is called until it is written: a point and six letters or digits.
constexpr size_t kUnwrittenSuffix = 7;
constexpr char kLettersAndDigits[] =
    "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789";

std::string Hex(const unsigned char* bytes, size_t size) {
    std::string text;
    for (size_t index = 0; index < size; ++index) {
        text += kHexDigits[bytes[index] >> 4];
        text += kHexDigits[bytes[index] & 15];
    }
    return text;
}

// A link in the configured place is the administrator's own business; where it
// leads to nobody but root and our user may write.
bool MakeFolder(const std::string& path) {
    struct stat facts = {};
    if (TALOFSMkdirP(path.c_str(), 0, 1, -1, -1, 0700) < 0 || stat(path.c_str(), &facts) != 0) {
        HOST_LOG("cannot make %s: %m", path.c_str());
        return false;
    }
    if (!S_ISDIR(facts.st_mode) || (facts.st_uid != 0 && facts.st_uid != geteuid()) ||
        (facts.st_mode & (S_IWGRP | S_IWOTH)) != 0) {
        HOST_LOG("cannot use %s: others may write there", path.c_str());
        return false;
    }
    return true;
}

}  // namespace

std::string SliceFolder() {
    const std::string folder = HostSetting("slice_folder", TALO_SLICE_DIR);
    return folder[0] == '/' ? folder : TALO_SLICE_DIR;
}

// In hexadecimal, whatever the owner is called.
std::string OwnerFolder(const std::string& owner) {
    if (owner.empty() || owner.size() > kMaxSliceOwnerBytes) {
        return std::string();
    }
    return SliceFolder() + "/" +
           Hex(reinterpret_cast<const unsigned char*>(owner.data()), owner.size());
}

bool MakeOwnerFolder(const std::string& owner) {
    return MakeFolder(SliceFolder()) && MakeFolder(OwnerFolder(owner));
}

std::string SliceRecordPath(const std::string& folder, const std::string& id) {
    return folder + "/" + id;
}

std::string SliceDataPath(const std::string& folder, const std::string& id) {
    return folder + "/" + id + kDataSuffix;
}

std::string SliceDonePath(const std::string& folder, const std::string& id) {
    return folder + "/" + id + kDoneSuffix;
}

std::string NewSliceId() {
    unsigned char random[kIdBytes] = {};
    if (getrandom(random, sizeof random, 0) != static_cast<ssize_t>(sizeof random)) {
        return std::string();
    }
    return kIdLetter + Hex(random, sizeof random);
}

SliceName ReadSliceName(const std::string& name) {
    SliceName read;
    if (!talo::IsSliceId(name.substr(0, kIdSize))) {
        return read;
    }
    const std::string suffix = name.substr(kIdSize);
    if (suffix.empty()) {
        read.kind = SliceNameKind::kRecord;
    } else if (suffix == kDataSuffix) {
        read.kind = SliceNameKind::kData;
    } else if (suffix == kDoneSuffix) {
        read.kind = SliceNameKind::kDone;
    } else if (suffix[0] == '.' && suffix.size() == kUnwrittenSuffix &&
               suffix.find_first_not_of(kLettersAndDigits, 1) == std::string::npos) {
        read.kind = SliceNameKind::kUnwritten;
    } else {
        return read;
    }
    read.id = name.substr(0, kIdSize);
    return read;
}

std::vector<std::string> NamesIn(const std::string& folder) {
    std::vector<std::string> names;
    const std::unique_ptr<DIR, int (*)(DIR*)> open(opendir(folder.c_str()), closedir);
    if (open == nullptr) {
        return names;
    }
    while (const dirent* entry = readdir(open.get())) {
        names.emplace_back(entry->d_name);
    }
    return names;
}

int OpenOwnFile(const std::string& path, int flags) {
    const int file = open(path.c_str(), flags | O_CLOEXEC | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY);
    struct stat facts = {};
    if (file >= 0 &&
        (fstat(file, &facts) != 0 || !S_ISREG(facts.st_mode) || facts.st_uid != geteuid())) {
        (void)close(file);
        return -1;
    }
    return file;
}

bool IsInPlace(const std::string& path, int file) {
    struct stat named = {};
    struct stat open = {};
    return lstat(path.c_str(), &named) == 0 && fstat(file, &open) == 0 &&
           named.st_dev == open.st_dev && named.st_ino == open.st_ino;
}

bool ReadSliceRecord(int record, talo::SliceFile* file, long long* changed) {
    struct stat facts = {};
    std::string content;
    std::string reason;
    if (fstat(record, &facts) != 0 ||
        !ReadSmallFile(record, kMaxSliceRecordBytes, &content, &reason) ||
        !ParseSliceRecord(content, file)) {
        HOST_LOG("the record of an upload is damaged");
        return false;
    }
    *changed = facts.st_mtime;
    return true;
}

}  // namespace host

namespace talo {

bool IsSliceId(const std::string& id) {
    return id.size() == host::kIdSize && id[0] == host::kIdLetter &&
           id.find_first_not_of(host::kHexDigits, 1) == std::string::npos;
}

bool IsSliceDigest(const std::string& text) {
    constexpr size_t kDigestDigits = 64;
    return text.size() == kDigestDigits &&
           text.find_first_not_of("0123456789abcdefABCDEF") == std::string::npos;
}

}  // namespace talo
