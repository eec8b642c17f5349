#include "hosts/linux/file/ShareLine.h"

#include "hosts/linux/account/AccountName.h"
#include "hosts/linux/sdk/Places.h"
#include "hosts/linux/util/LineObject.h"

namespace host {

namespace {

constexpr size_t kMaxFolderBytes = 4095;  // what the system takes as a path

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

bool ReadReaders(const Json::Value& value, talo::Share* share) {
    return ReadJsonTexts(value, IsHolder, &share->readers);
}

bool ReadWriters(const Json::Value& value, talo::Share* share) {
    return ReadJsonTexts(value, IsHolder, &share->writers);
}

constexpr LineMember<talo::Share> kMembers[] = {
    {"name", true, ReadName},
    {"folder", true, ReadFolder},
    {"readers", false, ReadReaders},
    {"writers", false, ReadWriters},
};

}  // namespace

bool ParseShareLine(const char* begin, const char* end, talo::Share* share, std::string* reason) {
    Json::Value line;
    return ParseLineObject(begin, end, &line, reason) &&
           ReadLineMembers(line, kMembers, share, reason);
}

}  // namespace host
