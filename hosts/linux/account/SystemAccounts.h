#ifndef TALO_HOSTS_LINUX_ACCOUNT_SYSTEMACCOUNTS_H
#define TALO_HOSTS_LINUX_ACCOUNT_SYSTEMACCOUNTS_H

#include <string>
#include <vector>

#include "hosts/linux/account/AccountFile.h"

// The users and groups of the machine, through the name service switch, so that
// a directory's are among them. Read only.
namespace host {

// 1 for the superuser and the members of the group "administrators", 0 for
// others, negative when that cannot be told.
int IsSystemAdministrator(const char* user);

// The superuser counts as a member of "administrators". Nobody has application
// privileges: the machine knows none.
Lookup FindInSystem(const std::string& name, talo::Account* account);

// In byte order of the names; a directory may refuse to list its own.
bool ListSystem(std::vector<talo::Account>* accounts);

// What the shadow data base says of a user: "" for a hash that opens nothing.
struct ShadowFacts {
    std::string hash;
    bool locked = false;  // behind a "!", or the account's last day has passed
    bool expired = false;
};

// `today` in days since the epoch. Needs the right to read the data base.
Lookup FindShadow(const std::string& name, long today, ShadowFacts* facts);

// Reads one entry of it: the hash, the last change, the greatest age and the
// account's last day, all in days and -1 for none.
ShadowFacts ReadShadow(const std::string& hash, long changed, long maxAge, long lastDay,
                       long today);

}  // namespace host

#endif
