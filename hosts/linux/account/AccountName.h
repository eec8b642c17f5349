#ifndef TALO_HOSTS_LINUX_ACCOUNT_ACCOUNTNAME_H
#define TALO_HOSTS_LINUX_ACCOUNT_ACCOUNTNAME_H

#include <string>

namespace host {

// The one group whose members hold every right.
constexpr char kAdministrators[] = "administrators";

// What sdk/Accounts.h calls a name. Groups are named like accounts.
bool IsAccountName(const std::string& name);

// An application privilege: 1 to 128 printable ASCII characters without blanks.
bool IsPrivilegeName(const std::string& name);

}  // namespace host

#endif
