#include "hosts/linux/account/AccountLine.h"

#include <limits>

#include "hosts/linux/account/AccountName.h"
#include "hosts/linux/account/Password.h"
#include "hosts/linux/util/JsonGrammar.h"
#include "hosts/linux/util/Network.h"

namespace host {

namespace {

constexpr size_t kMaxDepth = 16;

// 1.0 is no integer here, whatever jsoncpp's isInt thinks.
bool ReadInteger(const Json::Value& value, long long least, long long most, long long* out) {
    if ((value.type() != Json::intValue && value.type() != Json::uintValue) || !value.isInt64() ||
        value.asInt64() < least || value.asInt64() > most) {
        return false;
    }
    *out = value.asInt64();
    return true;
}

bool ReadTexts(const Json::Value& value, bool (*accepts)(const std::string&),
               std::vector<std::string>* out) {
    if (!value.isArray()) {
        return false;
    }
    for (const Json::Value& item : value) {
        if (!item.isString() || !accepts(item.asString())) {
            return false;
        }
        out->push_back(item.asString());
    }
    return true;
}

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
    if (!ReadInteger(value, 1, std::numeric_limits<int>::max(), &uid)) {
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
    return ReadTexts(value, IsAccountName, &stored->account.groups);
}

bool ReadLocked(const Json::Value& value, StoredAccount* stored) {
    stored->account.locked = value.isBool() && value.asBool();
    return value.isBool();
}

bool ReadExpires(const Json::Value& value, StoredAccount* stored) {
    return ReadInteger(value, 0, std::numeric_limits<long long>::max(),
                       &stored->account.passwordExpires);
}

bool ReadPrivileges(const Json::Value& value, StoredAccount* stored) {
    if (!value.isObject()) {
        return false;
    }
    for (const std::string& privilege : value.getMemberNames()) {
        if (!IsPrivilegeName(privilege) ||
            !ReadTexts(value[privilege], IsNetwork, &stored->account.privileges[privilege])) {
            return false;
        }
    }
    return true;
}

struct MemberRow {
    const char* name;
    bool required;
    bool (*read)(const Json::Value&, StoredAccount*);
};

constexpr MemberRow kMembers[] = {
    {kNameMember, true, ReadName},
    {kUidMember, true, ReadUid},
    {kHashMember, false, ReadHash},
    {kGroupsMember, false, ReadGroups},
    {kLockedMember, false, ReadLocked},
    {kExpiresMember, false, ReadExpires},
    {kPrivilegesMember, false, ReadPrivileges},
};

bool Refuse(std::string* reason, const std::string& text) {
    *reason = text;
    return false;
}

}  // namespace

bool ParseAccountLine(const char* begin, const char* end, StoredAccount* stored,
                      Json::Value* members, std::string* reason) {
    Json::Value line;
    JsonError error;
    if (!ParseJson(begin, end, kMaxDepth, &line, &error)) {
        return Refuse(reason,
                      std::string(error.reason) + " at byte " + std::to_string(error.offset));
    }
    if (!line.isObject()) {
        return Refuse(reason, "no object");
    }
    StoredAccount read;
    for (const MemberRow& row : kMembers) {
        if (!line.isMember(row.name)) {
            if (row.required) {
                return Refuse(reason, std::string("\"") + row.name + "\" is missing");
            }
        } else if (!row.read(line[row.name], &read)) {
            return Refuse(reason, std::string("\"") + row.name + "\" is not valid");
        }
    }
    *stored = std::move(read);
    if (members != nullptr) {
        members->swap(line);
    }
    return true;
}

std::string RenderAccountLine(const Json::Value& members) {
    Json::StreamWriterBuilder builder;
    builder["indentation"] = "";
    builder["emitUTF8"] = true;
    return Json::writeString(builder, members);
}

}  // namespace host
