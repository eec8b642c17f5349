#include "webapi/APIBase.h"

#include <algorithm>

#include "src/base/JsonConvert.h"

namespace TALO {

namespace {

void KeepStrings(Json::Value* members) {
    for (const std::string& name : members->getMemberNames()) {
        if (!(*members)[name].isString()) {
            members->removeMember(name);
        }
    }
}

bool AreStrings(const Json::Value& members) {
    return std::all_of(members.begin(), members.end(),
                       [](const Json::Value& member) { return member.isString(); });
}

}  // namespace

APIBase::APIBase() : store(Json::objectValue) {}

APIBase::~APIBase() = default;

bool APIBase::HasData(const std::string& section, const std::string& key) {
    return !key.empty() && FindMember(FindMember(&store, section), key) != nullptr;
}

// Copied first: `members` may be a part of what it replaces.
bool APIBase::SetData(const std::string& section, const Json::Value& members, bool stringOnly) {
    if (!members.isObject() || members.empty()) {
        return false;
    }
    Json::Value taken(members);
    return TakeData(section, &taken, stringOnly);
}

bool APIBase::TakeData(const std::string& section, Json::Value* members, bool stringOnly) {
    if (FindMember(&store, section) == nullptr || !members->isObject() || members->empty()) {
        return false;
    }
    Json::Value& target = store[section];
    if (!target.isObject()) {
        return false;
    }
    if (stringOnly && !AreStrings(*members)) {
        KeepStrings(members);
    }
    if (target.empty()) {
        target.swap(*members);
        return true;
    }
    for (auto member = members->begin(); member != members->end(); ++member) {
        target[member.name()].swap(*member);
    }
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
