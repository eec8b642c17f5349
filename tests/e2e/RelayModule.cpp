// Test.Relay: what reaches a method over another appliance, and for whom. Uploads
// end up in the folder "keep"; a real API would never let a caller choose.
#include <sys/resource.h>
#include <unistd.h>

#include <cstdio>
#include <string>

#include "webapi/APIExport.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"
#include "webapi/APITable.h"
#include "webapi/APIUpload.h"

namespace {

Json::Int64 PeakKibibytes() {
    struct rusage usage = {};
    (void)getrusage(RUSAGE_SELF, &usage);
    return usage.ru_maxrss;
}

Json::Value Describe(const TALO::APIRequest& request) {
    Json::Value facts(Json::objectValue);
    facts["params"] = request.GetParam("", Json::Value());
    facts["version"] = request.GetAPIVersion();
    facts["user"] = request.GetLoginUserName();
    facts["admin"] = request.IsAdmin();
    facts["language"] = request.GetUILanguage();
    facts["application"] = request.GetApplication();
    facts["hops"] = request.GetEnv("HTTP_X_RELAY_HOPS", Json::Value());
    return facts;
}

// Sets a header line too: it is this appliance's, not the caller's.
void Echo(TALO::APIRequest* request, TALO::APIResponse* response) {
    (void)response->SetHeader("X-Echo", "here");
    response->SetSuccess(Describe(*request));
}

void Sleep(TALO::APIRequest* request, TALO::APIResponse* response) {
    const auto seconds = request->GetAndCheckIntegral<long long>(
        "seconds", TALO::APIRequest::REQUIRED,
        [](const long long& number) { return number >= 0 && number <= 10; });
    if (!seconds.IsInvalid()) {
        (void)sleep(static_cast<unsigned>(seconds.Get()));
        response->SetSuccess("slept");
    }
}

void Take(TALO::APIRequest* request, TALO::APIResponse* response) {
    const TALO::APIUpload upload(request);
    Json::Value data = Describe(*request);
    const std::string keep = data["params"].get("keep", "").asString();
    for (const std::string& name : data["params"].getMemberNames()) {
        const Json::Value& value = data["params"][name];
        if (value.isString() && upload.IsUploadedFile(value.asString())) {
            (void)rename(value.asCString(), (keep + "/" + name).c_str());
        }
    }
    data["peak"] = PeakKibibytes();
    response->SetSuccess(data);
}

TALO::_tag_API_TABLE table[] = {
    {"Test.Relay", 1, "echo", Echo},   {"Test.Relay", 2, "echo", Echo},
    {"Test.Relay", 2, "sleep", Sleep}, {"Test.Relay", 2, "take", Take},
    {nullptr, 0, nullptr, nullptr},
};

}  // namespace

WEBAPI_LIBRARY_EXPORT TALO::_tag_API_TABLE* GetAPITable() {
    return table;
}
