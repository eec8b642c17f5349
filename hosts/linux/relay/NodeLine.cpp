#include "hosts/linux/relay/NodeLine.h"

#include <string.h>

#include <algorithm>
#include <limits>

#include "hosts/linux/relay/NodeUrl.h"
#include "hosts/linux/util/LineObject.h"
#include "hosts/linux/util/Utf8.h"

namespace host {

namespace {

constexpr long long kLastId = std::numeric_limits<long long>::max();
constexpr size_t kMaxPathBytes = 4095;  // what the system takes
constexpr size_t kHashDigits = 64;

constexpr const char* kUserClasses[] = {"admin.local",  "admin.domain",  "admin.ldap",
                                        "normal.local", "normal.domain", "normal.ldap"};

bool ReadText(const Json::Value& value, bool (*accepts)(const std::string&), std::string* out) {
    if (!value.isString() || !accepts(value.asString())) {
        return false;
    }
    *out = value.asString();
    return true;
}

bool IsAbsolutePath(const std::string& text) {
    if (text.empty() || text[0] != '/' || text.size() > kMaxPathBytes) {
        return false;
    }
    for (size_t at = 0; at < text.size();) {
        const size_t length = Utf8Character(text, at);
        if (length == 0 || IsControlCharacter(text, at)) {
            return false;
        }
        at += length;
    }
    return true;
}

bool IsSecretHash(const std::string& text) {
    return text.size() == kHashDigits &&
           text.find_first_not_of("0123456789abcdef") == std::string::npos;
}

bool ReadId(const Json::Value& value, talo::Node* node) {
    return ReadJsonInteger(value, 1, kLastId, &node->id);
}

bool ReadUrl(const Json::Value& value, talo::Node* node) {
    return ReadText(value, IsNodeUrl, &node->url);
}

bool ReadAuthority(const Json::Value& value, talo::Node* node) {
    return ReadText(value, IsAbsolutePath, &node->authority);
}

bool ReadPin(const Json::Value& value, talo::Node* node) {
    return ReadText(value, IsNodePin, &node->pin);
}

bool ReadSelf(const Json::Value& value, talo::Node* node) {
    return ReadJsonInteger(value, 1, kLastId, &node->self);
}

bool ReadSecret(const Json::Value& value, talo::Node* node) {
    return ReadText(value, IsNodeSecret, &node->secret);
}

bool ReadSecretHash(const Json::Value& value, talo::Node* node) {
    return ReadText(value, IsSecretHash, &node->secretHash);
}

bool ReadClasses(const Json::Value& value, talo::Node* node) {
    std::vector<std::string> classes;
    if (!ReadJsonTexts(value, IsUserClass, &classes)) {
        return false;
    }
    for (const std::string& granted : classes) {
        if (std::count(classes.begin(), classes.end(), granted) != 1) {
            return false;
        }
    }
    node->classes.swap(classes);
    return true;
}

constexpr LineMember<talo::Node> kAcceptsMembers[] = {
    {"secret_hash", true, ReadSecretHash},
    {"classes", true, ReadClasses},
};

bool ReadAccepts(const Json::Value& value, talo::Node* node) {
    talo::Node accepted;
    std::string reason;
    if (!value.isObject() || !ReadLineMembers(value, kAcceptsMembers, &accepted, &reason)) {
        return false;
    }
    node->secretHash.swap(accepted.secretHash);
    node->classes.swap(accepted.classes);
    return true;
}

constexpr LineMember<talo::Node> kMembers[] = {
    {"id", true, ReadId},
    {"url", false, ReadUrl},
    {"authority", false, ReadAuthority},
    {"pin", false, ReadPin},
    {"self", false, ReadSelf},
    {"secret", false, ReadSecret},
    {"accepts", false, ReadAccepts},
};

bool Refuse(std::string* reason, const char* text) {
    *reason = text;
    return false;
}

bool IsWhole(const talo::Node& node, std::string* reason) {
    const bool called = !node.url.empty();
    if (called != !node.secret.empty() || called != (node.self != 0)) {
        return Refuse(reason, "\"url\", \"self\" and \"secret\" go together");
    }
    if (!called && !(node.authority.empty() && node.pin.empty())) {
        return Refuse(reason, "\"authority\" and \"pin\" go with \"url\"");
    }
    if (!called && node.secretHash.empty()) {
        return Refuse(reason, "it is neither called nor may it call");
    }
    return true;
}

void SetText(Json::Value* members, const char* name, const std::string& text) {
    if (text.empty()) {
        members->removeMember(name);
    } else {
        (*members)[name] = text;
    }
}

}  // namespace

bool ParseNodeLine(const char* begin, const char* end, talo::Node* node, Json::Value* members,
                   std::string* reason) {
    Json::Value line;
    talo::Node read;
    if (!ParseLineObject(begin, end, &line, reason) ||
        !ReadLineMembers(line, kMembers, &read, reason) || !IsWhole(read, reason)) {
        return false;
    }
    *node = std::move(read);
    if (members != nullptr) {
        members->swap(line);
    }
    return true;
}

void SetNodeMembers(const talo::Node& node, Json::Value* members) {
    (*members)["id"] = Json::Int64(node.id);
    SetText(members, "url", node.url);
    SetText(members, "authority", node.authority);
    SetText(members, "pin", node.pin);
    SetText(members, "secret", node.secret);
    members->removeMember("self");
    if (node.self != 0) {
        (*members)["self"] = Json::Int64(node.self);
    }
    members->removeMember("accepts");
    if (!node.secretHash.empty() || !node.classes.empty()) {
        Json::Value& accepts = (*members)["accepts"];
        accepts["secret_hash"] = node.secretHash;
        accepts["classes"] = Json::Value(Json::arrayValue);
        for (const std::string& granted : node.classes) {
            accepts["classes"].append(granted);
        }
    }
}

bool IsNodeSecret(const std::string& text) {
    return !text.empty() && text.size() <= kMaxNodeSecretBytes &&
           std::all_of(text.begin(), text.end(),
                       [](char byte) { return byte > ' ' && byte <= '~'; });
}

// "sha256//" and the base64 of 32 bytes. The last digit before the "=" has two bits
// that stand for nothing: with others than zeros no key would ever match.
bool IsNodePin(const std::string& text) {
    constexpr char kPrefix[] = "sha256//";
    constexpr size_t kPrefixBytes = sizeof kPrefix - 1;
    constexpr size_t kDigits = 43;
    constexpr char kAlphabet[] = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
    if (text.size() != kPrefixBytes + kDigits + 1 || text.compare(0, kPrefixBytes, kPrefix) != 0 ||
        text.back() != '=') {
        return false;
    }
    const std::string digits = text.substr(kPrefixBytes, kDigits);
    return digits.find_first_not_of(kAlphabet) == std::string::npos &&
           (std::string(kAlphabet).find(digits.back()) & 3) == 0;
}

bool IsUserClass(const std::string& text) {
    return std::any_of(std::begin(kUserClasses), std::end(kUserClasses),
                       [&](const char* name) { return text == name; });
}

}  // namespace host
