#include "hosts/linux/task/Place.h"

#include <errno.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include "hosts/linux/util/Descriptor.h"
#include "hosts/linux/util/HostLog.h"

namespace host {

namespace {

constexpr char kSource[] = "Place.cpp";

bool MakeFolder(const std::string& folder) {
    struct stat facts = {};
    if (stat(folder.c_str(), &facts) != 0) {
        // A parent that cannot be made shows when the folder in it cannot.
        for (size_t slash = folder.find('/', 1); slash != std::string::npos;
             slash = folder.find('/', slash + 1)) {
            (void)mkdir(folder.substr(0, slash).c_str(), 0755);
        }
        if ((mkdir(folder.c_str(), S_IRWXU) != 0 && errno != EEXIST) ||
            stat(folder.c_str(), &facts) != 0) {
            HOST_LOG("cannot make %s: %m", folder.c_str());
            return false;
        }
    }
    if (!S_ISDIR(facts.st_mode) || (facts.st_uid != 0 && facts.st_uid != geteuid()) ||
        (facts.st_mode & (S_IWGRP | S_IWOTH)) != 0) {
        HOST_LOG("cannot use %s: it is no folder, or others may write there", folder.c_str());
        return false;
    }
    return true;
}

}  // namespace

// SQLite gives its other files the mode of this one. The name is made to last
// before anything is promised to be stored.
bool MakeTaskPlace(const std::string& folder, const std::string& file) {
    struct stat facts = {};
    if (!MakeFolder(folder)) {
        return false;
    }
    if (stat(file.c_str(), &facts) == 0) {
        return true;
    }
    const Descriptor made(
        open(file.c_str(), O_RDWR | O_CREAT | O_EXCL | O_CLOEXEC, S_IRUSR | S_IWUSR));
    if (made.Get() < 0) {
        if (errno == EEXIST) {
            return true;
        }
        HOST_LOG("cannot make %s: %m", file.c_str());
        return false;
    }
    const Descriptor place(open(folder.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    if (place.Get() < 0 || fsync(place.Get()) != 0) {
        HOST_LOG("cannot make %s last: %m", file.c_str());
        return false;
    }
    return true;
}

}  // namespace host
