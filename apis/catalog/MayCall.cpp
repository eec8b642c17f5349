#include "Catalog.h"
#include "webapi/APIAuth.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"

using TALO::APIRequest;
using TALO::APIResponse;

namespace {

// Whether anybody may try: a level of 0 asks for no login, 2 for none in the end.
bool IsOpenToAll(const Json::Value& level) {
    const std::string text = level.isInt() || level.isString() ? level.asString() : std::string();
    return text == "0" || text == "2";
}

// Of a description all but what only a call or a reader needs: it is most of it.
Json::Value Facts(const Json::Value& description) {
    Json::Value facts(Json::objectValue);
    for (auto member = description.begin(); member != description.end(); ++member) {
        const std::string name = member.name();
        if (name != "methods" && name != "doc") {
            facts[name] = *member;
        }
    }
    return facts;
}

}  // namespace

// The same check that a call would meet, on a request that is never run.
bool MayCall(const APIRequest& request, const Json::Value& description) {
    if (IsOpenToAll(description["authLevel"])) {
        return true;
    }
    Json::Value document(Json::objectValue);
    document["reqLib"] = Facts(description);
    document["session"]["username"] = request.GetLoginUserName();
    document["session"]["isAdmin"] = request.IsAdmin();
    APIRequest probe(document);
    APIResponse verdict(&probe);
    return TALO::APIAuth::CheckPermission(&probe, &verdict, request.GetSessionID().c_str(), false);
}
