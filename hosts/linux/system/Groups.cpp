#include <errno.h>
#include <grp.h>
#include <pwd.h>
#include <string.h>

#include <new>
#include <vector>

#include "platform/System.h"

namespace {

const char kAdministrators[] = "administrators";

// A directory service may hold groups of many members; this bounds what a
// look-up may ask for.
constexpr size_t kMaxRecord = 1u << 20;

// Calls a re-entrant look-up with a buffer that grows until the record fits.
// Positive when found, 0 when there is none, negative on an error.
template <typename Lookup>
int Find(std::vector<char>* buffer, Lookup lookup) {
    for (buffer->resize(4096); buffer->size() <= kMaxRecord; buffer->resize(buffer->size() * 4)) {
        bool found = false;
        const int error = lookup(buffer->data(), buffer->size(), &found);
        if (error == 0) {
            return found ? 1 : 0;
        }
        if (error != ERANGE) {
            return error == ENOENT || error == ESRCH ? 0 : -1;
        }
    }
    return -1;
}

bool Lists(char* const* members, const char* user) {
    for (; *members != nullptr; ++members) {
        if (strcmp(*members, user) == 0) {
            return true;
        }
    }
    return false;
}

// The superuser, and the members of the group by list or as their own group.
int IsAdministrator(const char* user) {
    std::vector<char> userBuffer;
    std::vector<char> groupBuffer;
    struct passwd account = {};
    struct group administrators = {};
    const int known = Find(&userBuffer, [&](char* buffer, size_t size, bool* found) {
        struct passwd* result = nullptr;
        const int error = getpwnam_r(user, &account, buffer, size, &result);
        *found = result != nullptr;
        return error;
    });
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

}  // namespace

extern "C" int TLIBGroupIsAdminGroupMem(const char* user, int) {
    if (user == nullptr || *user == '\0') {
        return 0;
    }
    try {
        return IsAdministrator(user);
    } catch (const std::bad_alloc&) {
        return -1;
    }
}
