#include "hosts/linux/relay/Opening.h"

#include <json/json.h>

#include "hosts/linux/relay/FormText.h"
#include "hosts/linux/relay/NodeSessions.h"
#include "hosts/linux/util/JsonGrammar.h"

namespace host {

std::string OpeningText(const talo::Node& node, const Caller& caller) {
    Json::Value params(Json::objectValue);
    params["node"] = static_cast<Json::Int64>(node.self);
    params["secret"] = node.secret;
    params["user"] = caller.user;
    params["lang"] = caller.language;
    return FormText("TALO.Relay", 1, "open", params);
}

std::string SessionOfAnswer(const std::string& answer) {
    constexpr size_t kMostDepth = 16;
    Json::Value said;
    JsonError error;
    if (!ParseJson(answer.data(), answer.data() + answer.size(), kMostDepth, &said, &error) ||
        !said.isObject() || !said["success"].isBool() || !said["success"].asBool() ||
        !said["data"].isObject() || !said["data"]["sid"].isString()) {
        return "";
    }
    const std::string id = said["data"]["sid"].asString();
    return IsNodeSession(id) ? id : "";
}

}  // namespace host
