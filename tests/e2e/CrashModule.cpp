// Test.Crash: methods that end their process by a crash, or as [how] says by
// "exit" or "_exit". "crash" may write nothing by itself; "download" has begun its
// reply when it crashes; "child" leaves the crash to a process of its own, and
// "task" to a background task, and they answer.
#include <sys/wait.h>
#include <unistd.h>

#include <cstdlib>
#include <iostream>
#include <string>

#include "tests/support/Crashes.h"
#include "webapi/APIExport.h"
#include "webapi/APIPolling.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"
#include "webapi/APITable.h"

using TALO::APIRequest;
using TALO::APIResponse;

namespace {

std::string How(APIRequest* request) {
    return request->GetParam("how", "").asString();
}

void Crash(APIRequest* request, APIResponse*) {
    const std::string how = How(request);
    if (how == "exit") {
        exit(0);
    }
    if (how == "_exit") {
        _exit(0);
    }
    support::CrashBy(how);
}

void Download(APIRequest* request, APIResponse* response) {
    response->SetEnableOutput(false);
    std::cout << "Content-type: text/plain\r\n\r\nhalf a file" << std::flush;
    Crash(request, response);
}

void Child(APIRequest* request, APIResponse* response) {
    const pid_t child = fork();
    if (child == 0) {
        Crash(request, response);
        _exit(0);
    }
    (void)waitpid(child, nullptr, 0);
    response->SetSuccess("answered");
}

void Work(APIRequest* request, APIResponse* response, void*) {
    response->SetSuccess("works");
    Crash(request, response);
}

void Task(APIRequest* request, APIResponse* response) {
    TALO::APIPolling polling(request);
    (void)polling.SetGroupAttr("everyone");
    (void)polling.Start(response, Work, nullptr);
}

TALO::_tag_API_TABLE table[] = {
    {"Test.Crash", 1, "crash", Crash}, {"Test.Crash", 1, "download", Download},
    {"Test.Crash", 1, "child", Child}, {"Test.Crash", 1, "task", Task},
    {nullptr, 0, nullptr, nullptr},
};

}  // namespace

WEBAPI_LIBRARY_EXPORT TALO::_tag_API_TABLE* GetAPITable() {
    return table;
}
