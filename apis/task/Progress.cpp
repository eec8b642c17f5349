#include <algorithm>

#include "Task.h"
#include "webapi/APIPolling.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"

using TALO::APIPolling;
using TALO::APIRequest;
using TALO::APIResponse;

namespace {

// Lines are counted from the task's first one, so that a client asks each time
// for what it has not seen; lines that have gone meanwhile it never sees.
void CutLog(long long offset, Json::Value* progress) {
    const Json::Value& log = (*progress)["log"];
    const long long first = (*progress)["log_first"].asInt64();
    const long long end = first + static_cast<long long>(log.size());
    const long long from = std::min(std::max(offset, first), end);
    Json::Value lines(Json::arrayValue);
    for (long long line = from; line < end; ++line) {
        lines.append(log[static_cast<Json::ArrayIndex>(line - first)]);
    }
    (*progress)["log"].swap(lines);
    (*progress)["offset"] = static_cast<Json::Int64>(from);
    (*progress)["next"] = static_cast<Json::Int64>(end);
    progress->removeMember("log_first");
}

}  // namespace

void Progress(APIRequest* request, APIResponse* response) {
    const auto id = request->GetAndCheckString("task_id", APIRequest::REQUIRED, nullptr);
    const auto offset =
        request->GetAndCheckIntegral<long long>("offset", APIRequest::OPTIONAL, nullptr);
    if (id.IsInvalid() || offset.IsInvalid() || offset.Get(0) < 0) {
        response->SetError(kBadParameter, id.IsInvalid() ? "task_id" : "offset");
        return;
    }
    APIPolling polling(request);
    Json::Value progress;
    if (!polling.Progress(id.Get(), progress)) {
        response->SetError(polling.GetError(), Json::Value());
        return;
    }
    CutLog(offset.Get(0), &progress);
    response->SetSuccess(progress);
}
