#include "Task.h"
#include "webapi/APIPolling.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"

using TALO::APIPolling;
using TALO::APIRequest;
using TALO::APIResponse;

void Stop(APIRequest* request, APIResponse* response) {
    const auto id = request->GetAndCheckString("task_id", APIRequest::REQUIRED, nullptr);
    const auto remove = request->GetAndCheckBool("remove", APIRequest::OPTIONAL, nullptr);
    if (id.IsInvalid() || remove.IsInvalid()) {
        response->SetError(kBadParameter, id.IsInvalid() ? "task_id" : "remove");
        return;
    }
    APIPolling polling(request);
    if (polling.Stop(id.Get(), remove.Get(false))) {
        response->SetSuccess(Json::Value());
    } else {
        response->SetError(polling.GetError(), Json::Value());
    }
}
