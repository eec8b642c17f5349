#include "webapi/APIBase.h"

#include "src/base/JsonConvert.h"

namespace TALO {

APIBase::APIBase() : store(Json::objectValue) {}

APIBase::~APIBase() = default;

bool APIBase::HasData(const std::string& section, const std::string& key) {
    return !key.empty() && FindMember(FindMember(&store, section), key) != nullptr;
}

bool APIBase::SetData(const std::string& section, const Json::Value& members, bool stringOnly) {
    if (FindMember(&store, section) == nullptr || !members.isObject() || members.empty()) {
        return false;
    }
    Json::Value& target = store[section];
    if (!target.isObject()) {
        return false;
    }
    // Merged aside: `members` may be a part of what the merge replaces.
    Json::Value merged = target;
    for (auto member = members.begin(); member != members.end(); ++member) {
        if (!stringOnly || member->isString()) {
            merged[member.name()] = *member;
        }
    }
    target.swap(merged);
    return true;
}

bool APIBase::SetData(const std::string& section, const std::string& key, const Json::Value& value,
                      bool stringOnly) {
    if (FindMember(&store, section) == nullptr || key.empty() ||
        (stringOnly && !value.isString())) {
        return false;
    }
    Json::Value& target = store[section];
    if (!target.isObject()) {
        return false;
    }
    target[key] = value;
    return true;
}

const Json::Value& APIBase::GetData(const std::string& section, const std::string& key,
                                    const Json::Value& fallback) {
    const Json::Value* found = FindMember(&store, section);
    if (found != nullptr && !key.empty()) {
        found = FindMember(found, key);
    }
    return found != nullptr ? *found : fallback;
}

bool APIBase::ClearData(const std::string& section, const std::string& key) {
    if (section.empty() || FindMember(&store, section) == nullptr) {
        return false;
    }
    Json::Value& target = store[section];
    if (key.empty()) {
        target.clear();
        return true;
    }
    if (!target.isObject()) {
        return false;
    }
    // With both ends, or a name would end at its first zero byte.
    return target.removeMember(key.data(), key.data() + key.size(), nullptr);
}

}  // namespace TALO
