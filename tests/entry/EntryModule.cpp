#include <time.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <iostream>
#include <stdexcept>

#include "webapi/APIExport.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"
#include "webapi/APITable.h"

// The API library behind the tests of the entry. Callbacks leave one line each
// in the file that the environment variable ENTRY_TRACE names.

namespace {

using TALO::APIRequest;
using TALO::APIResponse;

long long NowInMilliseconds() {
    struct timespec now = {};
    (void)clock_gettime(CLOCK_MONOTONIC, &now);
    return now.tv_sec * 1000LL + now.tv_nsec / 1000000;
}

// "WHAT LEADER TIME": whether the process leads a session of its own, and when.
void Trace(void* what) {
    FILE* file = fopen(getenv("ENTRY_TRACE"), "ae");
    if (file != nullptr) {
        (void)fprintf(file, "%s %d %lld\n", static_cast<const char*>(what), getsid(0) == getpid(),
                      NowInMilliseconds());
        (void)fclose(file);
    }
}

void ThrowLater(void*) {
    throw std::runtime_error("callback");
}

char first[] = "first";
char second[] = "second";
char third[] = "third";

void Echo(APIRequest* request, APIResponse* response) {
    Json::Value data(Json::objectValue);
    data["params"] = request->GetParam("", Json::Value());
    data["version"] = request->GetAPIVersion();
    data["session"] = request->GetSessionID();
    data["cookieHeader"] = request->GetEnv("HTTP_COOKIE", Json::Value());
    response->SetSuccess(data);
}

void Silent(APIRequest*, APIResponse*) {}

void Throwing(APIRequest*, APIResponse* response) {
    response->SetSuccess("never seen");
    throw std::runtime_error("method");
}

void Printing(APIRequest*, APIResponse* response) {
    std::cout << "stray" << std::endl;
    response->SetSuccess(Json::Value());
}

void NotFound(APIRequest*, APIResponse* response) {
    response->SetServerError("lost");
    response->SetStatus(TALO::HTTP_STATUS_NOT_FOUND, "Not Found");
    response->SetSuccess(Json::Value());
}

void Later(APIRequest*, APIResponse* response) {
    response->SetCallbackFunc(Trace, first);
    response->SetCallbackFunc(ThrowLater, nullptr);
    response->SetCallbackFunc(Trace, second);
    response->SetCallbackFunc(Trace, third);
    response->SetSuccess(Json::Value());
}

void OwnOutput(APIRequest* request, APIResponse* response) {
    Later(request, response);
    response->SetEnableOutput(false);
    (void)fputs("own", stdout);
}

void Restart(APIRequest*, APIResponse* response) {
    response->SetHttpdRestart(true);
    response->SetCallbackFunc(Trace, first);
    response->SetSuccess(Json::Value());
}

void RestartOnly(APIRequest*, APIResponse* response) {
    response->SetHttpdRestart(true);
    response->SetSuccess(Json::Value());
}

TALO::_tag_API_TABLE table[] = {
    {"Test.Entry", 1, "echo", Echo},         {"Test.Entry", 2, "echo", Echo},
    {"Test.Entry", 1, "silent", Silent},     {"Test.Entry", 1, "throwing", Throwing},
    {"Test.Entry", 1, "printing", Printing}, {"Test.Entry", 1, "notFound", NotFound},
    {"Test.Entry", 1, "later", Later},       {"Test.Entry", 1, "ownOutput", OwnOutput},
    {"Test.Entry", 1, "restart", Restart},   {"Test.Entry", 1, "restartOnly", RestartOnly},
    {"Test.Entry", 1, "upload", Echo},       {"Test.Entry", 1, "deferred", Echo},
    {nullptr, 0, nullptr, nullptr},
};

}  // namespace

WEBAPI_LIBRARY_EXPORT TALO::_tag_API_TABLE* GetAPITable() {
    return table;
}
