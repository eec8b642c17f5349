#include "hosts/linux/util/JsonFile.h"

#include "hosts/linux/util/JsonGrammar.h"
#include "hosts/linux/util/SmallFile.h"
#include "platform/WebAPIUtil.h"

namespace host {

namespace {

bool Refuse(std::string* reason, const std::string& text) {
    *reason = text;
    return false;
}

}  // namespace

bool ReadJsonFile(Json::Value& out, const char* path, std::string* reason) {
    if (path == nullptr) {
        return Refuse(reason, "no path");
    }
    std::string content;
    if (!ReadSmallFile(path, TALO::WebAPIUtil::kMaxJsonFileBytes, &content, reason)) {
        return false;
    }
    Json::Value value;
    JsonError error;
    if (!ParseJson(content.data(), content.data() + content.size(), TALO::WebAPIUtil::kMaxJsonDepth,
                   &value, &error)) {
        return Refuse(reason,
                      std::string(error.reason) + " at byte " + std::to_string(error.offset));
    }
    if (!value.isObject() && !value.isArray()) {
        return Refuse(reason, "neither an object nor an array");
    }
    out.swap(value);
    return true;
}

}  // namespace host
