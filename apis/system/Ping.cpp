#include "System.h"

#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"

using TALO::APIRequest;

void Ping(APIRequest* request, TALO::APIResponse* response) {
    const auto text = request->GetAndCheckString("text", APIRequest::OPTIONAL, nullptr);
    const auto count = request->GetAndCheckInt("count", APIRequest::OPTIONAL, nullptr);
    if (text.IsInvalid() || count.IsInvalid()) {
        response->SetError(kBadParameter, text.IsInvalid() ? "text" : "count");
        return;
    }
    Json::Value data(Json::objectValue);
    if (text.IsSet()) {
        data["text"] = text.Get();
    }
    if (count.IsSet()) {
        data["count"] = count.Get();
    }
    response->TakeSuccess(&data);
}
