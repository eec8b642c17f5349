#include "hosts/linux/sdk/Accounts.h"

#include <algorithm>

#include "hosts/linux/account/AccountName.h"
#include "hosts/linux/account/Backend.h"
#include "hosts/linux/account/SystemAccounts.h"
#include "hosts/linux/conf/KeyValueFile.h"
#include "hosts/linux/util/FileState.h"
#include "platform/Paths.h"

namespace host {

bool UsesSystemAccounts() {
    return HostSetting("accounts", "file") == "system";
}

Lookup FindAccountOf(const std::string& name, talo::Account* account) {
    if (!IsAccountName(name)) {
        return Lookup::kAbsent;
    }
    if (UsesSystemAccounts()) {
        return FindInSystem(name, account);
    }
    // A request asks for its user several times. What is kept has no password.
    static thread_local KeptFromFile<std::string, talo::Account> last;
    const FileState now(TALO_ACCOUNTS_FILE);
    if (const talo::Account* kept = last.Find(name, now)) {
        *account = *kept;
        return Lookup::kFound;
    }
    StoredAccount stored;
    const Lookup found = FindInFile(TALO_ACCOUNTS_FILE, name, &stored);
    if (found == Lookup::kFound) {
        *account = std::move(stored.account);
        if (now.IsSettled()) {
            last.Keep(name, now, *account);
        }
    }
    return found;
}

}  // namespace host

namespace talo {

bool FindAccount(const std::string& name, Account* account) {
    return host::NoThrow(
        false, [&] { return host::FindAccountOf(name, account) == host::Lookup::kFound; });
}

bool ListAccounts(std::vector<Account>* accounts) {
    return host::NoThrow(false, [&] {
        return host::UsesSystemAccounts() ? host::ListSystem(accounts)
                                          : host::ListFile(TALO_ACCOUNTS_FILE, accounts);
    });
}

bool IsAdministrator(const Account& account) {
    return std::find(account.groups.begin(), account.groups.end(), host::kAdministrators) !=
           account.groups.end();
}

}  // namespace talo
