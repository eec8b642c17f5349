#include <syslog.h>

#include <string>

#include "Relay.h"
#include "hosts/linux/sdk/Accounts.h"
#include "hosts/linux/sdk/Nodes.h"
#include "hosts/linux/sdk/Sessions.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"

using TALO::APIRequest;
using TALO::APIResponse;

namespace {

struct Call {
    long long node = 0;
    std::string secret;
    std::string user;
    std::string language;
};

// A page never has the secret of an appliance, whatever site it is from.
bool IsFromBrowser(const APIRequest& request) {
    for (const char* header : {"HTTP_ORIGIN", "HTTP_SEC_FETCH_SITE", "HTTP_SEC_FETCH_MODE",
                               "HTTP_SEC_FETCH_DEST", "HTTP_SEC_FETCH_USER"}) {
        if (request.GetEnv(header, Json::Value()) != Json::Value()) {
            return true;
        }
    }
    return false;
}

bool IsLanguage(const std::string& text) {
    constexpr size_t kMostBytes = 16;
    constexpr char kSigns[] = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789-_";
    return text.size() <= kMostBytes && text.find_first_not_of(kSigns) == std::string::npos;
}

bool ReadCall(const APIRequest& request, Call* call) {
    const auto node = request.GetAndCheckIntegral<long long>("node", APIRequest::REQUIRED, nullptr);
    const auto secret = request.GetAndCheckString("secret", APIRequest::REQUIRED, nullptr);
    const auto user = request.GetAndCheckString("user", APIRequest::REQUIRED, nullptr);
    const auto language = request.GetAndCheckString("lang", APIRequest::OPTIONAL, nullptr);
    if (node.IsInvalid() || secret.IsInvalid() || user.IsInvalid() || language.IsInvalid() ||
        node.IsReset() || secret.IsReset() || user.IsReset()) {
        return false;
    }
    *call = {node.Get(), secret.Get(), user.Get(), language.Get()};
    return IsLanguage(call->language);
}

// Null when the appliance may begin the session. What is said about the account is
// said only to the log, and only once the appliance has proved who it is.
const char* Objection(const APIRequest& request, Call* call, talo::Account* account) {
    if (IsFromBrowser(request)) {
        return "the call is a browser's";
    }
    if (!ReadCall(request, call)) {
        return "a parameter is missing or not valid";
    }
    if (!talo::ProvesNode(call->node, call->secret)) {
        return "it did not prove to be an appliance that may call";
    }
    if (!talo::FindAccount(call->user, account)) {
        return "there is no such account";
    }
    return talo::MayActFor(call->node, *account) ? nullptr : "it may not act for that account";
}

bool Begin(const Call& call, const talo::Account& account, const std::string& address,
           std::string* id) {
    talo::Session session;
    session.user = account.name;
    session.address = address;
    session.language = call.language;
    session.application = "relay";
    session.node = call.node;
    return talo::CreateSession(session, id);
}

}  // namespace

// An account's name is logged only when there is one: no other text of the caller's
// gets into the log.
void Open(APIRequest* request, APIResponse* response) {
    Call call;
    talo::Account account;
    std::string id;
    const std::string address = request->GetRemoteIP();
    const char* objection = Objection(*request, &call, &account);
    if (objection == nullptr && !Begin(call, account, address, &id)) {
        objection = "the session cannot be begun";
    }
    const char* const user = account.name.empty() ? "?" : account.name.c_str();
    if (objection != nullptr) {
        syslog(LOG_WARNING, "TALO.Relay: refused appliance %lld at %s for %s: %s", call.node,
               address.c_str(), user, objection);
        response->SetError(kRefused, Json::Value());
        return;
    }
    syslog(LOG_NOTICE, "TALO.Relay: appliance %lld at %s acts for %s", call.node, address.c_str(),
           user);
    Json::Value data(Json::objectValue);
    data["sid"] = id;
    response->SetSuccess(data);
}
