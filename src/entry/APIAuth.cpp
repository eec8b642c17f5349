#include "webapi/APIAuth.h"

#include <stdlib.h>

#include <memory>
#include <string>

#include "platform/Cgi.h"
#include "platform/System.h"
#include "src/base/ErrorCode.h"
#include "src/base/UserClass.h"
#include "src/entry/PermissionRules.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"

namespace TALO {

namespace {

// A context of our own, zeroed first and released at the end.
class Context {
  public:
    Context() : cgi_() {}
    ~Context() {
        TaloCgiFree(&cgi_);
    }
    Context(const Context&) = delete;
    Context& operator=(const Context&) = delete;
    TALOCGI* Get() {
        return &cgi_;
    }

  private:
    TALOCGI cgi_;
};

int CodeOf(int result) {
    switch (result) {
        case kSessionUser:
        case kSessionAdministrator:
            return kErrorNone;
        case kSessionTimedOut:
            return kErrorSessionTimeout;
        case kSessionClientChanged:
            return kErrorSessionRefused;
        default:
            return kErrorPermission;
    }
}

int SessionCode(const char* sessionId, bool allowTimeout) {
    Context context;
    (void)TaloCgiInitEx(context.Get(), TLIBCConfGetORBTimeout(), allowTimeout ? 1 : 0,
                        "current.users", "");
    char user[kLoginNameSize] = {};
    const TALOCGIAUTHREQUEST checks = {kCheckAll, 0};
    return CodeOf(TaloCgiIsAuthorizedEx(context.Get(), sessionId, user, sizeof user, &checks, 0));
}

bool Refuse(APIResponse* response, int code) {
    response->SetError(code, Json::Value());
    return false;
}

}  // namespace

bool APIAuth::CheckPermission(APIRequest* request, APIResponse* response, const char* sessionId,
                              bool allowTimeout) {
    if (sessionId == nullptr) {
        return Refuse(response, kErrorPermission);
    }
    const int code = SessionCode(sessionId, allowTimeout);
    response->SetError(code, Json::Value());
    if (code != kErrorNone) {
        return false;
    }
    const std::string user = request->GetLoginUserName();
    if (!CheckAllowUser(request, user.c_str()) || !HoldsAppPrivilege(request, user.c_str())) {
        return Refuse(response, kErrorPermission);
    }
    return true;
}

bool APIAuth::CheckAllowUser(APIRequest* request, const char* userName) {
    return ListAdmits(request->GetAPIInfo("allowUser", Json::Value()), userName,
                      request->IsAdmin());
}

// The id comes from the client: only one that names a file right in the session
// folder, through no link and no parent folder, is touched.
bool APIAuth::UpdateTimeout(APIRequest* request) {
    if (request == nullptr) {
        return false;
    }
    Context context;
    if (TaloCgiInit("", context.Get()) != 0) {
        return false;
    }
    const std::string path = std::string(context.Get()->sessionDir) + "/" + request->GetSessionID();
    const std::unique_ptr<char, void (*)(void*)> resolved(realpath(path.c_str(), nullptr), free);
    return resolved != nullptr && path == resolved.get() &&
           TLIBCFileUTime(resolved.get(), 1, 0) >= 0;
}

}  // namespace TALO
