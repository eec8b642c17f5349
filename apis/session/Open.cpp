#include <ctime>
#include <string>

#include "Session.h"
#include "apis/common/SafeHeader.h"
#include "apis/common/TextParameter.h"
#include "hosts/linux/sdk/Accounts.h"
#include "hosts/linux/sdk/Sessions.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"

using TALO::APIRequest;
using TALO::APIResponse;

namespace {

// How long a remembered session may go unused.
constexpr int kRememberedMinutes = 7 * 24 * 60;
constexpr int kRememberedSeconds = kRememberedMinutes * 60;

// The framework's own code for what is not permitted.
constexpr int kNotPermitted = 105;

void AnswerFailure(APIResponse* response, talo::LoginResult result, int waitSeconds) {
    Json::Value details;
    switch (result) {
        case talo::LoginResult::kWrong:
            response->SetError(kWrongLogin, details);
            return;
        case talo::LoginResult::kLocked:
            response->SetError(kAccountLocked, details);
            return;
        case talo::LoginResult::kExpired:
            response->SetError(kPasswordExpired, details);
            return;
        case talo::LoginResult::kWait:
            details["wait"] = waitSeconds;
            response->SetError(kWaitFirst, details);
            return;
        default:
            response->SetError(kNoAccounts, details);
    }
}

// A date for browsers that do not know Max-Age, on their own clock. A clock
// that no date can be told from gets none.
std::string Expires(const APIRequest& request) {
    constexpr long long kLatest = 253370764800;  // the year 9999, which has four digits
    const auto clientTime =
        request.GetAndCheckIntegral<long long>("client_time", APIRequest::OPTIONAL, nullptr);
    const bool told = clientTime.IsSet() && !clientTime.IsReset();
    const long long now = told ? clientTime.Get() : static_cast<long long>(time(nullptr));
    if (now < 0 || now > kLatest) {
        return std::string();
    }
    const time_t when = static_cast<time_t>(now) + kRememberedSeconds;
    struct tm parts = {};
    char text[64] = {};
    if (gmtime_r(&when, &parts) == nullptr ||
        strftime(text, sizeof text, "%a, %d %b %Y %H:%M:%S GMT", &parts) == 0) {
        return std::string();
    }
    return std::string("; Expires=") + text;
}

// The cookie that a browser keeps: not for scripts, not for other sites' pages.
std::string CookieLine(const APIRequest& request, const std::string& id, bool remember) {
    std::string line = "id=" + id + "; Path=/; HttpOnly; SameSite=Strict";
    if (remember) {
        line += "; Max-Age=" + std::to_string(kRememberedSeconds) + Expires(request);
    }
    return request.GetURLProto("") == "https" ? line + "; Secure" : line;
}

}  // namespace

void Open(APIRequest* request, APIResponse* response) {
    std::string name;
    std::string password;
    const auto remember = request->GetAndCheckBool("remember", APIRequest::OPTIONAL, nullptr);
    const auto clientTime =
        request->GetAndCheckIntegral<long long>("client_time", APIRequest::OPTIONAL, nullptr);
    const bool hasName = ReadTypedText(*request, "account", &name);
    if (!hasName || !ReadTypedText(*request, "passwd", &password)) {
        response->SetError(kBadParameter, hasName ? "passwd" : "account");
        return;
    }
    if (remember.IsInvalid() || clientTime.IsInvalid()) {
        response->SetError(kBadParameter, remember.IsInvalid() ? "remember" : "client_time");
        return;
    }
    // Another site's page must not log its visitor in under an account of its own.
    if (!talo::ComesFromOwnSite()) {
        response->SetError(kNotPermitted, Json::Value());
        return;
    }
    const std::string address = request->GetRemoteIP();
    int waitSeconds = 0;
    const talo::LoginResult result = talo::CheckLogin(name, password, address, &waitSeconds);
    talo::Account account;
    if (result != talo::LoginResult::kAccepted || !talo::FindAccount(name, &account)) {
        AnswerFailure(response, result, waitSeconds);
        return;
    }
    talo::Session session;
    session.user = account.name;
    session.address = address;
    session.timeout = remember.Get() ? kRememberedMinutes : 0;
    std::string id;
    if (!talo::CreateSession(session, &id) ||
        !SetSafeHeader(response, "Set-Cookie", CookieLine(*request, id, remember.Get()))) {
        response->SetError(kNoAccounts, Json::Value());
        return;
    }
    Json::Value data(Json::objectValue);
    data["sid"] = id;
    data["account"] = account.name;
    data["is_admin"] = talo::IsAdministrator(account);
    response->SetSuccess(data);
}
