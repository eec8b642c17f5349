#include "File.h"
#include "StopSignal.h"
#include "Target.h"
#include "webapi/APIPolling.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"
#include "webapi/APITaskProgress.h"

using TALO::APIRequest;
using TALO::APIResponse;

namespace {

const char kPrefix[] = "remove-";

Json::Value StateOf(const char* state, Json::UInt64 removed) {
    Json::Value data(Json::objectValue);
    data["state"] = state;
    data["removed"] = removed;
    return data;
}

// In the background. The first report lets the waiting client go.
void RemoveTree(APIRequest* request, APIResponse* response, void* argument) {
    const Target& target = *static_cast<const Target*>(argument);
    NoticeStop();
    response->SetSuccess(StateOf("running", 0));
    TALO::APITaskProgress progress(request);
    Json::UInt64 removed = 0;
    const talo::FileError result = target.place.RemoveTree([&](const talo::TreeEntry&) {
        if (IsStopAsked()) {
            return false;
        }
        progress.SetText(std::to_string(++removed) + " removed");
        return true;
    });
    if (result == talo::FileError::kStopped) {
        response->SetError(kStopped, StateOf("stopped", removed));
    } else if (!AnswerError(response, result, target.path)) {
        progress.SetPercent(100);
        response->SetSuccess(StateOf("done", removed + 1));
    }
}

}  // namespace

// What one call of the system removes is gone at once.
void Remove(APIRequest* request, APIResponse* response) {
    Target target;
    if (!OpenTarget(*request, response, "path", Access::kChange, &target)) {
        return;
    }
    const talo::FileError result = target.place.Remove();
    if (result != talo::FileError::kNotEmpty) {
        if (!AnswerError(response, result, target.path)) {
            response->SetSuccess(StateOf("done", 1));
        }
        return;
    }
    TALO::APIPolling polling(request);
    (void)polling.SetPrefixAttr(kPrefix);
    const HeldStop held;
    (void)polling.Start(response, RemoveTree, &target);
}
