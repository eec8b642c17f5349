#ifndef TALO_HOSTS_LINUX_ACCOUNT_LOGINTHROTTLE_H
#define TALO_HOSTS_LINUX_ACCOUNT_LOGINTHROTTLE_H

#include <string>

// Counters of failed logins. An attacker chooses names and addresses, so their
// number is bounded: the hash of a key chooses one of 1024 bucket files of its
// kind, which has room for 32 keys. A key that comes to a full bucket takes
// over the lowest counter there with what it has counted, so flooding a bucket
// never loses a count; it can only make others wait.
namespace host {

constexpr unsigned kBuckets = 1024;
constexpr unsigned kKeysPerBucket = 32;

// The first failures cost nothing; each further one doubles the wait.
constexpr unsigned kFreeFailures = 5;
constexpr long long kFirstWaitMs = 1000;
constexpr long long kLongestWaitMs = 300LL * 1000;
// A counter without a failure for that long begins anew.
constexpr long long kForgetMs = 3600LL * 1000;

// How long after its last failure a key has to wait.
long long WaitAfter(unsigned failures);

// One key's counter, locked while the object lives: who tries the same key
// meanwhile waits for the outcome, so that a hundred attempts side by side do
// not all come before the first failure counts.
class LoginCounter {
  public:
    // `path` is the bucket's; `key` has at most 64 bytes. `now` in milliseconds
    // of a clock that never goes back; counters from its future are of an
    // earlier boot and forgotten.
    LoginCounter(const std::string& path, const std::string& key, long long now);
    ~LoginCounter();
    LoginCounter(const LoginCounter&) = delete;
    LoginCounter& operator=(const LoginCounter&) = delete;

    // False, logged, when the bucket cannot be used.
    bool IsReady() const;
    // Whole seconds, rounded up; 0 for no wait.
    int WaitSeconds() const;
    // False when the counter cannot be written.
    bool CountFailure();
    bool Clear();

  private:
    struct Record;
    bool Store(const Record& record);

    int file_ = -1;
    std::string key_;
    long long now_;
    unsigned slot_ = 0;
    bool own_ = false;  // the slot is this key's
    unsigned failures_ = 0;
    long long last_ = 0;
};

// The two counters of one attempt to log in. An account's failures are cleared
// by its right password; an address's are not, or whoever has one account could
// guess at all the others for ever. They are forgotten by time only.
class LoginThrottle {
  public:
    // An empty account and an address that is none are not counted, an IPv6 address is counted by
    // its /64. Makes the folder, mode 0700.
    LoginThrottle(const std::string& dir, const std::string& account, const std::string& address,
                  long long now);
    bool IsReady() const;
    int WaitSeconds() const;
    bool Fail();
    bool Succeed();

  private:
    bool folder_;
    std::string accountKey_;
    std::string addressKey_;
    LoginCounter account_;  // always locked before the address's: no deadlock
    LoginCounter address_;
};

}  // namespace host

#endif
