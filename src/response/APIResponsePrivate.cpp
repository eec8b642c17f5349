#include "src/response/APIResponsePrivate.h"

#include <algorithm>

namespace TALO {

APIResponsePrivate::APIResponsePrivate(APIRequest* request, APIResponse* owner)
    : request(request), owner(owner) {
    store["headers"] = Json::Value(Json::objectValue);
    store["setCookie"] = Json::Value(Json::arrayValue);
    store["success"] = Json::Value(Json::objectValue);
    store["option"] = Json::Value(Json::objectValue);
}

APIResponsePrivate::~APIResponsePrivate() = default;

void APIResponsePrivate::SetError(int code, const Json::Value& details) {
    // Built aside first: the details may be a part of the body that goes.
    Json::Value body(Json::objectValue);
    body["success"] = code == 0;
    if (code != 0) {
        body["error"]["code"] = code;
        if (!details.isNull()) {
            body["error"]["errors"] = details;
        }
    } else if (!details.isNull()) {
        body["data"] = details;
    }
    store["body"].swap(body);
    error = code;
}

void APIResponsePrivate::SetCallbackFunc(APIResponse::CallbackFunc function, void* argument) {
    const std::pair<APIResponse::CallbackFunc, void*> callback(function, argument);
    if (function != nullptr &&
        std::find(callbacks.begin(), callbacks.end(), callback) == callbacks.end()) {
        callbacks.push_back(callback);
    }
}

}  // namespace TALO
