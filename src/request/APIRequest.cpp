#include "webapi/APIRequest.h"

#include <strings.h>

#include <string_view>

#include "platform/System.h"
#include "src/base/JsonConvert.h"
#include "src/request/APIRequestPrivate.h"

namespace TALO {

namespace {

typedef int (*PreferenceDirGet)(const char* name, char* buffer, size_t size);

std::string PreferenceDir(PreferenceDirGet get, const std::string& name) {
    char path[1024] = {};
    return get(name.c_str(), path, sizeof path) < 0 ? "/tmp" : path;
}

// Of a text, without a copy, and a zero byte follows; "" of anything else.
std::string_view TextIn(const Json::Value& value) {
    const char* begin = "";
    const char* end = begin;
    (void)value.getString(&begin, &end);
    return std::string_view(begin, static_cast<size_t>(end - begin));
}

}  // namespace

APIRequest::APIRequest(const Json::Value& document) : d(new APIRequestPrivate(this)) {
    if (!document.isObject() || document.empty()) {
        return;
    }
    try {
        if (document.isMember("environ")) {
            InitEnv(document["environ"]);
        }
        if (document.isMember("getParam") || document.isMember("postParam")) {
            InitParam(document, false);
        }
        if (document.isMember("reqLib")) {
            InitAPIInfo(document["reqLib"]);
        }
        if (document.isMember("session")) {
            InitSession(document["session"]);
        }
    } catch (...) {
        delete d;
        throw;
    }
}

APIRequest::~APIRequest() {
    delete d;
}

void APIRequest::InitEnv(const Json::Value& environ) {
    Json::Value copy(environ);
    TakeEnv(&copy);
}

void APIRequest::TakeEnv(Json::Value* environ) {
    if (!d->TakeData("environ", environ, true)) {
        return;
    }
    d->InitCookie();
    d->InitRequestMethod();
}

void APIRequest::InitParam(const Json::Value& document, bool clear) {
    // Copied before anything changes: the document may be a part of the parameters.
    Json::Value sources[] = {Member(document, "getParam"), Member(document, "postParam")};
    if (clear) {
        d->ClearData("param", "");
    }
    for (Json::Value& params : sources) {
        (void)d->DecryptParam(params);
        d->SetData("param", params, false);
        d->SetAPIDesc(params);
    }
}

void APIRequest::InitAPIInfo(const Json::Value& description) {
    d->ClearData("reqLib", "");
    d->SetData("reqLib", description, false);
}

void APIRequest::InitSession(const Json::Value& session) {
    d->ClearData("session", "");
    d->SetData("session", session, false);
}

Json::Value APIRequest::GetParam(const std::string& name, const Json::Value& fallback) const {
    return d->GetData("param", name, fallback);
}

const Json::Value& APIRequest::GetParamRef(const std::string& name,
                                           const Json::Value& fallback) const {
    return d->GetData("param", name, fallback);
}

bool APIRequest::HasParam(const std::string& name) const {
    return d->HasData("param", name);
}

Json::Value APIRequest::GetEnv(const std::string& name, const Json::Value& fallback) const {
    return d->GetData("environ", name, fallback);
}

bool APIRequest::HasEnv(const std::string& name) const {
    return d->HasData("environ", name);
}

Json::Value APIRequest::GetAPIInfo(const std::string& key, const Json::Value& fallback) const {
    return d->GetData("reqLib", key, fallback);
}

Json::Value APIRequest::GetAttr(const std::string& key, const Json::Value& fallback) const {
    return d->GetData("attr", key, fallback);
}

bool APIRequest::HasAttr(const std::string& key) const {
    return d->HasData("attr", key);
}

bool APIRequest::SetAttr(const std::string& key, const Json::Value& value) {
    return d->SetData("attr", key, value, false);
}

std::string APIRequest::GetCookie(const std::string& name, const std::string& fallback) const {
    const Json::Value value = d->GetData("cookie", name, Json::Value::nullSingleton());
    return value.isString() ? value.asString() : fallback;
}

bool APIRequest::HasCookie(const std::string& name) const {
    return d->HasData("cookie", name);
}

bool APIRequest::SetCookie(const std::string& name, const std::string& value) {
    return d->SetData("cookie", name, value, true);
}

std::string APIRequest::GetAPIClass() const {
    return d->api;
}

std::string APIRequest::GetAPIMethod() const {
    return d->method;
}

int APIRequest::GetAPIVersion() const {
    return d->version;
}

int APIRequest::GetRequestMethod() const {
    return d->requestMethod;
}

std::string APIRequest::GetSessionID() const {
    return GetCookie("id", "");
}

bool APIRequest::IsDemoMode() const {
    return false;
}

int APIRequest::GetTimeoutDuration() const {
    return ToInt(d->GetData("session", "timeout", 0), 0);
}

std::string APIRequest::GetApplication() const {
    return ToText(d->GetData("session", "app", ""));
}

std::string APIRequest::GetSessionFilePath() const {
    return ToText(d->GetData("session", "sessFile", ""));
}

std::string APIRequest::GetUILanguage() const {
    return ToText(d->GetData("session", "uiLang", "enu"));
}

// The whole value is compared: a list of applications that holds the name is
// not this application.
bool APIRequest::HasAppPriv(const std::string& name) const {
    return d->GetData("session", "appPriv", "") == Json::Value(name);
}

bool APIRequest::IsAuthorized() const {
    return ToBool(d->GetData("session", "isAuthorized", false));
}

bool APIRequest::IsTimeout() const {
    return ToBool(d->GetData("session", "isTimeout", true));
}

bool APIRequest::IsSkipCheckIP() const {
    return ToBool(d->GetData("session", "isSkipCheckIP", true));
}

bool APIRequest::IsAdmin() const {
    return ToBool(d->GetData("session", "isAdmin", ""));
}

std::string APIRequest::GetLoginUserName() const {
    return ToText(d->GetData("session", "username", ""));
}

std::string APIRequest::GetWebAPIPriv() const {
    return ToText(d->GetData("session", "webapi", ""));
}

std::string APIRequest::GetPreferenceDir() const {
    return PreferenceDir(TALOUserPreferenceDirGet, GetLoginUserName());
}

std::string APIRequest::GetGroupPreferenceDir(const std::string& group) const {
    return PreferenceDir(TALOGroupPreferenceDirGet, group);
}

bool APIRequest::IsSliceUploadRequest() const {
    const Json::Value& none = Json::Value::nullSingleton();
    const std::string_view type = TextIn(d->GetData("environ", "HTTP_X_TYPE_NAME", none));
    return strcasecmp(type.data(), "SLICEUPLOAD") == 0;
}

bool APIRequest::IsUploadRequest() const {
    const Json::Value& none = Json::Value::nullSingleton();
    const std::string_view type = TextIn(d->GetData("environ", "CONTENT_TYPE", none));
    return type.find("multipart/form-data") != std::string_view::npos || IsSliceUploadRequest();
}

bool APIRequest::IsPollingTask() const {
    return HasEnv("task_id") && HasEnv("task_user");
}

std::string APIRequest::GetPollingTaskId() const {
    return ToText(d->GetData("environ", "full_task_id", ""));
}

}  // namespace TALO
