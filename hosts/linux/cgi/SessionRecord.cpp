#include "hosts/linux/cgi/SessionRecord.h"

#include <json/json.h>

#include <limits>

#include "hosts/linux/util/JsonGrammar.h"
#include "hosts/linux/util/LineObject.h"

namespace host {

namespace {

constexpr size_t kMaxDepth = 2;

// A minute count that a file claims is believed up to a year.
constexpr int kMaxTimeout = 366 * 24 * 60;

std::string Text(const Json::Value& record, const char* key) {
    const Json::Value& value = record[key];
    return value.isString() ? value.asString() : std::string();
}

// Without the appliance that it is bound to a session would be an ordinary one:
// what is no number of one is not read as none.
bool ReadNode(const Json::Value& record, long long* node) {
    return !record.isMember("node") ||
           ReadJsonInteger(record["node"], 1, std::numeric_limits<long long>::max(), node);
}

}  // namespace

std::string FormatSessionRecord(const talo::Session& session) {
    Json::Value record(Json::objectValue);
    record["user"] = session.user;
    record["address"] = session.address;
    record["language"] = session.language;
    record["application"] = session.application;
    record["privilege"] = session.privilege;
    record["timeout"] = session.timeout;
    record["skipAddress"] = session.skipAddress;
    record["handle"] = session.handle;
    record["created"] = static_cast<Json::Int64>(session.created);
    if (session.node != 0) {
        record["node"] = static_cast<Json::Int64>(session.node);
    }
    Json::StreamWriterBuilder builder;
    builder["indentation"] = "";
    return Json::writeString(builder, record);
}

bool ParseSessionRecord(const std::string& text, talo::Session* session) {
    Json::Value record;
    JsonError error;
    if (!ParseJson(text.data(), text.data() + text.size(), kMaxDepth, &record, &error) ||
        !record.isObject()) {
        return false;
    }
    talo::Session read;
    read.user = Text(record, "user");
    read.address = Text(record, "address");
    read.language = Text(record, "language");
    read.application = Text(record, "application");
    read.privilege = Text(record, "privilege");
    read.handle = Text(record, "handle");
    const Json::Value& timeout = record["timeout"];
    read.timeout = timeout.isInt() && timeout.asInt() > 0 && timeout.asInt() <= kMaxTimeout
                       ? timeout.asInt()
                       : 0;
    read.skipAddress = record["skipAddress"].isBool() && record["skipAddress"].asBool();
    read.created = record["created"].isInt64() ? record["created"].asInt64() : 0;
    if (read.user.empty() || read.handle.empty() || !ReadNode(record, &read.node)) {
        return false;
    }
    *session = read;
    return true;
}

}  // namespace host
