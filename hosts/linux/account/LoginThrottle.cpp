#include "hosts/linux/account/LoginThrottle.h"

#include <arpa/inet.h>
#include <errno.h>
#include <fcntl.h>
#include <string.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>

#include "hosts/linux/util/HostLog.h"
#include "hosts/linux/util/Network.h"
#include "platform/System.h"

namespace host {

namespace {

constexpr char kSource[] = "LoginThrottle.cpp";
constexpr size_t kMaxKey = 64;
constexpr unsigned kMostFailures = 1000;  // the wait grows no more

// FNV-1a. Keys that are made to collide share a bucket, which is harmless.
unsigned BucketOf(const std::string& key) {
    unsigned long long hash = 14695981039346656037ull;
    for (const char byte : key) {
        hash = (hash ^ static_cast<unsigned char>(byte)) * 1099511628211ull;
    }
    return static_cast<unsigned>(hash ^ hash >> 32) % kBuckets;
}

std::string BucketPath(const std::string& dir, const char* kind, const std::string& key) {
    return key.empty() ? std::string() : dir + "/" + kind + "." + std::to_string(BucketOf(key));
}

// Who has an IPv6 address has its /64.
std::string AddressKey(const std::string& address) {
    std::string canonical = CanonicalAddress(address);
    unsigned char bytes[16];
    char text[INET6_ADDRSTRLEN];
    if (inet_pton(AF_INET6, canonical.c_str(), bytes) != 1) {
        return canonical;
    }
    memset(bytes + 8, 0, 8);
    return inet_ntop(AF_INET6, bytes, text, sizeof text) != nullptr ? text : canonical;
}

// Locks a file and makes sure of its size, with errno set when that fails.
bool LockWithSize(int file, size_t size) {
    while (flock(file, LOCK_EX) != 0) {
        if (errno != EINTR) {
            return false;
        }
    }
    errno = posix_fallocate(file, 0, static_cast<off_t>(size));
    return errno == 0;
}

bool MakeDir(const std::string& dir) {
    struct stat facts = {};
    if (TALOFSMkdirP(dir.c_str(), 0, 1, -1, -1, 0700) < 0 || stat(dir.c_str(), &facts) != 0) {
        HOST_LOG("cannot make %s: %m", dir.c_str());
        return false;
    }
    if ((facts.st_uid != 0 && facts.st_uid != geteuid()) ||
        (facts.st_mode & (S_IWGRP | S_IWOTH)) != 0) {
        HOST_LOG("cannot use %s: others may write there", dir.c_str());
        return false;
    }
    return true;
}

}  // namespace

long long WaitAfter(unsigned failures) {
    if (failures <= kFreeFailures) {
        return 0;
    }
    const unsigned doublings = std::min(failures - kFreeFailures - 1, 20u);
    return std::min(kFirstWaitMs << doublings, kLongestWaitMs);
}

// Fixed, so that the file has its size from the beginning and counting needs no
// space that may have run out.
struct LoginCounter::Record {
    char key[kMaxKey];  // without a NUL when it is that long
    long long last;
    unsigned failures;
    unsigned reserved;
};

LoginCounter::LoginCounter(const std::string& path, const std::string& key, long long now)
    : key_(key), now_(now) {
    if (path.empty() || key.empty() || key.size() > kMaxKey) {
        return;
    }
    const int file = open(path.c_str(), O_RDWR | O_CREAT | O_CLOEXEC | O_NOFOLLOW | O_NONBLOCK,
                          S_IRUSR | S_IWUSR);
    Record records[kKeysPerBucket] = {};
    if (file < 0 || !LockWithSize(file, sizeof records) ||
        pread(file, records, sizeof records, 0) != static_cast<ssize_t>(sizeof records)) {
        HOST_LOG("cannot use %s: %m", path.c_str());
        if (file >= 0) {
            (void)close(file);
        }
        return;
    }
    file_ = file;
    for (unsigned slot = 0; slot < kKeysPerBucket; ++slot) {
        Record& record = records[slot];
        if (record.last > now || now - record.last >= kForgetMs) {
            record.failures = 0;
            record.last = 0;
        }
        record.failures = std::min(record.failures, kMostFailures);
        if (record.failures != 0 && std::string(record.key, strnlen(record.key, kMaxKey)) == key) {
            slot_ = slot;
            own_ = true;
        } else if (!own_ && (record.failures < records[slot_].failures ||
                             (record.failures == records[slot_].failures &&
                              record.last < records[slot_].last))) {
            slot_ = slot;
        }
    }
    failures_ = records[slot_].failures;
    last_ = records[slot_].last;
}

LoginCounter::~LoginCounter() {
    if (file_ >= 0) {
        (void)close(file_);
    }
}

bool LoginCounter::IsReady() const {
    return file_ >= 0;
}

int LoginCounter::WaitSeconds() const {
    const long long left = last_ + WaitAfter(failures_) - now_;
    return left > 0 ? static_cast<int>((left + 999) / 1000) : 0;
}

bool LoginCounter::Store(const Record& record) {
    return pwrite(file_, &record, sizeof record,
                  static_cast<off_t>(slot_) * static_cast<off_t>(sizeof record)) ==
           static_cast<ssize_t>(sizeof record);
}

bool LoginCounter::CountFailure() {
    Record record = {};
    memcpy(record.key, key_.data(), key_.size());
    failures_ = std::min(failures_ + 1, kMostFailures);
    record.failures = failures_;
    record.last = last_ = now_;
    own_ = true;
    return Store(record);
}

bool LoginCounter::Clear() {
    if (!own_) {
        return true;
    }
    failures_ = 0;
    own_ = false;
    return Store(Record());
}

LoginThrottle::LoginThrottle(const std::string& dir, const std::string& account,
                             const std::string& address, long long now)
    : folder_(MakeDir(dir)),
      accountKey_(account),
      addressKey_(AddressKey(address)),
      account_(folder_ ? BucketPath(dir, "account", account) : "", account, now),
      address_(folder_ ? BucketPath(dir, "address", addressKey_) : "", addressKey_, now) {}

bool LoginThrottle::IsReady() const {
    return folder_ && (accountKey_.empty() || account_.IsReady()) &&
           (addressKey_.empty() || address_.IsReady());
}

int LoginThrottle::WaitSeconds() const {
    return std::max(account_.WaitSeconds(), address_.WaitSeconds());
}

bool LoginThrottle::Fail() {
    const bool counted = accountKey_.empty() || account_.CountFailure();
    return (addressKey_.empty() || address_.CountFailure()) && counted;
}

bool LoginThrottle::Succeed() {
    return account_.Clear();
}

}  // namespace host
