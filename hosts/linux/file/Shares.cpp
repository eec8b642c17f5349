#include "hosts/linux/sdk/Shares.h"

#include <algorithm>
#include <map>

#include "hosts/linux/file/Guard.h"
#include "hosts/linux/file/ShareLine.h"
#include "hosts/linux/sdk/Accounts.h"
#include "hosts/linux/util/HostLog.h"
#include "hosts/linux/util/TrustedFile.h"
#include "platform/Paths.h"
#include "platform/System.h"

namespace {

constexpr char kSource[] = "Shares.cpp";
constexpr size_t kMaxSharesBytes = 4u << 20;
constexpr char kEveryAccount[] = "@users";

// A line that is not understood is logged and skipped; of several lines with one
// name the first counts.
std::map<std::string, talo::Share> Understand(const std::string& content) {
    std::map<std::string, talo::Share> shares;
    size_t number = 0;
    for (size_t start = 0; start < content.size();) {
        const size_t end = std::min(content.find('\n', start), content.size());
        ++number;
        talo::Share share;
        std::string reason = "its name has an earlier line";
        if (content.find_first_not_of(" \t\r", start) < end &&
            (!host::ParseShareLine(content.data() + start, content.data() + end, &share, &reason) ||
             !shares.emplace(share.name, share).second)) {
            HOST_LOG("%s: line %zu is skipped: %s", TALO_SHARES_FILE, number, reason.c_str());
        }
        start = end + 1;
    }
    return shares;
}

bool IsAmong(const talo::ShareUser& user, const std::vector<std::string>& holders) {
    return std::any_of(holders.begin(), holders.end(), [&](const std::string& holder) {
        if (holder[0] != '@') {
            return holder == user.name;
        }
        return holder == kEveryAccount || std::find(user.groups.begin(), user.groups.end(),
                                                    holder.substr(1)) != user.groups.end();
    });
}

}  // namespace

namespace talo {

// The superuser is an administrator also without an account.
bool FindShareUser(const std::string& name, ShareUser* user) {
    return host::Guarded(false, [&] {
        ShareUser found;
        Account account;
        found.name = name;
        found.isAdministrator = TLIBGroupIsAdminGroupMem(name.c_str(), 0) == 1;
        if (FindAccount(name, &account)) {
            found.groups = account.groups;
        } else if (!found.isAdministrator) {
            return false;
        }
        *user = std::move(found);
        return true;
    });
}

bool MayRead(const ShareUser& user, const Share& share) {
    return MayWrite(user, share) || IsAmong(user, share.readers);
}

bool MayWrite(const ShareUser& user, const Share& share) {
    return user.isAdministrator || IsAmong(user, share.writers);
}

bool FindShare(const std::string& name, Share* share) {
    return host::Guarded(false, [&] {
        std::string content;
        if (!host::ReadTrustedFile(TALO_SHARES_FILE, kMaxSharesBytes, &content)) {
            return false;
        }
        std::map<std::string, Share> shares = Understand(content);
        const auto found = shares.find(name);
        if (found == shares.end()) {
            return false;
        }
        *share = std::move(found->second);
        return true;
    });
}

bool ListShares(std::vector<Share>* shares) {
    return host::Guarded(false, [&] {
        std::string content;
        if (!host::ReadTrustedFile(TALO_SHARES_FILE, kMaxSharesBytes, &content)) {
            return false;
        }
        std::vector<Share> listed;
        for (auto& entry : Understand(content)) {
            listed.push_back(std::move(entry.second));
        }
        shares->swap(listed);
        return true;
    });
}

}  // namespace talo
