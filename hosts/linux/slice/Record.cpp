#include "hosts/linux/slice/Record.h"

#include <json/json.h>

#include <utility>

#include "hosts/linux/util/JsonGrammar.h"

namespace host {

namespace {

constexpr size_t kMaxDepth = 2;

bool ReadText(const Json::Value& record, const char* key, std::string* text) {
    const Json::Value& value = record[key];
    if (!value.isString()) {
        return false;
    }
    *text = value.asString();
    return true;
}

// A count that fits a file's size or a time. jsoncpp's isInt64 takes 1.0, too,
// which is harmless.
template <typename Number>
bool ReadCount(const Json::Value& record, const char* key, Number* number) {
    const Json::Value& value = record[key];
    if (!value.isInt64() || value.asInt64() < 0) {
        return false;
    }
    *number = static_cast<Number>(value.asInt64());
    return true;
}

}  // namespace

std::string FormatSliceRecord(const talo::SliceFile& file) {
    Json::Value record(Json::objectValue);
    record["owner"] = file.owner;
    record["length"] = static_cast<Json::UInt64>(file.length);
    record["digest"] = file.digest;
    record["target"] = file.target;
    record["created"] = static_cast<Json::Int64>(file.created);
    Json::StreamWriterBuilder builder;
    builder["indentation"] = "";
    return Json::writeString(builder, record);
}

bool ParseSliceRecord(const std::string& text, talo::SliceFile* file) {
    Json::Value record;
    JsonError error;
    if (!ParseJson(text.data(), text.data() + text.size(), kMaxDepth, &record, &error) ||
        !record.isObject()) {
        return false;
    }
    talo::SliceFile read;
    if (!ReadText(record, "owner", &read.owner) || !ReadText(record, "digest", &read.digest) ||
        !ReadText(record, "target", &read.target) || !ReadCount(record, "length", &read.length) ||
        !ReadCount(record, "created", &read.created)) {
        return false;
    }
    if (!read.digest.empty() && !talo::IsSliceDigest(read.digest)) {
        return false;
    }
    *file = std::move(read);
    return true;
}

}  // namespace host
