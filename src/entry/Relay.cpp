#include <cmath>
#include <cstdio>
#include <string>

#include "platform/Cgi.h"
#include "platform/CredRequest.h"
#include "src/base/ErrorCode.h"
#include "src/base/JsonConvert.h"
#include "src/base/Log.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"
#include "webapi/WebEntry.h"

namespace TALO {

namespace {

constexpr char kSource[] = "WebEntry.cpp";

constexpr char kTarget[] = "relay_nd";
constexpr char kTimeout[] = "relay_timeout";

// A whole number or its decimal text. A value that would have to be cut, or that
// only stands for a number, names no appliance; nor does a real number so large
// that it stands for its neighbours too.
bool ReadTarget(const Json::Value& value, long long* target) {
    constexpr double kLastExact = 9007199254740991.0;
    if (value.isString()) {
        return ParseInt64(value.asString(), target);
    }
    const bool real = value.type() == Json::realValue;
    if (!value.isInt64() || (real && std::fabs(value.asDouble()) > kLastExact)) {
        return false;
    }
    *target = value.asInt64();
    return true;
}

// What the target is told of a body that it gets as it came.
Json::Value BodyHeaders(const APIRequest& request) {
    Json::Value headers(Json::objectValue);
    headers["Content-Type"] = request.GetEnv("CONTENT_TYPE", Json::Value());
    headers["Content-Length"] = request.GetEnv("CONTENT_LENGTH", Json::Value());
    return headers;
}

struct Relay {
    long long target = 0;
    int timeout = -1;    // seconds
    Json::Value params;  // without the two above
};

// False when the request names no appliance.
bool ReadRelay(const APIRequest& request, Relay* relay) {
    relay->params = request.GetParam("", Json::Value());
    relay->timeout = ToInt(Member(relay->params, kTimeout), -1);
    const bool named = ReadTarget(Member(relay->params, kTarget), &relay->target);
    relay->params.removeMember(kTarget);
    relay->params.removeMember(kTimeout);
    return named;
}

// An upload's parameters are in its body. The index of the queued call, or negative.
int Queue(const APIRequest& request, const Relay& relay, CredRequestMgr* manager) {
    const std::string api = request.GetAPIClass();
    const int version = request.GetAPIVersion();
    const std::string method = request.GetAPIMethod();
    if (request.IsUploadRequest()) {
        return manager->AddRelayRequest(relay.target, api, version, method, BodyHeaders(request),
                                        stdin, nullptr);
    }
    return manager->AddWebAPIRequest(relay.target, api, version, method, relay.params);
}

bool Forward(const APIRequest& request, const Relay& relay, std::string* answer) {
    CredRequestMgr manager;
    const int index = Queue(request, relay, &manager);
    if (index < 0) {
        return false;
    }
    CredRequest* call = relay.timeout > 0 ? manager.GetRequest(index) : nullptr;
    if (call != nullptr) {
        call->SetResponseTimeout(relay.timeout);
    }
    if (!manager.Run()) {
        LOG_ERROR("relay request fail[%d]", manager.GetError());
        return false;
    }
    *answer = manager.GetResponse(index);
    return true;
}

bool Fail(APIResponse* response, int code) {
    response->SetError(code, Json::Value());
    return false;
}

}  // namespace

// Who may call the method is for the target to say: here the session alone counts,
// also for an API that asks for no login.
bool WebEntry::ProcessRelay(APIRequest* request, APIResponse* response) {
    if (!CheckRequestParam(request, response) || !AddAPIInfo(request)) {
        return false;
    }
    const bool allowTimeout = ToBool(request->GetAPIInfo("skipTimeout", false));
    const int code = CheckPermission(allowTimeout);
    if (code != kErrorNone) {
        return Fail(response, code);
    }
    RenewSession(request, allowTimeout);
    Relay relay;
    if (!ReadRelay(*request, &relay)) {
        return Fail(response, kErrorBadRequest);
    }
    // The context holds form fields once the body had to be looked into.
    if (request->IsUploadRequest() && cgiContext->paramHash != nullptr) {
        LOG_ERROR("relay of an upload whose body was begun here: its query must name the API");
        return Fail(response, kErrorRelay);
    }
    // The whole answer is here before the first byte leaves: until then there can
    // still be an error to reply.
    std::string answer;
    if (!Forward(*request, relay, &answer)) {
        return Fail(response, kErrorRelay);
    }
    response->SetEnableOutput(false);
    OutputHeader();
    (void)std::fwrite(answer.data(), 1, answer.size(), stdout);
    (void)std::fflush(stdout);
    return true;
}

}  // namespace TALO
