#include <dirent.h>
#include <signal.h>
#include <unistd.h>

#include <cstdlib>
#include <string>

#include "webapi/APIExport.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"
#include "webapi/APITable.h"

// The API library behind the tests of the programs: tells what a method sees of
// its process. The API's name is the test's own, so the table is filled from the
// environment variable PROBE_NAME.

namespace {

using TALO::APIRequest;
using TALO::APIResponse;

std::string LinkTarget(const std::string& path) {
    char target[4096] = {};
    return readlink(path.c_str(), target, sizeof target - 1) < 0 ? "" : target;
}

Json::Value OpenDescriptors() {
    Json::Value descriptors(Json::objectValue);
    DIR* folder = opendir("/proc/self/fd");
    while (const struct dirent* entry = folder != nullptr ? readdir(folder) : nullptr) {
        const std::string number = entry->d_name;
        if (number[0] != '.' && number != std::to_string(dirfd(folder))) {
            descriptors[number] = LinkTarget("/proc/self/fd/" + number);
        }
    }
    if (folder != nullptr) {
        (void)closedir(folder);
    }
    return descriptors;
}

void Process(APIRequest* request, APIResponse* response) {
    Json::Value data(Json::objectValue);
    for (const char* name : {"task_id", "task_user", "full_task_id", "TALO_WEBAPI_USERNAME"}) {
        const char* value = getenv(name);
        data["environment"][name] = value != nullptr ? Json::Value(value) : Json::Value();
    }
    data["pollingTask"] = request->IsPollingTask();
    data["pollingTaskId"] = request->GetPollingTaskId();
    data["descriptors"] = OpenDescriptors();
    data["directory"] = LinkTarget("/proc/self/cwd");
    struct sigaction action = {};
    (void)sigaction(SIGPIPE, nullptr, &action);
    data["ignoresPipe"] = action.sa_handler == SIG_IGN;
    data["user"] = request->GetLoginUserName();
    data["admin"] = request->IsAdmin();
    response->SetSuccess(data);
}

void Parameters(APIRequest* request, APIResponse* response) {
    Json::Value data(Json::objectValue);
    data["params"] = request->GetParam("", Json::Value());
    data["attr"] = request->GetAttr("", Json::Value());
    response->SetSuccess(data);
}

void Large(APIRequest*, APIResponse* response) {
    response->SetSuccess(std::string(4u << 20, 'x'));
}

TALO::_tag_API_TABLE table[] = {
    {nullptr, 1, "process", Process},       {nullptr, 1, "parameters", Parameters},
    {nullptr, 2, "parameters", Parameters}, {nullptr, 1, "large", Large},
    {nullptr, 0, nullptr, nullptr},
};

}  // namespace

WEBAPI_LIBRARY_EXPORT TALO::_tag_API_TABLE* GetAPITable() {
    for (TALO::_tag_API_TABLE* row = table; row->method != nullptr; ++row) {
        row->apiName = getenv("PROBE_NAME");
    }
    return table;
}
