#include "hosts/linux/account/Login.h"

#include <time.h>

#include "hosts/linux/account/AccountFile.h"
#include "hosts/linux/account/AccountName.h"
#include "hosts/linux/account/Backend.h"
#include "hosts/linux/account/LoginThrottle.h"
#include "hosts/linux/account/SystemAccounts.h"
#include "hosts/linux/util/HostLog.h"
#include "platform/Paths.h"

namespace host {

namespace {

constexpr char kSource[] = "Login.cpp";
constexpr long long kSecondsPerDay = 24LL * 3600;

// What is known about a name before its password is looked at.
struct Candidate {
    std::string hash;  // "" when nothing opens it
    bool locked = false;
    bool expired = false;
};

Lookup FindFileCandidate(const std::string& name, long long now, Candidate* candidate) {
    StoredAccount stored;
    const Lookup found = FindInFile(TALO_ACCOUNTS_FILE, name, &stored);
    if (found == Lookup::kFound) {
        const long long expires = stored.account.passwordExpires;
        *candidate = {stored.hash, stored.account.locked, expires != 0 && expires <= now};
    }
    return found;
}

// A user without an entry in the shadow data base has no password.
Lookup FindSystemCandidate(const std::string& name, long long now, Candidate* candidate) {
    talo::Account account;
    ShadowFacts facts;
    const Lookup user = FindInSystem(name, &account);
    if (user != Lookup::kFound) {
        return user;
    }
    const Lookup found = FindShadow(name, static_cast<long>(now / kSecondsPerDay), &facts);
    if (found == Lookup::kFound) {
        *candidate = {facts.hash, facts.locked, facts.expired};
    }
    return found;
}

Lookup FindCandidate(const std::string& name, long long now, Candidate* candidate) {
    if (!IsAccountName(name)) {
        return Lookup::kAbsent;
    }
    return UsesSystemAccounts() ? FindSystemCandidate(name, now, candidate)
                                : FindFileCandidate(name, now, candidate);
}

// One hash is computed whatever the name and the password are, so that the
// clock does not tell who has an account.
Verdict Compare(const LoginWorld& world, const Candidate& candidate, const std::string& password) {
    const bool possible = IsPassword(password, nullptr) && !candidate.hash.empty();
    const Verdict verdict = world.verify(IsPassword(password, nullptr) ? password : "",
                                         candidate.hash.empty() ? kDummyHash : candidate.hash);
    return verdict == Verdict::kMatches && !possible ? Verdict::kDiffers : verdict;
}

talo::LoginResult Outcome(const Candidate& candidate) {
    if (candidate.locked) {
        return talo::LoginResult::kLocked;
    }
    return candidate.expired ? talo::LoginResult::kExpired : talo::LoginResult::kAccepted;
}

// Not the time of day: who sets that must not set back a wait.
long long MonotonicMs() {
    struct timespec now = {};
    (void)clock_gettime(CLOCK_BOOTTIME, &now);
    return now.tv_sec * 1000ll + now.tv_nsec / 1000000;
}

long long WallSeconds() {
    return time(nullptr);
}

}  // namespace

talo::LoginResult CheckLoginIn(const LoginWorld& world, const std::string& name,
                               const std::string& password, const std::string& address,
                               int* waitSeconds) {
    Candidate candidate;
    if (FindCandidate(name, world.wallSeconds(), &candidate) == Lookup::kUnavailable) {
        HOST_LOG("the accounts cannot be read");
        return talo::LoginResult::kUnavailable;
    }
    LoginThrottle throttle(TALO_THROTTLE_DIR, IsAccountName(name) ? name : "", address,
                           world.monotonicMs());
    if (!throttle.IsReady()) {
        return talo::LoginResult::kUnavailable;
    }
    if (const int seconds = throttle.WaitSeconds()) {
        if (waitSeconds != nullptr) {
            *waitSeconds = seconds;
        }
        return talo::LoginResult::kWait;
    }
    switch (Compare(world, candidate, password)) {
        case Verdict::kMatches:
            (void)throttle.Succeed();
            return Outcome(candidate);
        case Verdict::kDiffers:
            return throttle.Fail() ? talo::LoginResult::kWrong : talo::LoginResult::kUnavailable;
        default:
            return talo::LoginResult::kUnavailable;
    }
}

}  // namespace host

namespace talo {

LoginResult CheckLogin(const std::string& name, const std::string& password,
                       const std::string& address, int* waitSeconds) {
    const host::LoginWorld world = {host::MonotonicMs, host::WallSeconds, host::VerifyPassword};
    return host::NoThrow(LoginResult::kUnavailable, [&] {
        return host::CheckLoginIn(world, name, password, address, waitSeconds);
    });
}

}  // namespace talo
