#ifndef TALO_HOSTS_LINUX_SDK_SHARES_H
#define TALO_HOSTS_LINUX_SDK_SHARES_H

#include <string>
#include <vector>

#include "platform/Platform.h"

// The shared folders of a Debian host, and who may read and write them. They are
// settled in a file by the host's administrator. Nothing throws; outputs stay
// untouched on failure.
namespace talo {

// A reader or writer is an account's name, "@GROUP" for the accounts of a group
// ("@administrators" among them) or "@users" for every account. Who may write
// may read. Administrators may do both without being named.
struct Share {
    std::string name;
    std::string folder;  // absolute
    std::vector<std::string> readers;
    std::vector<std::string> writers;
};

// What the rights of a caller depend on, looked up once.
struct ShareUser {
    std::string name;
    std::vector<std::string> groups;
    bool isAdministrator = false;
};

// False for a name that is no account's, and when the accounts cannot be read.
TALO_PLATFORM bool FindShareUser(const std::string& name, ShareUser* user);

TALO_PLATFORM bool MayRead(const ShareUser& user, const Share& share);
TALO_PLATFORM bool MayWrite(const ShareUser& user, const Share& share);

// One share, and all of them in byte order of their names. A file that is not
// there has none.
TALO_PLATFORM bool FindShare(const std::string& name, Share* share);
TALO_PLATFORM bool ListShares(std::vector<Share>* shares);

}  // namespace talo

#endif
