#include <string>

#include "Task.h"
#include "apis/common/TextParameter.h"
#include "webapi/APIPolling.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"

using TALO::APIPolling;
using TALO::APIRequest;
using TALO::APIResponse;

namespace {

// There are three groups; asking for one twice brings nothing new.
constexpr Json::ArrayIndex kMostGroups = 3;

// "groups" as an array of texts, the caller's own unless given.
bool ReadGroups(const APIRequest& request, Json::Value* groups) {
    const Json::Value given = request.GetParam("groups", Json::Value());
    if (given.isNull()) {
        groups->append("user");
        return true;
    }
    if (!given.isArray() || given.size() > kMostGroups) {
        return false;
    }
    for (const Json::Value& group : given) {
        if (!group.isString()) {
            return false;
        }
    }
    *groups = given;
    return true;
}

}  // namespace

void List(APIRequest* request, APIResponse* response) {
    std::string prefix;
    Json::Value groups(Json::arrayValue);
    const bool hasPrefix = !request->GetParam("prefix", Json::Value()).isNull();
    // A prefix such as 2024 arrives as a number.
    if (hasPrefix && !ReadTypedText(*request, "prefix", &prefix)) {
        response->SetError(kBadParameter, "prefix");
        return;
    }
    if (!ReadGroups(*request, &groups)) {
        response->SetError(kBadParameter, "groups");
        return;
    }
    APIPolling polling(request);
    Json::Value tasks(Json::objectValue);
    if (!polling.List(prefix, groups, tasks)) {
        response->SetError(polling.GetError(), Json::Value());
        return;
    }
    for (Json::Value& ids : tasks) {
        if (ids.isNull()) {
            ids = Json::Value(Json::arrayValue);
        }
    }
    response->TakeSuccess(&tasks);
}
