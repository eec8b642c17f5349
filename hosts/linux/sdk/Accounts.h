#ifndef TALO_HOSTS_LINUX_SDK_ACCOUNTS_H
#define TALO_HOSTS_LINUX_SDK_ACCOUNTS_H

#include <map>
#include <string>
#include <vector>

#include "platform/Platform.h"

// The users of a Debian host, for programs and API libraries that manage it.
// Where they live is the host's configuration: a file of the appliance's own
// ("file", the default), or the system's users and groups ("system", read only).
// Nothing throws; outputs stay untouched on failure.
namespace talo {

// An account's name is 1 to 64 letters, digits, ".", "_", "-", "@" and "\", and
// begins with a letter, digit or "_".
struct Account {
    std::string name;
    unsigned uid = 0;
    std::vector<std::string> groups;
    bool locked = false;
    long long passwordExpires = 0;  // seconds since the epoch, 0 never
    // Application privilege to the networks ("192.168.0.0/16") that it holds
    // from; an empty list means from everywhere.
    std::map<std::string, std::vector<std::string>> privileges;
};

enum class LoginResult {
    kAccepted,
    kWrong,        // no such account, or not its password; which, is not told
    kLocked,       // told only to who knows the password
    kExpired,      // the password is right and has to be changed
    kWait,         // too many failures of this account or address: wait first
    kUnavailable,  // the accounts cannot be read
};

// Checks a password. A wrong one counts against the account and the address;
// an unknown account takes as long as a known one. Never sleeps: `waitSeconds`
// says how long to wait when the result is kWait.
TALO_PLATFORM LoginResult CheckLogin(const std::string& name, const std::string& password,
                                     const std::string& address, int* waitSeconds);

// One account, and all names in byte order.
TALO_PLATFORM bool FindAccount(const std::string& name, Account* account);
TALO_PLATFORM bool ListAccounts(std::vector<Account>* accounts);

// Whether the account belongs to the group "administrators".
TALO_PLATFORM bool IsAdministrator(const Account& account);

// Changes to the file of accounts. Each is atomic: readers see the old or the
// new state. False with `problem` in words when it cannot be done, among others
// always with the "system" accounts. AddAccount gives the next free uid from
// 1024 up.
TALO_PLATFORM bool AddAccount(const std::string& name, const std::string& password,
                              std::string* problem);
TALO_PLATFORM bool SetPassword(const std::string& name, const std::string& password,
                               long long expires, std::string* problem);
TALO_PLATFORM bool RemoveAccount(const std::string& name, std::string* problem);
TALO_PLATFORM bool SetLocked(const std::string& name, bool locked, std::string* problem);
TALO_PLATFORM bool SetGroups(const std::string& name, const std::vector<std::string>& groups,
                             std::string* problem);
// An empty network grants from everywhere; Revoke takes the privilege away whole.
TALO_PLATFORM bool GrantPrivilege(const std::string& name, const std::string& privilege,
                                  const std::string& network, std::string* problem);
TALO_PLATFORM bool RevokePrivilege(const std::string& name, const std::string& privilege,
                                   std::string* problem);

}  // namespace talo

#endif
