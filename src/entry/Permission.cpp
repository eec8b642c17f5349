#include <cstdlib>
#include <string>

#include "platform/Cgi.h"
#include "platform/System.h"
#include "src/base/ErrorCode.h"
#include "src/base/JsonConvert.h"
#include "src/base/UserClass.h"
#include "src/entry/PermissionRules.h"
#include "webapi/APIAuth.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"
#include "webapi/WebEntry.h"

namespace TALO {

namespace {

enum AuthLevel { kNoLogin = 0, kLogin = 1, kLoginOptional = 2 };

// Options of a session.
enum SessionOption {
    kOptionSkipIPCheck = 1,
    kOptionWebAPI = 6,
    kOptionApplication = 7,
    kOptionTimeout = 10,
};

// Only a plain integer lowers the demand for a login. Everything else, from a
// missing key to a boolean, asks for one.
int AuthLevelOf(const APIRequest& request) {
    const Json::Value level = request.GetAPIInfo("authLevel", kLogin);
    return level.isInt() || level.isString() ? ToInt(level, kLogin) : kLogin;
}

std::string OptionText(TALOCGI* context, SessionOption option) {
    const char* text = TaloCgiGetOption(context, option, "");
    return text != nullptr ? text : "";
}

int TimeoutOf(TALOCGI* context) {
    const char* text = TaloCgiGetOption(context, kOptionTimeout, "0");
    const long minutes = std::strtol(text != nullptr ? text : "0", nullptr, 10);
    return minutes != 0 ? static_cast<int>(minutes) : context->defaultTimeout;
}

bool IsExemptFromAddressCheck(TALOCGI* context) {
    const char* option = TaloCgiGetOption(context, kOptionSkipIPCheck, nullptr);
    return option != nullptr ? std::string(option) == "1" : context->skipIPCheck == 1;
}

Json::Value SessionFacts(TALOCGI* context, const char* user) {
    const char* language = TaloCgiGetLang(context);
    Json::Value facts(Json::objectValue);
    facts["username"] = user;
    facts["isAdmin"] = TLIBGroupIsAdminGroupMem(user, 0) == 1;
    facts["sessFile"] = context->sessionFile;
    facts["isTimeout"] = false;
    facts["timeout"] = TimeoutOf(context);
    facts["isSkipCheckIP"] = IsExemptFromAddressCheck(context);
    facts["uiLang"] = language != nullptr ? language : "";
    facts["app"] = OptionText(context, kOptionApplication);
    facts["webapi"] = OptionText(context, kOptionWebAPI);
    facts["isAuthorized"] = true;
    return facts;
}

int CodeOf(int result) {
    switch (result) {
        case kSessionUser:
        case kSessionAdministrator:
            return kErrorNone;
        case kSessionTimedOut:
            return kErrorSessionTimeout;
        case kSessionNotGiven:
            return kErrorNoSession;
        default:
            return kErrorPermission;
    }
}

const char* ServerErrorText(int code) {
    switch (code) {
        case kErrorPermission:
            return "noprivilege";
        case kErrorSessionTimeout:
            return "timeout";
        case kErrorNoSession:
            return "unauth";
        default:
            return nullptr;
    }
}

// The facts of the session, as a request that is served under it gets them.
Json::Value FactsFor(const APIRequest& caller, const std::string& appPriv) {
    Json::Value facts(Json::objectValue);
    facts["appPriv"] = appPriv;
    facts["username"] = caller.GetLoginUserName();
    facts["isAdmin"] = caller.IsAdmin();
    facts["sessFile"] = caller.GetSessionFilePath();
    facts["isTimeout"] = caller.IsTimeout();
    facts["timeout"] = caller.GetTimeoutDuration();
    facts["isSkipCheckIP"] = caller.IsSkipCheckIP();
    facts["uiLang"] = caller.GetUILanguage();
    facts["app"] = caller.GetApplication();
    facts["webapi"] = caller.GetWebAPIPriv();
    facts["isAuthorized"] = caller.IsAuthorized();
    return facts;
}

}  // namespace

// A privilege that is no text is a broken description: nobody holds it.
bool HoldsAppPrivilege(APIRequest* request, const char* userName) {
    const Json::Value wanted = request->GetAPIInfo("appPriv", "");
    if (wanted.isArray() || wanted.isObject()) {
        return false;
    }
    const std::string privilege = ToText(wanted);
    return privilege.empty() ||
           TLIBAppPrivUserHas(userName, privilege.c_str(), request->GetRemoteIP().c_str()) != 0;
}

bool WebEntry::NeedPermission(APIRequest* request) {
    return request == nullptr || AuthLevelOf(*request) != kNoLogin;
}

bool WebEntry::SkipPermission(APIRequest* request) {
    return request != nullptr && AuthLevelOf(*request) == kLoginOptional;
}

// One platform call per variant and request, also for the elements of a
// compound request: the session is the entry's, whoever asks.
int WebEntry::CheckPermission(bool allowTimeout) {
    const Json::ArrayIndex variant = allowTimeout ? 0 : 1;
    const Json::Value& cached = permissionCache["permResult"][variant];
    if (cached.isInt()) {
        return CodeOf(cached.asInt());
    }
    const std::string sessionId = request->GetSessionID();
    int result = kSessionNotGiven;
    if (!sessionId.empty()) {
        char user[kLoginNameSize] = {};
        const TALOCGIAUTHREQUEST checks = {kCheckAll, allowTimeout ? 1 : 0};
        result =
            TaloCgiIsAuthorizedEx(cgiContext, sessionId.c_str(), user, sizeof user, &checks, 0);
        if (result >= 0) {
            (void)setenv("TALO_WEBAPI_USERNAME", user, 1);
            request->InitSession(SessionFacts(cgiContext, user));
        }
    }
    if (permissionCache["permResult"][variant].isNull()) {
        permissionCache["permResult"][variant] = result;
    }
    return CodeOf(result);
}

bool WebEntry::CheckPermission(APIRequest* request, APIResponse* response) {
    // One request serves all elements of a compound: one that is refused here and
    // runs all the same must not see the login that the one before it was given.
    if (request != this->request) {
        request->InitSession(Json::Value(Json::objectValue));
    }
    const bool allowTimeout = GetMethodAttr(request, "allowTimeout");
    const int code = CheckPermission(allowTimeout);
    response->SetError(code, Json::Value());
    if (code != kErrorNone) {
        if (const char* text = ServerErrorText(code)) {
            response->SetServerError(text);
        }
        return false;
    }
    const std::string user = this->request->GetLoginUserName();
    if (!CheckAllowUser(request, user.c_str()) || !HoldsAppPrivilege(request, user.c_str())) {
        response->SetError(kErrorPermission, Json::Value());
        return false;
    }
    // The renewal may ask for the session again and then writes its facts anew:
    // it comes before those of this call.
    RenewSession(request, allowTimeout);
    request->InitSession(FactsFor(*this->request, ToText(request->GetAPIInfo("appPriv", ""))));
    return true;
}

bool WebEntry::CheckAllowUser(APIRequest* request, const char* userName) {
    return ListAdmits(request->GetAPIInfo("allowUser", Json::Value()), userName,
                      this->request->IsAdmin());
}

// A request that runs by itself in the background must not keep a forgotten
// session alive, and one that is let pass in spite of a time-out not revive it.
// Once per entry is enough.
void WebEntry::RenewSession(APIRequest* request, bool allowTimeout) {
    if (permissionCache.isMember("renewed") || GetMethodAttr(request, "passive") ||
        (allowTimeout && CheckPermission(false) != kErrorNone)) {
        return;
    }
    permissionCache["renewed"] = APIAuth::UpdateTimeout(this->request);
}

}  // namespace TALO
