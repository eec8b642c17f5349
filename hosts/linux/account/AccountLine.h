#ifndef TALO_HOSTS_LINUX_ACCOUNT_ACCOUNTLINE_H
#define TALO_HOSTS_LINUX_ACCOUNT_ACCOUNTLINE_H

#include <json/json.h>

#include <string>

#include "hosts/linux/sdk/Accounts.h"

namespace host {

// The members of a line of the file of accounts. Others are nobody's business
// here and stay.
constexpr char kNameMember[] = "name";
constexpr char kUidMember[] = "uid";
constexpr char kHashMember[] = "password";
constexpr char kGroupsMember[] = "groups";
constexpr char kLockedMember[] = "locked";
constexpr char kExpiresMember[] = "passwordExpires";
constexpr char kPrivilegesMember[] = "privileges";

struct StoredAccount {
    talo::Account account;
    std::string hash;  // "" when no password opens the account
};

// Understands one line. A line that is half understood would be a right half
// understood, so one wrong member refuses it whole: outputs stay untouched and
// `reason` says why. `members` (may be null) gets the line as it is.
bool ParseAccountLine(const char* begin, const char* end, StoredAccount* stored,
                      Json::Value* members, std::string* reason);

}  // namespace host

#endif
