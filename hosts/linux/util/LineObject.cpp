#include "hosts/linux/util/LineObject.h"

#include "hosts/linux/util/JsonGrammar.h"

namespace host {

namespace {

constexpr size_t kMaxDepth = 16;

}  // namespace

bool ParseLineObject(const char* begin, const char* end, Json::Value* line, std::string* reason) {
    Json::Value read;
    JsonError error;
    if (!ParseJson(begin, end, kMaxDepth, &read, &error)) {
        *reason = std::string(error.reason) + " at byte " + std::to_string(error.offset);
        return false;
    }
    if (!read.isObject()) {
        *reason = "no object";
        return false;
    }
    line->swap(read);
    return true;
}

std::string RenderLineObject(const Json::Value& line) {
    Json::StreamWriterBuilder builder;
    builder["indentation"] = "";
    builder["emitUTF8"] = true;
    return Json::writeString(builder, line);
}

std::string LineFaultText(LineFault fault, const char* name) {
    return std::string("\"") + name + "\" is " +
           (fault == LineFault::kMissing ? "missing" : "not valid");
}

bool ReadJsonInteger(const Json::Value& value, long long least, long long most, long long* out) {
    if ((value.type() != Json::intValue && value.type() != Json::uintValue) || !value.isInt64() ||
        value.asInt64() < least || value.asInt64() > most) {
        return false;
    }
    *out = value.asInt64();
    return true;
}

bool ReadJsonTexts(const Json::Value& value, bool (*accepts)(const std::string&),
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

}  // namespace host
