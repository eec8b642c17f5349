#include "hosts/linux/relay/NodeSessions.h"

#include <errno.h>
#include <json/json.h>
#include <unistd.h>

#include <cstdint>

#include "hosts/linux/cipher/Folder.h"
#include "hosts/linux/relay/FormText.h"
#include "hosts/linux/util/HostLog.h"
#include "hosts/linux/util/JsonGrammar.h"
#include "hosts/linux/util/SmallFile.h"
#include "hosts/linux/util/TrustedFile.h"
#include "platform/Paths.h"

namespace host {

namespace {

constexpr char kSource[] = "NodeSessions.cpp";

constexpr size_t kMostIdBytes = 256;
constexpr size_t kMostFileBytes = 16 << 10;

// Names are of any length and may hold anything, so the file has only a mark of
// them (FNV-1a); two that happen to have the same one use the place in turn, since
// the content says whose it is.
std::string MarkOf(const Caller& caller) {
    constexpr char kDigits[] = "0123456789abcdef";
    uint64_t mark = 14695981039346656037u;
    const std::string both = caller.user + '\0' + caller.language;
    for (const char byte : both) {
        mark = (mark ^ static_cast<unsigned char>(byte)) * 1099511628211u;
    }
    std::string text;
    for (int shift = 60; shift >= 0; shift -= 4) {
        text += kDigits[mark >> shift & 15];
    }
    return text;
}

std::string PathOf(const talo::Node& node, const Caller& caller) {
    return TALO_RELAY_DIR "/" + std::to_string(node.id) + "-" + MarkOf(caller);
}

Json::Value Whose(const talo::Node& node, const Caller& caller) {
    Json::Value record(Json::objectValue);
    record["node"] = static_cast<Json::Int64>(node.id);
    record["self"] = static_cast<Json::Int64>(node.self);
    record["url"] = WithoutQuery(node.url);
    record["user"] = caller.user;
    record["language"] = caller.language;
    return record;
}

}  // namespace

bool IsNodeSession(const std::string& id) {
    for (const char byte : id) {
        const bool plain = (byte >= '0' && byte <= '9') || (byte >= 'a' && byte <= 'z') ||
                           (byte >= 'A' && byte <= 'Z') || byte == '-' || byte == '_' ||
                           byte == '.' || byte == '~';
        if (!plain) {
            return false;
        }
    }
    return !id.empty() && id.size() <= kMostIdBytes;
}

std::string KeptNodeSession(const talo::Node& node, const Caller& caller) {
    std::string content;
    Json::Value record;
    JsonError error;
    if (!ReadSecretFile(PathOf(node, caller), kMostFileBytes, &content) || content.empty() ||
        !ParseJson(content.data(), content.data() + content.size(), 1, &record, &error) ||
        !record.isObject() || !record["sid"].isString()) {
        return "";
    }
    const std::string id = record["sid"].asString();
    record.removeMember("sid");
    return record == Whose(node, caller) && IsNodeSession(id) ? id : "";
}

void KeepNodeSession(const talo::Node& node, const Caller& caller, const std::string& id) {
    Json::Value record = Whose(node, caller);
    record["sid"] = id;
    Json::StreamWriterBuilder builder;
    builder["indentation"] = "";
    builder["emitUTF8"] = true;
    if (MakePrivateFolder(TALO_RELAY_DIR) &&
        !ReplaceFile(PathOf(node, caller), Json::writeString(builder, record))) {
        HOST_LOG("cannot keep a session at appliance %lld: %m", node.id);
    }
}

void ForgetNodeSession(const talo::Node& node, const Caller& caller) {
    if (unlink(PathOf(node, caller).c_str()) != 0 && errno != ENOENT) {
        HOST_LOG("cannot forget a session at appliance %lld: %m", node.id);
    }
}

}  // namespace host
