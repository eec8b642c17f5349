#ifndef TALO_HOSTS_LINUX_ACCOUNT_LOGIN_H
#define TALO_HOSTS_LINUX_ACCOUNT_LOGIN_H

#include <string>

#include "hosts/linux/account/Password.h"
#include "hosts/linux/sdk/Accounts.h"

namespace host {

// What a login takes from the machine, for tests to replace.
struct LoginWorld {
    long long (*monotonicMs)();  // never goes back; begins anew with a restart
    long long (*wallSeconds)();
    Verdict (*verify)(const std::string& password, const std::string& hash);
};

// talo::CheckLogin in such a world.
talo::LoginResult CheckLoginIn(const LoginWorld& world, const std::string& name,
                               const std::string& password, const std::string& address,
                               int* waitSeconds);

}  // namespace host

#endif
