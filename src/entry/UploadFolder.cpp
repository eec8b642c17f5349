#include "src/entry/UploadFolder.h"

#include <sys/statvfs.h>

#include <cstdint>

#include "platform/Paths.h"
#include "platform/System.h"

namespace TALO {

namespace {

const char kSmallFilesDir[] = "/tmp";
constexpr unsigned long long kRootReserve = 200ULL << 20;
constexpr mode_t kVolumeMode = 0777;
constexpr mode_t kRootMode = 040700;

// The platform's errors.
constexpr int kNoSpace = 10496;
constexpr int kNoFolder = 3072;

// The small file systems are counted in 32 bits: a product that does not fit
// wraps, and nothing of 4 GiB or more ever goes there.
bool FreeBytes32(const char* path, uint32_t* bytes) {
    struct statvfs facts = {};
    if (statvfs(path, &facts) != 0) {
        return false;
    }
    *bytes = static_cast<uint32_t>(facts.f_bfree) * static_cast<uint32_t>(facts.f_frsize);
    return true;
}

bool Fits(unsigned long long needed, uint32_t bytes) {
    if (needed > UINT32_MAX || needed > bytes) {
        TLIBCErrSet(kNoSpace);
        return false;
    }
    return true;
}

bool FindVolume(std::string* dir, unsigned long long needed) {
    if (TLIBCFileCheckKeyValue(TALO_INFO_CONF, "minibox", "yes", 0) != 0) {
        return false;
    }
    TALOVOLUME volume = {};
    int status = -1;
    if (VolumeAvailGet(needed, &volume, &status, 1) != 1) {
        return false;
    }
    *dir = std::string(volume.mountPath) + "/@tmp";
    (void)TALOFSMkdirP(dir->c_str(), 0, 1, -1, -1, kVolumeMode);
    return true;
}

bool CanUploadtoTmp(std::string* dir, unsigned long long needed) {
    uint32_t bytes = 0;
    if (!FreeBytes32(kSmallFilesDir, &bytes) || !Fits(needed, bytes)) {
        return false;
    }
    *dir = kSmallFilesDir;
    return true;
}

bool CanUploadtoRoot(std::string* dir, unsigned long long needed) {
    uint32_t bytes = 0;
    if (!FreeBytes32("/", &bytes)) {
        return false;
    }
    const bool overflows = needed > UINT64_MAX - kRootReserve;
    if (!Fits(overflows ? UINT64_MAX : needed + kRootReserve, bytes)) {
        return false;
    }
    if (TALOFSMkdirP(TALO_UPLOAD_FALLBACK_DIR, 0, 1, -1, -1, kRootMode) < 0) {
        TLIBCErrSet(kNoFolder);
        return false;
    }
    *dir = TALO_UPLOAD_FALLBACK_DIR;
    return true;
}

}  // namespace

bool FindUploadTmpDir(std::string* dir, unsigned long long needed) {
    return FindVolume(dir, needed) || CanUploadtoTmp(dir, needed) || CanUploadtoRoot(dir, needed);
}

}  // namespace TALO
