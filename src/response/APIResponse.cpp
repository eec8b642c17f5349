#include "webapi/APIResponse.h"

#include <sstream>

#include "src/base/ErrorCode.h"
#include "src/base/JsonConvert.h"
#include "src/response/APIResponsePrivate.h"

namespace TALO {

namespace {

const char kServerErrorHeader[] = "x-request-error";
const char kStatusHeader[] = "Status";

// The output switch. The name is misleading and stays: readers of the store
// know it by that name.
const char kOutputOption[] = "isDownload";

}  // namespace

APIResponse::APIResponse(APIRequest* request) : d(new APIResponsePrivate(request, this)) {
    SetHeader("Content-type", "text/html; charset=\"UTF-8\"");
}

APIResponse::~APIResponse() {
    delete d;
}

void APIResponse::SetError(int code, const Json::Value& details) {
    d->SetError(code, details);
}

void APIResponse::SetSuccess(const Json::Value& data) {
    d->SetError(kErrorNone, data);
}

void APIResponse::TakeSuccess(Json::Value* data) {
    d->TakeResult(kErrorNone, data);
}

int APIResponse::GetError() const {
    return d->error;
}

bool APIResponse::SetHeader(const std::string& name, const std::string& value) {
    return d->SetData("headers", name, value, true);
}

std::string APIResponse::GetHeader(const std::string& name, const std::string& fallback) const {
    const Json::Value value = d->GetData("headers", name, Json::Value::nullSingleton());
    return value.isString() ? value.asString() : fallback;
}

bool APIResponse::HasHeader(const std::string& name) const {
    return d->HasData("headers", name);
}

Json::Value APIResponse::GetHeaders() const {
    return d->GetData("headers", "", Json::Value(Json::objectValue));
}

// An empty key would empty the whole section.
bool APIResponse::RemoveHeader(const std::string& name) {
    return !name.empty() && d->ClearData("headers", name);
}

void APIResponse::SetServerError(const std::string& text) {
    d->SetData("headers", kServerErrorHeader, text, true);
}

bool APIResponse::HasServerError() const {
    return HasHeader(kServerErrorHeader);
}

std::string APIResponse::GetServerError() const {
    return GetHeader(kServerErrorHeader, "");
}

bool APIResponse::SetStatus(_tag_HTTP_STATUS_CODE code, const std::string& message) {
    std::ostringstream text;
    text << static_cast<int>(code);
    return SetHeader(kStatusHeader, text.str()) && d->SetData("option", "statusMsg", message, true);
}

int APIResponse::GetStatus() const {
    std::istringstream text(GetHeader(kStatusHeader, "200"));
    int status = 0;
    text >> status;
    return status;
}

void APIResponse::SetEnableOutput(bool enable) {
    d->SetData("option", kOutputOption, enable, false);
}

bool APIResponse::IsEnableOutput() const {
    return ToBool(d->GetData("option", kOutputOption, true));
}

void APIResponse::SetHttpdRestart(bool restart) {
    d->SetData("option", "restart_httpd", restart, false);
}

bool APIResponse::GetHttpdRestart() const {
    return ToBool(d->GetData("option", "restart_httpd", false));
}

Json::Value APIResponse::GetBody() const {
    return GetBodyRef();
}

const Json::Value& APIResponse::GetBodyRef() const {
    static const Json::Value nothing(Json::objectValue);
    return d->GetData("body", "", nothing);
}

Json::Value APIResponse::GetCookies() const {
    return d->GetData("setCookie", "", Json::Value(Json::arrayValue));
}

void APIResponse::SetCallbackFunc(CallbackFunc function, void* argument) {
    d->SetCallbackFunc(function, argument);
}

void APIResponse::SetCallbackFuncs(void* list) {
    if (list == nullptr) {
        return;
    }
    const CallbackList callbacks = *static_cast<CallbackList*>(list);
    for (const auto& callback : callbacks) {
        d->SetCallbackFunc(callback.first, callback.second);
    }
}

APIResponse::CallbackList* APIResponse::GetCallbackFuncs() const {
    return &d->callbacks;
}

}  // namespace TALO
