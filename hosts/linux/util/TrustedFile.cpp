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

bool IsTrusted(int file, std::string* reason) {
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
    return true;
}

}  // namespace

bool ReadTrustedFile(const std::string& path, size_t most, std::string* content) {
    const Descriptor file(open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK | O_NOFOLLOW));
    if (file.Get() < 0 && errno == ENOENT) {
        content->clear();
        return true;
    }
    std::string reason = file.Get() < 0 ? strerror(errno) : "";
    if (file.Get() >= 0 && IsTrusted(file.Get(), &reason) &&
        ReadSmallFile(file.Get(), most, content, &reason)) {
        return true;
    }
    HOST_LOG("cannot use %s: %s", path.c_str(), reason.c_str());
    return false;
}

}  // namespace host
