#include <algorithm>

#include "hosts/linux/account/AccountName.h"
#include "hosts/linux/account/Backend.h"
#include "hosts/linux/account/Password.h"
#include "hosts/linux/sdk/Accounts.h"
#include "hosts/linux/util/Network.h"
#include "platform/Paths.h"

namespace {

bool Refuse(std::string* problem, const std::string& text) {
    *problem = text;
    return false;
}

// Every change begins with these: the file is in use, and the name is one.
template <typename Body>
bool Change(const std::string& name, std::string* problem, Body body) {
    std::string unwanted;
    std::string* why = problem != nullptr ? problem : &unwanted;
    return host::NoThrow(false, [&] {
        if (host::UsesSystemAccounts()) {
            return Refuse(why, "the accounts are the system's and read only here");
        }
        return host::IsAccountName(name) ? body(why) : Refuse(why, "that is no account's name");
    });
}

bool ChangeMembers(const std::string& name, std::string* problem,
                   const host::MemberChange& change) {
    return Change(name, problem, [&](std::string* why) {
        return host::ChangeInFile(TALO_ACCOUNTS_FILE, name, change, why);
    });
}

// Hashing takes its time and happens before the file is locked.
bool Hash(const std::string& password, std::string* hash, std::string* problem) {
    if (!host::IsPassword(password, problem)) {
        return false;
    }
    return host::HashPassword(password, hash) ||
           Refuse(problem, "the password cannot be hashed; the system log says why");
}

bool Contains(const Json::Value& texts, const std::string& text) {
    return std::find(texts.begin(), texts.end(), Json::Value(text)) != texts.end();
}

}  // namespace

namespace talo {

bool AddAccount(const std::string& name, const std::string& password, std::string* problem) {
    return Change(name, problem, [&](std::string* why) {
        std::string hash;
        return Hash(password, &hash, why) &&
               host::AppendToFile(TALO_ACCOUNTS_FILE, name, hash, why);
    });
}

bool SetPassword(const std::string& name, const std::string& password, long long expires,
                 std::string* problem) {
    return Change(name, problem, [&](std::string* why) {
        std::string hash;
        if (expires < 0) {
            return Refuse(why, "the password's end is before the epoch");
        }
        return Hash(password, &hash, why) &&
               ChangeMembers(name, why, [&](Json::Value* members, std::string*) {
                   (*members)[host::kHashMember] = hash;
                   (*members)[host::kExpiresMember] = Json::Int64(expires);
                   return true;
               });
    });
}

bool RemoveAccount(const std::string& name, std::string* problem) {
    return Change(name, problem, [&](std::string* why) {
        return host::RemoveFromFile(TALO_ACCOUNTS_FILE, name, why);
    });
}

bool SetLocked(const std::string& name, bool locked, std::string* problem) {
    return ChangeMembers(name, problem, [&](Json::Value* members, std::string*) {
        (*members)[host::kLockedMember] = locked;
        return true;
    });
}

bool SetGroups(const std::string& name, const std::vector<std::string>& groups,
               std::string* problem) {
    return ChangeMembers(name, problem, [&](Json::Value* members, std::string* why) {
        Json::Value names(Json::arrayValue);
        for (const std::string& group : groups) {
            if (!host::IsAccountName(group)) {
                return Refuse(why, "that is no group's name");
            }
            if (!Contains(names, group)) {
                names.append(group);
            }
        }
        (*members)[host::kGroupsMember] = names;
        return true;
    });
}

bool GrantPrivilege(const std::string& name, const std::string& privilege,
                    const std::string& network, std::string* problem) {
    return ChangeMembers(name, problem, [&](Json::Value* members, std::string* why) {
        if (!host::IsPrivilegeName(privilege)) {
            return Refuse(why, "that is no privilege's name");
        }
        if (!network.empty() && !host::IsNetwork(network)) {
            return Refuse(why, "that is no network; expected ADDRESS or ADDRESS/BITS");
        }
        Json::Value& privileges = (*members)[host::kPrivilegesMember];
        const bool held = privileges.isMember(privilege);
        Json::Value& networks = privileges[privilege];
        // Nothing may be granted that takes away: who has it everywhere keeps it.
        if (network.empty() || (held && networks.empty())) {
            networks = Json::Value(Json::arrayValue);
        } else if (!Contains(networks, network)) {
            networks.append(network);
        }
        return true;
    });
}

bool RevokePrivilege(const std::string& name, const std::string& privilege, std::string* problem) {
    return ChangeMembers(name, problem, [&](Json::Value* members, std::string* why) {
        if (!members->isMember(host::kPrivilegesMember) ||
            !(*members)[host::kPrivilegesMember].isMember(privilege)) {
            return Refuse(why, "\"" + name + "\" does not hold that privilege");
        }
        (*members)[host::kPrivilegesMember].removeMember(privilege);
        return true;
    });
}

}  // namespace talo
