#include "hosts/linux/util/TrustedFile.h"

#include <errno.h>
#include <fcntl.h>
#include <string.h>
#include <sys/stat.h>
#include <unistd.h>

#include "hosts/linux/util/Descriptor.h"
#include "hosts/linux/util/HostLog.h"
#include "hosts/linux/util/SmallFile.h"

namespace host {

namespace {

constexpr char kSource[] = "TrustedFile.cpp";

bool Refuse(std::string* reason, const char* text) {
    *reason = text;
    return false;
}

enum class Readers { kAnybody, kOwner };

bool IsTrusted(int file, Readers readers, std::string* reason) {
    struct stat facts = {};
    if (fstat(file, &facts) != 0) {
        return Refuse(reason, strerror(errno));
    }
    if (facts.st_uid != 0 && facts.st_uid != geteuid()) {
        return Refuse(reason, "it belongs to another user");
    }
    if ((facts.st_mode & (S_IWGRP | S_IWOTH)) != 0) {
        return Refuse(reason, "others than its owner may write it");
    }
    if (readers == Readers::kOwner && (facts.st_mode & (S_IRGRP | S_IROTH)) != 0) {
        return Refuse(reason, "others than its owner may read it");
    }
    return true;
}

bool Read(const std::string& path, Readers readers, size_t most, std::string* content) {
    const Descriptor file(open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK | O_NOFOLLOW));
    if (file.Get() < 0 && errno == ENOENT) {
        content->clear();
        return true;
    }
    std::string reason = file.Get() < 0 ? strerror(errno) : "";
    if (file.Get() >= 0 && IsTrusted(file.Get(), readers, &reason) &&
        ReadSmallFile(file.Get(), most, content, &reason)) {
        return true;
    }
    HOST_LOG("cannot use %s: %s", path.c_str(), reason.c_str());
    return false;
}

}  // namespace

bool ReadTrustedFile(const std::string& path, size_t most, std::string* content) {
    return Read(path, Readers::kAnybody, most, content);
}

bool ReadSecretFile(const std::string& path, size_t most, std::string* content) {
    return Read(path, Readers::kOwner, most, content);
}

}  // namespace host
