#include <signal.h>
#include <unistd.h>

#include <cstdlib>
#include <string>

#include "webapi/APIExport.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"
#include "webapi/APITable.h"

// The API library behind the tests of the server: echoes, dawdles, hangs and
// crashes. Two APIs have it, each through a copy of its own.

#ifndef SERVER_MODULE_MARK
#define SERVER_MODULE_MARK "first"
#endif

namespace {

using TALO::APIRequest;
using TALO::APIResponse;

int served = 0;

void Echo(APIRequest* request, APIResponse* response) {
    Json::Value data(Json::objectValue);
    data["nonce"] = request->GetParam("nonce", Json::Value());
    data["pid"] = static_cast<int>(getpid());
    data["served"] = ++served;
    data["mark"] = SERVER_MODULE_MARK;
    response->SetSuccess(data);
}

void Dawdle(APIRequest* request, APIResponse* response) {
    const Json::Value milliseconds = request->GetParam("milliseconds", Json::Value(100));
    (void)usleep(static_cast<useconds_t>(milliseconds.asInt()) * 1000);
    Echo(request, response);
}

void Hang(APIRequest*, APIResponse*) {
    (void)signal(SIGTERM, SIG_IGN);
    for (;;) {
        (void)pause();
    }
}

// A child that holds on to the connection, and a parent that hangs.
void HangWithChild(APIRequest* request, APIResponse* response) {
    if (fork() == 0) {
        (void)sleep(600);
        _exit(0);
    }
    Hang(request, response);
}

// A child that holds on to the connection, and a parent that has done its work.
void LeaveChild(APIRequest* request, APIResponse* response) {
    if (fork() == 0) {
        (void)sleep(600);
        _exit(0);
    }
    Echo(request, response);
}

void Crash(APIRequest*, APIResponse*) {
    (void)raise(SIGSEGV);
}

void Vanish(APIRequest* request, APIResponse*) {
    const Json::Value milliseconds = request->GetParam("milliseconds", Json::Value(0));
    (void)usleep(static_cast<useconds_t>(milliseconds.asInt()) * 1000);
    (void)raise(SIGKILL);
}

void WriteText(const std::string& text) {
    (void)!write(STDOUT_FILENO, text.data(), text.size());
}

// A download that takes longer than the API may, a little at a time.
void Stream(APIRequest*, APIResponse* response) {
    response->SetEnableOutput(false);
    WriteText("Content-Type: text/plain\r\n\r\n");
    for (int part = 0; part < 15; ++part) {
        WriteText("part ");
        (void)usleep(200000);
    }
}

// One that is larger than what is under way at any time.
void Flood(APIRequest*, APIResponse* response) {
    response->SetEnableOutput(false);
    WriteText("Content-Type: text/plain\r\n\r\n");
    WriteText(std::string(8u << 20, 'x'));
}

// One that comes to nothing half way.
void Stall(APIRequest* request, APIResponse* response) {
    WriteText("Content-Type: text/plain\r\n\r\npart ");
    Hang(request, response);
}

#ifdef SERVER_MODULE_CANNOT_LOAD
__attribute__((constructor)) void CannotLoad() {
    abort();
}
#endif

TALO::_tag_API_TABLE table[] = {
    {nullptr, 1, "echo", Echo},     {nullptr, 1, "dawdle", Dawdle},
    {nullptr, 1, "hang", Hang},     {nullptr, 1, "hangWithChild", HangWithChild},
    {nullptr, 1, "crash", Crash},   {nullptr, 1, "vanish", Vanish},
    {nullptr, 1, "flood", Flood},   {nullptr, 1, "leaveChild", LeaveChild},
    {nullptr, 1, "stream", Stream}, {nullptr, 1, "stall", Stall},
    {nullptr, 0, nullptr, nullptr},
};

}  // namespace

// The name is what the test calls this copy: it asks for one API at a time.
WEBAPI_LIBRARY_EXPORT TALO::_tag_API_TABLE* GetAPITable() {
    for (TALO::_tag_API_TABLE* row = table; row->method != nullptr; ++row) {
        row->apiName = getenv("PROBE_NAME");
    }
    return table;
}
