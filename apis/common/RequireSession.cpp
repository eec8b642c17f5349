#include "apis/common/RequireSession.h"

#include <string>

#include "hosts/linux/sdk/Accounts.h"
#include "hosts/linux/sdk/Sessions.h"
#include "webapi/APIAuth.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"

using TALO::APIRequest;
using TALO::APIResponse;

namespace {

// The framework's own codes and texts for a session that does not do.
constexpr int kTimedOut = 106;
constexpr int kNoSessionId = 119;
const char kTimedOutText[] = "timeout";
const char kRefusedText[] = "noprivilege";
const char kNoSessionText[] = "unauth";

void GiveSessionFacts(APIRequest* request, const std::string& id, talo::Session* session) {
    talo::Account account;
    Json::Value facts(Json::objectValue);
    if (talo::FindSession(id, session) && talo::FindAccount(session->user, &account)) {
        facts["username"] = session->user;
        facts["isAdmin"] = talo::IsAdministrator(account);
        facts["timeout"] = session->timeout > 0 ? session->timeout : talo::DefaultTimeout();
        facts["isTimeout"] = false;
        facts["isAuthorized"] = true;
    }
    request->InitSession(facts);
}

}  // namespace

bool RequireSession(APIRequest* request, APIResponse* response, SessionUse use) {
    const std::string id = request->GetSessionID();
    if (id.empty()) {
        response->SetError(kNoSessionId, Json::Value());
        response->SetServerError(kNoSessionText);
        return false;
    }
    talo::Session session;
    GiveSessionFacts(request, id, &session);
    if (!TALO::APIAuth::CheckPermission(request, response, id.c_str(),
                                        use == SessionUse::kEvenTimedOut)) {
        request->InitSession(Json::Value());
        response->SetServerError(response->GetError() == kTimedOut ? kTimedOutText : kRefusedText);
        return false;
    }
    if (use == SessionUse::kRenew) {
        (void)talo::RenewSession(id, &session);
    }
    return true;
}
