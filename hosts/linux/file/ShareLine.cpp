#include "hosts/linux/file/ShareLine.h"

#include "hosts/linux/account/AccountName.h"
#include "hosts/linux/sdk/Places.h"
#include "hosts/linux/util/JsonGrammar.h"

namespace host {

namespace {

constexpr size_t kMaxDepth = 16;
constexpr size_t kMaxFolderBytes = 4095;  // what the system takes as a path

bool Refuse(std::string* reason, const std::string& text) {
    *reason = text;
    return false;
}

bool ReadName(const Json::Value& value, talo::Share* share) {
    if (!value.isString() || !talo::IsComponent(value.asString())) {
        return false;
    }
    share->name = value.asString();
    return true;
}

// Links on the way to it are the administrator's own business.
bool ReadFolder(const Json::Value& value, talo::Share* share) {
    if (!value.isString()) {
        return false;
    }
    const std::string folder = value.asString();
    if (folder.empty() || folder[0] != '/' || folder.size() > kMaxFolderBytes ||
        folder.find('\0') != std::string::npos) {
        return false;
    }
    share->folder = folder;
    return true;
}

bool IsHolder(const std::string& text) {
    return IsAccountName(text[0] == '@' ? text.substr(1) : text);
}

bool ReadHolders(const Json::Value& value, std::vector<std::string>* holders) {
    if (!value.isArray()) {
        return false;
    }
    for (const Json::Value& item : value) {
        if (!item.isString() || !IsHolder(item.asString())) {
            return false;
        }
        holders->push_back(item.asString());
    }
    return true;
}

bool ReadReaders(const Json::Value& value, talo::Share* share) {
    return ReadHolders(value, &share->readers);
}

bool ReadWriters(const Json::Value& value, talo::Share* share) {
    return ReadHolders(value, &share->writers);
}

struct MemberRow {
    const char* name;
    bool required;
    bool (*read)(const Json::Value&, talo::Share*);
};

constexpr MemberRow kMembers[] = {
    {"name", true, ReadName},
    {"folder", true, ReadFolder},
    {"readers", false, ReadReaders},
    {"writers", false, ReadWriters},
};

}  // namespace

bool ParseShareLine(const char* begin, const char* end, talo::Share* share, std::string* reason) {
    Json::Value line;
    JsonError error;
    if (!ParseJson(begin, end, kMaxDepth, &line, &error)) {
        return Refuse(reason,
                      std::string(error.reason) + " at byte " + std::to_string(error.offset));
    }
    if (!line.isObject()) {
        return Refuse(reason, "no object");
    }
    talo::Share read;
    for (const MemberRow& row : kMembers) {
        if (!line.isMember(row.name)) {
            if (row.required) {
                return Refuse(reason, std::string("\"") + row.name + "\" is missing");
            }
        } else if (!row.read(line[row.name], &read)) {
            return Refuse(reason, std::string("\"") + row.name + "\" is not valid");
        }
    }
    *share = std::move(read);
    return true;
}

}  // namespace host
