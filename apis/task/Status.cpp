#include "Task.h"
#include "webapi/APIPolling.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"

using TALO::APIPolling;
using TALO::APIRequest;
using TALO::APIResponse;

namespace {

// Each id costs a look into the records.
constexpr Json::ArrayIndex kMostIds = 1000;

// The ids if they are a proper list.
bool AreIds(const Json::Value& ids) {
    if (!ids.isArray() || ids.size() > kMostIds) {
        return false;
    }
    for (const Json::Value& id : ids) {
        if (!id.isString()) {
            return false;
        }
    }
    return true;
}

}  // namespace

void Status(APIRequest* request, APIResponse* response) {
    const Json::Value ids = request->GetParam("task_id", Json::Value());
    if (!ids.isString() && !AreIds(ids)) {
        response->SetError(kBadParameter, "task_id");
        return;
    }
    APIPolling polling(request);
    Json::Value status;
    if (ids.isString() ? polling.Status(ids.asString(), status) : polling.Status(ids, status)) {
        response->SetSuccess(status);
    } else {
        response->SetError(polling.GetError(), Json::Value());
    }
}
