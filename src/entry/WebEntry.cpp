#include "webapi/WebEntry.h"

#include <unistd.h>

#include <cstdlib>
#include <string>

#include "platform/Cgi.h"
#include "platform/System.h"
#include "src/base/ErrorCode.h"
#include "src/base/Guarded.h"
#include "src/entry/Environment.h"
#include "src/entry/RestartHttpd.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"

namespace TALO {

namespace {

constexpr char kSource[] = "WebEntry.cpp";

// The cookie header with the session id behind everything it had. The first
// "id=" of it, wherever it stands, is put out of the way under another name.
std::string CookieWithSession(const std::string& header, const std::string& sessionId) {
    std::string cookie;
    if (!header.empty()) {
        cookie = header + "; ";
        const size_t id = cookie.find("id=");
        if (id != std::string::npos) {
            cookie.replace(id, 2, "abandoned");
        }
    }
    return cookie + "id=" + sessionId;
}

// The reply must be complete at the client before a callback may, for one,
// restart the web server under it.
[[noreturn]] void RunCallbacks(const APIResponse::CallbackList& callbacks) {
    (void)setsid();
    (void)sleep(1);
    for (const auto& callback : callbacks) {
        if (callback.first != nullptr) {
            (void)Guarded(kSource, __LINE__, [&] { callback.first(callback.second); });
        }
    }
    exit(0);
}

}  // namespace

WebEntry::WebEntry()
    : uploadFiles(Json::arrayValue), cgiContext(new TALOCGI()), permissionCache(Json::objectValue) {
    (void)TaloCgiInit("", cgiContext);
    (void)TaloCgiLoadInCookies(cgiContext);
    permissionCache["permResult"] = Json::Value(Json::arrayValue);
}

// The cookie header goes back first: the next entry of this process is another
// client's, and must not find this one's session.
WebEntry::~WebEntry() {
    (void)Guarded(kSource, __LINE__, [this] { EndEnvironment(permissionCache["environment"]); });
    TaloCgiFree(cgiContext);
    delete cgiContext;
    for (const Json::Value& path : uploadFiles) {
        if (path.isString()) {
            (void)TLIBCSysUnlink(path.asCString());
        }
    }
}

int WebEntry::Run(const Json::Value&) {
    const auto dispatch = [this] {
        if (!Initialize(Json::Value()) || !SetProcessName(request, response)) {
            return;
        }
        if (request->HasParam("relay_nd")) {
            (void)ProcessRelay(request, response);
        } else {
            (void)Process(request, response);
        }
    };
    if (!Guarded(kSource, __LINE__, dispatch)) {
        response->SetError(kErrorBadRequest, Json::Value());
    }
    int result = 0;
    const auto finish = [this, &result] {
        if (response->IsEnableOutput()) {
            OutputHeader();
            OutputBody();
        }
        if (response->GetHttpdRestart()) {
            response->SetCallbackFunc(RestartHttpd, nullptr);
        }
        result = HandleCallback(response);
    };
    (void)Guarded(kSource, __LINE__, finish);
    return result;
}

int WebEntry::Initialize(const Json::Value&) {
    Json::Value document(Json::objectValue);
    if (!APIRunner::InitEnv(document)) {
        response->SetError(kErrorBadRequest, Json::Value());
        return 0;
    }
    request->TakeEnv(&document);
    document.clear();
    if (!InitParam(document)) {
        return 0;
    }
    request->InitParam(document, false);
    AdoptSessionParameter();
    return 1;
}

// A client that keeps no cookies names its session in the parameter "_sid".
void WebEntry::AdoptSessionParameter() {
    const auto sessionId = request->GetAndCheckString("_sid", APIRequest::REQUIRED, nullptr);
    if (sessionId.IsInvalid()) {
        return;
    }
    const char* header = getenv("HTTP_COOKIE");
    const std::string cookie = CookieWithSession(header != nullptr ? header : "", sessionId.Get());
    SetForRequest(&permissionCache["environment"], "HTTP_COOKIE", cookie);
    (void)TaloCgiLoadInCookies(cgiContext);
    Json::Value document(Json::objectValue);
    document["HTTP_COOKIE"] = cookie;
    request->InitEnv(document);
}

int WebEntry::HandleCallback(APIResponse* response) {
    if (response == nullptr || response->GetCallbackFuncs() == nullptr ||
        response->GetCallbackFuncs()->empty()) {
        return 0;
    }
    const int child = TLIBCProcFork();
    if (child == 0) {
        RunCallbacks(*response->GetCallbackFuncs());
    }
    return child;
}

}  // namespace TALO
