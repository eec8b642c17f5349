#include <limits.h>
#include <sys/resource.h>
#include <unistd.h>

#include <cstdlib>
#include <fstream>
#include <string>

#include "Methods.h"

namespace basic {

namespace {

// Up to the first NUL or line break: a task name, or the first argument.
std::string FirstOf(const char* path) {
    std::ifstream file(path);
    std::string text;
    std::getline(file, text);
    return text.c_str();
}

Json::Value Variable(const char* name) {
    const char* value = getenv(name);
    return value != nullptr ? Json::Value(value) : Json::Value();
}

}  // namespace

void Process(APIRequest*, APIResponse* response) {
    char folder[PATH_MAX] = "";
    Json::Value data(Json::objectValue);
    data["nice"] = getpriority(PRIO_PROCESS, 0);
    data["task"] = FirstOf("/proc/self/comm");
    data["argument"] = FirstOf("/proc/self/cmdline");
    data["folder"] = getcwd(folder, sizeof folder) != nullptr ? folder : "";
    data["USERNAME"] = Variable("USERNAME");
    data["TALO_WEBAPI_USERNAME"] = Variable("TALO_WEBAPI_USERNAME");
    response->SetSuccess(data);
}

void Caller(APIRequest* request, APIResponse* response) {
    Json::Value data(Json::objectValue);
    data["user"] = request->GetLoginUserName();
    data["admin"] = request->IsAdmin();
    data["timeout"] = request->IsTimeout();
    data["authorized"] = request->IsAuthorized();
    data["requestMethod"] = request->GetRequestMethod();
    data["attributes"] = request->GetAttr("", Json::Value(Json::objectValue));
    data["environment"] = request->GetEnv("", Json::Value(Json::objectValue));
    data["description"] = request->GetAPIInfo("", Json::Value(Json::objectValue));
    response->SetSuccess(data);
}

}  // namespace basic
