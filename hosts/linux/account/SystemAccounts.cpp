#include "hosts/linux/account/SystemAccounts.h"

#include <errno.h>
#include <grp.h>
#include <pwd.h>
#include <shadow.h>
#include <string.h>

#include <algorithm>
#include <map>

#include "hosts/linux/account/AccountName.h"

namespace host {

namespace {

// A directory service may hold groups of many members; this bounds what a
// look-up may ask for.
constexpr size_t kMaxRecord = 1u << 20;
constexpr int kMaxGroups = 65536;

// Calls a re-entrant look-up with a buffer that grows until the record fits.
// Positive when found, 0 when there is none, negative on an error.
template <typename Query>
int Find(std::vector<char>* buffer, Query query) {
    for (buffer->resize(4096); buffer->size() <= kMaxRecord; buffer->resize(buffer->size() * 4)) {
        bool found = false;
        const int error = query(buffer->data(), buffer->size(), &found);
        if (error == 0) {
            return found ? 1 : 0;
        }
        if (error != ERANGE) {
            return error == ENOENT || error == ESRCH ? 0 : -1;
        }
    }
    return -1;
}

int FindUser(const char* user, struct passwd* record, std::vector<char>* buffer) {
    return Find(buffer, [&](char* space, size_t size, bool* found) {
        struct passwd* result = nullptr;
        const int error = getpwnam_r(user, record, space, size, &result);
        *found = result != nullptr;
        return error;
    });
}

bool Lists(char* const* members, const char* user) {
    for (; *members != nullptr; ++members) {
        if (strcmp(*members, user) == 0) {
            return true;
        }
    }
    return false;
}

// A group without a name is left out: nobody can ask for it.
void AddGroupName(gid_t id, std::vector<std::string>* names) {
    std::vector<char> buffer;
    struct group record = {};
    const int known = Find(&buffer, [&](char* space, size_t size, bool* found) {
        struct group* result = nullptr;
        const int error = getgrgid_r(id, &record, space, size, &result);
        *found = result != nullptr;
        return error;
    });
    if (known > 0) {
        names->push_back(record.gr_name);
    }
}

std::vector<std::string> GroupsOf(const struct passwd& user) {
    std::vector<gid_t> ids(64);
    int count = static_cast<int>(ids.size());
    while (getgrouplist(user.pw_name, user.pw_gid, ids.data(), &count) < 0) {
        if (count > kMaxGroups) {
            return {};
        }
        ids.resize(std::max(static_cast<size_t>(count), ids.size() * 2));
        count = static_cast<int>(ids.size());
    }
    std::vector<std::string> names;
    for (int index = 0; index < count; ++index) {
        AddGroupName(ids[static_cast<size_t>(index)], &names);
    }
    return names;
}

talo::Account AccountOf(const struct passwd& user) {
    talo::Account account;
    account.name = user.pw_name;
    account.uid = user.pw_uid;
    account.groups = GroupsOf(user);
    if (user.pw_uid == 0 && !talo::IsAdministrator(account)) {
        account.groups.push_back(kAdministrators);
    }
    return account;
}

Lookup LookupOf(int found) {
    return found > 0 ? Lookup::kFound : found == 0 ? Lookup::kAbsent : Lookup::kUnavailable;
}

}  // namespace

int IsSystemAdministrator(const char* user) {
    std::vector<char> userBuffer;
    std::vector<char> groupBuffer;
    struct passwd account = {};
    struct group administrators = {};
    const int known = FindUser(user, &account, &userBuffer);
    if (known <= 0 || account.pw_uid == 0) {
        return known;
    }
    const int grouped = Find(&groupBuffer, [&](char* buffer, size_t size, bool* found) {
        struct group* result = nullptr;
        const int error = getgrnam_r(kAdministrators, &administrators, buffer, size, &result);
        *found = result != nullptr;
        return error;
    });
    if (grouped <= 0) {
        return grouped;
    }
    return account.pw_gid == administrators.gr_gid || Lists(administrators.gr_mem, user) ? 1 : 0;
}

Lookup FindInSystem(const std::string& name, talo::Account* account) {
    std::vector<char> buffer;
    struct passwd user = {};
    const int found = FindUser(name.c_str(), &user, &buffer);
    if (found > 0) {
        *account = AccountOf(user);
    }
    return LookupOf(found);
}

bool ListSystem(std::vector<talo::Account>* accounts) {
    std::map<std::string, talo::Account> byName;
    setpwent();
    errno = 0;
    while (const struct passwd* user = getpwent()) {
        if (IsAccountName(user->pw_name)) {
            byName.emplace(user->pw_name, AccountOf(*user));
        }
        errno = 0;
    }
    const bool complete = errno == 0 || errno == ENOENT;
    endpwent();
    if (!complete) {
        return false;
    }
    std::vector<talo::Account> listed;
    listed.reserve(byName.size());
    for (auto& entry : byName) {
        listed.push_back(std::move(entry.second));
    }
    accounts->swap(listed);
    return true;
}

// glibc writes "!" before the hash of a locked user and "*" where there never
// was one. A last change on day 0 asks for a new password at once.
ShadowFacts ReadShadow(const std::string& hash, long changed, long maxAge, long lastDay,
                       long today) {
    ShadowFacts facts;
    const size_t marks = hash.find_first_not_of('!');
    facts.hash = marks == std::string::npos ? "" : hash.substr(marks);
    if (!facts.hash.empty() && facts.hash[0] == '*') {
        facts.hash.clear();
    }
    facts.locked = (!hash.empty() && hash[0] == '!') || (lastDay >= 0 && today >= lastDay);
    facts.expired =
        changed == 0 || (changed > 0 && maxAge >= 0 && maxAge < 99999 && today > changed + maxAge);
    return facts;
}

Lookup FindShadow(const std::string& name, long today, ShadowFacts* facts) {
    std::vector<char> buffer;
    struct spwd record = {};
    const int found = Find(&buffer, [&](char* space, size_t size, bool* known) {
        struct spwd* result = nullptr;
        const int error = getspnam_r(name.c_str(), &record, space, size, &result);
        *known = result != nullptr;
        return error;
    });
    if (found > 0) {
        *facts =
            ReadShadow(record.sp_pwdp, record.sp_lstchg, record.sp_max, record.sp_expire, today);
        explicit_bzero(buffer.data(), buffer.size());
    }
    return LookupOf(found);
}

}  // namespace host
