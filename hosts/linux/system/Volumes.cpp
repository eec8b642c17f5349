#include <errno.h>
#include <string.h>
#include <sys/stat.h>
#include <sys/statvfs.h>
#include <unistd.h>

#include <exception>
#include <limits>
#include <string>

#include "hosts/linux/conf/KeyValueFile.h"
#include "hosts/linux/util/HostLog.h"
#include "hosts/linux/util/ParameterLine.h"
#include "platform/System.h"

namespace {

constexpr char kSource[] = "Volumes.cpp";
constexpr Json::ArrayIndex kMaxVolumes = 64;

std::string WithoutFinalSlashes(std::string path) {
    while (path.size() > 1 && path.back() == '/') {
        path.pop_back();
    }
    return path;
}

// A mount point is on another file system than its parent, or is the root.
bool IsMountPoint(const std::string& path, const struct stat& facts) {
    struct stat parent = {};
    return stat((path + "/..").c_str(), &parent) == 0 &&
           (parent.st_dev != facts.st_dev || parent.st_ino == facts.st_ino);
}

// A volume that is not mounted leaves its folder behind, on the system's own
// small partition: such a folder is none unless the configuration says so.
bool IsVolume(const std::string& path, bool foldersToo) {
    struct stat facts = {};
    return path.size() < sizeof TALOVOLUME::mountPath && path[0] == '/' &&
           stat(path.c_str(), &facts) == 0 && S_ISDIR(facts.st_mode) &&
           (foldersToo || IsMountPoint(path, facts));
}

// What an ordinary process may still write, 0 for a volume that is read-only.
unsigned long long FreeBytes(const std::string& path) {
    struct statvfs facts = {};
    if (statvfs(path.c_str(), &facts) != 0 || (facts.f_flag & ST_RDONLY) != 0) {
        return 0;
    }
    constexpr unsigned long long kMost = std::numeric_limits<unsigned long long>::max();
    const unsigned long long size = facts.f_frsize;
    const unsigned long long blocks = facts.f_bavail;
    return size != 0 && blocks > kMost / size ? kMost : blocks * size;
}

// False when there is no volume at all.
bool FindLargest(TALOVOLUME* largest) {
    const Json::Value names = host::SplitTrimmed(host::HostSetting("volumes", ""), ",");
    const bool foldersToo = host::HostSetting("volumes_folders", "no") == "yes";
    bool found = false;
    for (Json::ArrayIndex index = 0; index < names.size() && index < kMaxVolumes; ++index) {
        const std::string path = WithoutFinalSlashes(names[index].asString());
        if (path.empty()) {
            continue;
        }
        if (!IsVolume(path, foldersToo)) {
            HOST_LOG("%s is no data volume", path.c_str());
            continue;
        }
        const unsigned long long bytes = FreeBytes(path);
        if (!found || bytes > largest->freeBytes) {
            memcpy(largest->mountPath, path.c_str(), path.size() + 1);
            largest->freeBytes = bytes;
            found = true;
        }
    }
    return found;
}

int Answer(int result, int why, int* status) {
    if (status != nullptr) {
        *status = why;
    }
    return result;
}

}  // namespace

extern "C" int VolumeAvailGet(unsigned long long size, TALOVOLUME* volume, int* status, int) {
    try {
        TALOVOLUME largest = {};
        if (volume == nullptr || !FindLargest(&largest)) {
            return Answer(-1, TALO_VOLUME_NONE, status);
        }
        if (largest.freeBytes == 0 || largest.freeBytes < size) {
            return Answer(0, TALO_VOLUME_FULL, status);
        }
        *volume = largest;
        return Answer(1, 0, status);
    } catch (const std::exception&) {
        return Answer(-1, TALO_VOLUME_NONE, status);
    }
}
