#include <cstring>

#include "hosts/linux/account/Backend.h"
#include "hosts/linux/account/SystemAccounts.h"
#include "hosts/linux/sdk/Accounts.h"
#include "hosts/linux/util/Network.h"
#include "platform/System.h"

namespace {

const char kSuperuser[] = "root";

// With a file of accounts the superuser keeps his right, unless the file has an
// account of that name: the machine must stay manageable from its console.
int IsAdministrator(const char* user) {
    if (host::UsesSystemAccounts()) {
        return host::IsSystemAdministrator(user);
    }
    talo::Account account;
    switch (host::FindAccountOf(user, &account)) {
        case host::Lookup::kFound:
            return talo::IsAdministrator(account) ? 1 : 0;
        case host::Lookup::kAbsent:
            return std::strcmp(user, kSuperuser) == 0 ? host::IsSystemAdministrator(user) : 0;
        default:
            return -1;
    }
}

bool HoldsFrom(const talo::Account& account, const std::string& privilege,
               const std::string& address) {
    const auto held = account.privileges.find(privilege);
    if (held == account.privileges.end()) {
        return false;
    }
    for (const std::string& network : held->second) {
        if (host::InNetwork(address, network)) {
            return true;
        }
    }
    return held->second.empty();
}

}  // namespace

extern "C" {

int TLIBGroupIsAdminGroupMem(const char* user, int) {
    if (user == nullptr || *user == '\0') {
        return 0;
    }
    return host::NoThrow(-1, [&] { return IsAdministrator(user); });
}

int TLIBAppPrivUserHas(const char* user, const char* privilege, const char* remoteIP) {
    if (user == nullptr || *user == '\0' || privilege == nullptr || *privilege == '\0') {
        return 0;
    }
    return host::NoThrow(0, [&] {
        if (IsAdministrator(user) == 1) {
            return 1;
        }
        talo::Account account;
        return host::FindAccountOf(user, &account) == host::Lookup::kFound &&
                       HoldsFrom(account, privilege, remoteIP != nullptr ? remoteIP : "")
                   ? 1
                   : 0;
    });
}

}  // extern "C"
