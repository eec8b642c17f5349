#include <string>

#include "Session.h"
#include "apis/common/SafeHeader.h"
#include "hosts/linux/sdk/Sessions.h"
#include "webapi/APIAuth.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"

using TALO::APIRequest;
using TALO::APIResponse;

namespace {

Json::Value Describe(const talo::Session& session) {
    Json::Value facts(Json::objectValue);
    facts["handle"] = session.handle;
    facts["account"] = session.user;
    facts["address"] = session.address;
    facts["created"] = static_cast<Json::Int64>(session.created);
    facts["last_use"] = static_cast<Json::Int64>(session.lastUse);
    if (session.node != 0) {
        facts["node"] = static_cast<Json::Int64>(session.node);
    }
    return facts;
}

// Whether the caller may see and end the session.
bool IsTheirs(const APIRequest& request, const talo::Session& session) {
    return request.IsAdmin() || request.GetLoginUserName() == session.user;
}

}  // namespace

void Close(APIRequest* request, APIResponse* response) {
    (void)talo::EndSession(request->GetSessionID());
    (void)SetSafeHeader(response, "Set-Cookie",
                        "id=; Path=/; HttpOnly; SameSite=Strict; Max-Age=0");
    response->SetSuccess(Json::Value());
}

// The check has renewed it already.
void Renew(APIRequest*, APIResponse* response) {
    response->SetSuccess(Json::Value());
}

void Info(APIRequest* request, APIResponse* response) {
    talo::Session session;
    if (!talo::FindSession(request->GetSessionID(), &session)) {
        response->SetError(kNoSuchSession, Json::Value());
        return;
    }
    Json::Value data = Describe(session);
    data["is_admin"] = request->IsAdmin();
    data["timeout"] = request->GetTimeoutDuration();
    response->SetSuccess(data);
}

void List(APIRequest* request, APIResponse* response) {
    talo::Session own;
    (void)talo::FindSession(request->GetSessionID(), &own);
    Json::Value sessions(Json::arrayValue);
    for (const talo::Session& session : talo::ListSessions()) {
        if (IsTheirs(*request, session)) {
            Json::Value facts = Describe(session);
            facts["current"] = session.handle == own.handle;
            sessions.append(facts);
        }
    }
    Json::Value data(Json::objectValue);
    data["sessions"] = sessions;
    response->SetSuccess(data);
}

void End(APIRequest* request, APIResponse* response) {
    const auto handle = request->GetAndCheckString("handle", APIRequest::REQUIRED, nullptr);
    if (handle.IsInvalid()) {
        response->SetError(kBadParameter, "handle");
        return;
    }
    for (const talo::Session& session : talo::ListSessions()) {
        if (session.handle == handle.Get() && IsTheirs(*request, session) &&
            talo::EndSessionByHandle(session.handle)) {
            response->SetSuccess(Json::Value());
            return;
        }
    }
    response->SetError(kNoSuchSession, Json::Value());
}
