#ifndef TALO_HOSTS_LINUX_ACCOUNT_BACKEND_H
#define TALO_HOSTS_LINUX_ACCOUNT_BACKEND_H

#include <exception>
#include <string>

#include "hosts/linux/account/AccountFile.h"
#include "hosts/linux/util/HostLog.h"

namespace host {

// Whether the host's configuration says accounts="system".
bool UsesSystemAccounts();

// One account of the configured back end.
Lookup FindAccountOf(const std::string& name, talo::Account* account);

// Memory and jsoncpp may throw; what is offered to others may not.
template <typename Result, typename Body>
Result NoThrow(Result fallback, Body body) {
    try {
        return body();
    } catch (const std::exception& caught) {
        LogAt("account", 0, "%s", caught.what());
        return fallback;
    }
}

}  // namespace host

#endif
