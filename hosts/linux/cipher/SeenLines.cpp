#include "hosts/linux/cipher/SeenLines.h"

#include <dirent.h>
#include <errno.h>
#include <fcntl.h>
#include <string.h>
#include <sys/stat.h>
#include <time.h>
#include <unistd.h>

#include <memory>

#include "hosts/linux/cipher/Folder.h"
#include "hosts/linux/util/Descriptor.h"
#include "hosts/linux/util/HostLog.h"

namespace host {

namespace {

constexpr char kSource[] = "SeenLines.cpp";
constexpr char kName[] = "seen.";
constexpr size_t kNonceBytes = sizeof(LineNonce);
constexpr size_t kBucketBytes = kSeenPlaces * kNonceBytes;

// A line's own time is in the slot before now's, in now's or in the one behind;
// one more on either side is kept for processes that look at the clock earlier.
constexpr long long kKeptSlots = 2;

long long SlotOf(long long time) {
    return time / kMostSkewSeconds;
}

// -1 for the name of no slot's file.
long long SlotOfName(const char* name) {
    constexpr size_t kMostDigits = 12;
    const size_t prefix = sizeof kName - 1;
    const size_t digits = strlen(name) > prefix ? strlen(name) - prefix : 0;
    if (digits == 0 || digits > kMostDigits || strncmp(name, kName, prefix) != 0) {
        return -1;
    }
    long long slot = 0;
    for (const char* digit = name + prefix; *digit != '\0'; ++digit) {
        if (*digit < '0' || *digit > '9') {
            return -1;
        }
        slot = slot * 10 + (*digit - '0');
    }
    return slot;
}

void RemoveOldSlots(const std::string& dir, long long now) {
    const std::unique_ptr<DIR, int (*)(DIR*)> folder(opendir(dir.c_str()), closedir);
    if (folder == nullptr) {
        return;
    }
    while (const dirent* entry = readdir(folder.get())) {
        const long long slot = SlotOfName(entry->d_name);
        if (slot >= 0 && (slot < SlotOf(now) - kKeptSlots || slot > SlotOf(now) + kKeptSlots)) {
            (void)unlinkat(dirfd(folder.get()), entry->d_name, 0);
        }
    }
}

// A whole file without content takes no space.
bool IsPrepared(int file, bool* fresh) {
    struct stat facts = {};
    constexpr off_t kSize = kSeenBuckets * kBucketBytes;
    if (fstat(file, &facts) != 0) {
        return false;
    }
    *fresh = facts.st_size < kSize;
    return !*fresh || ftruncate(file, kSize) == 0;
}

// Reads the places of a bucket up to the first free one, which is all zeros.
Seen NoteInBucket(int file, const unsigned char* nonce) {
    constexpr size_t kBlock = 4096;
    const size_t begin = nonce[kNonceBytes - 1] % kSeenBuckets * kBucketBytes;
    const unsigned char free[kNonceBytes] = {};
    unsigned char block[kBlock];
    for (size_t at = begin; at < begin + kBucketBytes; at += kBlock) {
        if (pread(file, block, kBlock, static_cast<off_t>(at)) != static_cast<ssize_t>(kBlock)) {
            HOST_LOG("cannot read the nonces of sealed lines: %m");
            return Seen::kTrouble;
        }
        for (size_t place = 0; place < kBlock; place += kNonceBytes) {
            if (memcmp(block + place, nonce, kNonceBytes) == 0) {
                return Seen::kBefore;
            }
            if (memcmp(block + place, free, kNonceBytes) != 0) {
                continue;
            }
            if (pwrite(file, nonce, kNonceBytes, static_cast<off_t>(at + place)) !=
                static_cast<ssize_t>(kNonceBytes)) {
                HOST_LOG("cannot note the nonce of a sealed line: %m");
                return Seen::kTrouble;
            }
            return Seen::kFirst;
        }
    }
    HOST_LOG("too many sealed lines came in ten minutes");
    return Seen::kTrouble;
}

}  // namespace

Seen NoteLine(const std::string& dir, const LineContent& content, long long now,
              long long started) {
    const LineNonce free;
    if (content.time < now - kMostSkewSeconds || content.time > now + kMostSkewSeconds ||
        content.time < started || content.time <= 0) {
        return Seen::kOutOfTime;
    }
    if (content.nonce.Text() == free.Text()) {
        return Seen::kBefore;  // it would look like a free place
    }
    if (!MakePrivateFolder(dir)) {
        return Seen::kTrouble;
    }
    const std::string path = dir + "/" + kName + std::to_string(SlotOf(content.time));
    const Descriptor file(OpenPrivateFile(path, O_RDWR | O_CREAT));
    bool fresh = false;
    if (file.Get() < 0 || !LockFile(file.Get()) || !IsPrepared(file.Get(), &fresh)) {
        HOST_LOG("cannot use %s: %m", path.c_str());
        return Seen::kTrouble;
    }
    if (fresh) {
        RemoveOldSlots(dir, now);
    }
    return NoteInBucket(file.Get(), content.nonce.bytes);
}

long long MachineStart(long long now) {
    struct timespec up = {};
    return clock_gettime(CLOCK_BOOTTIME, &up) == 0 ? now - up.tv_sec : now - kMostSkewSeconds;
}

}  // namespace host
