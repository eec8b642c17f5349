#include "src/response/APIResponsePrivate.h"

#include <algorithm>

#include "platform/Task.h"
#include "src/base/ErrorCode.h"
#include "src/base/JsonConvert.h"
#include "webapi/APIRequest.h"

namespace TALO {

APIResponsePrivate::APIResponsePrivate(APIRequest* request, APIResponse* owner)
    : request(request), owner(owner) {
    store["headers"] = Json::Value(Json::objectValue);
    store["setCookie"] = Json::Value(Json::arrayValue);
    store["success"] = Json::Value(Json::objectValue);
    store["option"] = Json::Value(Json::objectValue);
}

APIResponsePrivate::~APIResponsePrivate() {
    delete task;
}

// A background task reports its result as any method does; the record is where
// later requests find it.
void APIResponsePrivate::OpenTask() {
    if (task == nullptr && request != nullptr && request->IsPollingTask()) {
        const std::string user = ToText(request->GetEnv("task_user", Json::Value()));
        const std::string id = ToText(request->GetEnv("task_id", Json::Value()));
        task = new ORB::Task(user.c_str(), id.c_str());
    }
}

void APIResponsePrivate::RecordResult() {
    if (task != nullptr) {
        task->beginUpdate();
        (void)task->setProperty("body", store["body"]);
        (void)task->setProperty("task_run", true);
        (void)task->endUpdate();
    }
}

// Copied first: the details may be a part of the body that goes.
void APIResponsePrivate::SetError(int code, const Json::Value& details) {
    Json::Value copy(details);
    TakeResult(code, &copy);
}

void APIResponsePrivate::TakeResult(int code, Json::Value* details) {
    OpenTask();
    Json::Value body(Json::objectValue);
    body["success"] = code == kErrorNone;
    if (code != kErrorNone) {
        Json::Value& about = body["error"];
        about["code"] = code;
        if (!details->isNull()) {
            about["errors"].swap(*details);
        }
    } else if (!details->isNull()) {
        body["data"].swap(*details);
    }
    store["body"].swap(body);
    error = code;
    RecordResult();
}

void APIResponsePrivate::SetCallbackFunc(APIResponse::CallbackFunc function, void* argument) {
    const std::pair<APIResponse::CallbackFunc, void*> callback(function, argument);
    if (function != nullptr &&
        std::find(callbacks.begin(), callbacks.end(), callback) == callbacks.end()) {
        callbacks.push_back(callback);
    }
}

}  // namespace TALO
