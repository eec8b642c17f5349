#include <time.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <iostream>
#include <stdexcept>

#include "webapi/APIDownload.h"
#include "webapi/APIExport.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"
#include "webapi/APITable.h"
#include "webapi/APIUpload.h"

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

// Which parameters are paths that this request's upload made.
Json::Value Trusted(APIRequest* request, const Json::Value& params) {
    const TALO::APIUpload upload(request);
    Json::Value trusted(Json::objectValue);
    for (const std::string& name : params.getMemberNames()) {
        trusted[name] = upload.IsUploadedFile(params[name].asString());
    }
    return trusted;
}

void Trust(APIRequest* request, APIResponse* response) {
    response->SetSuccess(Trusted(request, request->GetParam("", Json::Value())));
}

unsigned long long lastDone = 0;
unsigned long long lastTotal = 0;

void Count(unsigned long long done, unsigned long long total) {
    lastDone = done;
    lastTotal = total;
}

// Reads an upload by itself, as a method does that "deferUpload" leaves it to.
void Reading(APIRequest* request, APIResponse* response) {
    TALO::APIUpload upload(request);
    upload.SetUploadCallback(Count);
    Json::Value data(Json::objectValue);
    Json::Value params(Json::objectValue);
    data["before"] = request->GetParam("", Json::Value());
    data["paramStatus"] = upload.GetUploadParam(params);
    data["fields"] = params;
    data["fileStatus"] = upload.GetUploadFile(params);
    data["all"] = params;
    data["trusted"] = Trusted(request, params);
    data["done"] = static_cast<Json::UInt64>(lastDone);
    data["total"] = static_cast<Json::UInt64>(lastTotal);
    response->SetSuccess(data);
}

void Download(APIRequest*, APIResponse* response) {
    Later(nullptr, response);
    response->SetEnableOutput(false);
    TALO::APIDownload download(response);
    (void)download.SetHeader("Content-type", "text/plain");
    (void)download.SetHeader("X-Content-Type-Options", "nosniff");
    std::cout << "before;";
    (void)download.Output("/some/file.txt");
}

TALO::_tag_API_TABLE table[] = {
    {"Test.Entry", 1, "echo", Echo},         {"Test.Entry", 2, "echo", Echo},
    {"Test.Entry", 1, "silent", Silent},     {"Test.Entry", 1, "throwing", Throwing},
    {"Test.Entry", 1, "printing", Printing}, {"Test.Entry", 1, "notFound", NotFound},
    {"Test.Entry", 1, "later", Later},       {"Test.Entry", 1, "ownOutput", OwnOutput},
    {"Test.Entry", 1, "restart", Restart},   {"Test.Entry", 1, "restartOnly", RestartOnly},
    {"Test.Entry", 1, "upload", Echo},       {"Test.Entry", 1, "deferred", Echo},
    {"Test.Entry", 1, "trust", Trust},       {"Test.Entry", 1, "reading", Reading},
    {"Test.Entry", 1, "download", Download}, {nullptr, 0, nullptr, nullptr},
};

}  // namespace

WEBAPI_LIBRARY_EXPORT TALO::_tag_API_TABLE* GetAPITable() {
    return table;
}
