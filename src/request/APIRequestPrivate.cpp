#include "src/request/APIRequestPrivate.h"

#include "platform/WebAPIUtil.h"
#include "src/base/JsonConvert.h"

namespace TALO {

namespace {

// Copying them all is cheaper than making each.
const Json::Value& EmptySections() {
    static const Json::Value sections = [] {
        Json::Value made(Json::objectValue);
        for (const char* section :
             {"environ", "cookie", "reqLib", "session", "param", "attr", "url", "userAgent"}) {
            made[section] = Json::Value(Json::objectValue);
        }
        return made;
    }();
    return sections;
}

}  // namespace

APIRequestPrivate::APIRequestPrivate(APIRequest* owner) : owner(owner) {
    store = EmptySections();
}

APIRequestPrivate::~APIRequestPrivate() = default;

void APIRequestPrivate::SetAPIDesc(const Json::Value& params) {
    if (const Json::Value* value = FindMember(&params, "api")) {
        api = RequireText(*value);
    }
    if (const Json::Value* value = FindMember(&params, "version")) {
        version = RequireInt(*value);
    }
    if (const Json::Value* value = FindMember(&params, "method")) {
        method = RequireText(*value);
    }
}

void APIRequestPrivate::InitRequestMethod() {
    const std::string name = ToText(GetData("environ", "REQUEST_METHOD", Json::Value()));
    if (name == "GET") {
        requestMethod = kMethodGet;
    } else if (name == "POST") {
        requestMethod = kMethodPost;
    } else if (name == "HEAD") {
        requestMethod = kMethodHead;
    }
}

void APIRequestPrivate::InitCookie() {
    const Json::Value header = GetData("environ", "HTTP_COOKIE", Json::Value());
    if (!header.isString()) {
        return;
    }
    for (const Json::Value& piece : WebAPIUtil::ParseToArray(header.asString(), ";")) {
        const std::string pair = ToText(piece);
        const size_t equals = pair.find('=');
        if (equals == std::string::npos) {
            continue;
        }
        store["cookie"][pair.substr(0, equals)] =
            WebAPIUtil::URLDecode(pair.substr(equals + 1), true);
    }
}

APIParameter<Json::Value> APIRequestPrivate::GetAndCheckUnitArrayParam(
    const std::string& name, bool required, APIParameter<Json::Value>::Validator validator) {
    APIParameter<Json::Value> parameter;
    if (HasData("param", name)) {
        Json::Value value = GetData("param", name, Json::Value::nullSingleton());
        if (!value.isArray()) {
            Json::Value wrapped(Json::arrayValue);
            wrapped.append(value);
            value = wrapped;
        }
        parameter.CheckValueTypeAndGet(value, Json::arrayValue, validator);
    } else if (required) {
        parameter.MarkInvalid();
    }
    return parameter;
}

}  // namespace TALO
