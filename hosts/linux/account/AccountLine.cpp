#include "hosts/linux/account/AccountLine.h"

#include <limits>

#include "hosts/linux/account/AccountName.h"
#include "hosts/linux/account/Password.h"
#include "hosts/linux/util/LineObject.h"
#include "hosts/linux/util/Network.h"

namespace host {

namespace {

bool ReadName(const Json::Value& value, StoredAccount* stored) {
    if (!value.isString() || !IsAccountName(value.asString())) {
        return false;
    }
    stored->account.name = value.asString();
    return true;
}

// 0 is the superuser's, and TaloCgiUIDGet answers an int.
bool ReadUid(const Json::Value& value, StoredAccount* stored) {
    long long uid = 0;
    if (!ReadJsonInteger(value, 1, std::numeric_limits<int>::max(), &uid)) {
        return false;
    }
    stored->account.uid = static_cast<unsigned>(uid);
    return true;
}

bool ReadHash(const Json::Value& value, StoredAccount* stored) {
    if (!value.isString() || (!value.asString().empty() && !IsYescrypt(value.asString()))) {
        return false;
    }
    stored->hash = value.asString();
    return true;
}

bool ReadGroups(const Json::Value& value, StoredAccount* stored) {
    return ReadJsonTexts(value, IsAccountName, &stored->account.groups);
}

bool ReadLocked(const Json::Value& value, StoredAccount* stored) {
    stored->account.locked = value.isBool() && value.asBool();
    return value.isBool();
}

bool ReadExpires(const Json::Value& value, StoredAccount* stored) {
    return ReadJsonInteger(value, 0, std::numeric_limits<long long>::max(),
                           &stored->account.passwordExpires);
}

bool ReadPrivileges(const Json::Value& value, StoredAccount* stored) {
    if (!value.isObject()) {
        return false;
    }
    for (const std::string& privilege : value.getMemberNames()) {
        if (!IsPrivilegeName(privilege) ||
            !ReadJsonTexts(value[privilege], IsNetwork, &stored->account.privileges[privilege])) {
            return false;
        }
    }
    return true;
}

constexpr LineMember<StoredAccount> kMembers[] = {
    {kNameMember, true, ReadName},
    {kUidMember, true, ReadUid},
    {kHashMember, false, ReadHash},
    {kGroupsMember, false, ReadGroups},
    {kLockedMember, false, ReadLocked},
    {kExpiresMember, false, ReadExpires},
    {kPrivilegesMember, false, ReadPrivileges},
};

}  // namespace

bool ParseAccountLine(const char* begin, const char* end, StoredAccount* stored,
                      Json::Value* members, std::string* reason) {
    Json::Value line;
    if (!ParseLineObject(begin, end, &line, reason) ||
        !ReadLineMembers(line, kMembers, stored, reason)) {
        return false;
    }
    if (members != nullptr) {
        members->swap(line);
    }
    return true;
}

}  // namespace host
