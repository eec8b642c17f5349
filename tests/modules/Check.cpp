// Test.Check: a check table with rows that let through, stop, stop without an
// error, throw and have no function, and a terminating row without one.
#include <stdexcept>

#include "webapi/APIExport.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"
#include "webapi/APITable.h"

namespace {

using TALO::APIRequest;
using TALO::APIResponse;

constexpr char kAPI[] = "Test.Check";

void Serve(APIRequest* request, APIResponse* response) {
    response->SetSuccess(request->GetAttr("checked", "unchecked"));
}

int Pass(APIRequest* request, APIResponse*) {
    request->SetAttr("checked", "by its row");
    return 1;
}

// Any number but 0 lets through.
int PassNegative(APIRequest* request, APIResponse*) {
    request->SetAttr("checked", "with -1");
    return -1;
}

int Stop(APIRequest*, APIResponse* response) {
    response->SetError(401, "stopped");
    return 0;
}

int StopSilently(APIRequest*, APIResponse*) {
    return 0;
}

int ThrowException(APIRequest*, APIResponse*) {
    throw std::runtime_error("the check gave up");
}

int ThrowNumber(APIRequest*, APIResponse*) {
    throw 8;
}

TALO::_tag_API_TABLE table[] = {
    {kAPI, 1, "pass", Serve},         {kAPI, 1, "passNegative", Serve},
    {kAPI, 1, "stop", Serve},         {kAPI, 2, "stop", Serve},
    {kAPI, 1, "stopSilently", Serve}, {kAPI, 1, "throwException", Serve},
    {kAPI, 1, "throwNumber", Serve},  {kAPI, 1, "noFunction", Serve},
    {kAPI, 1, "unlisted", Serve},     {nullptr, 0, nullptr, nullptr},
};

TALO::_tag_API_CHECK_TABLE checks[] = {
    {"Test.Other", 1, "pass", Stop, nullptr, nullptr},
    {kAPI, 1, nullptr, Stop, nullptr, nullptr},
    {kAPI, 1, "pass", Pass, nullptr, nullptr},
    {kAPI, 1, "pass", Stop, nullptr, nullptr},
    {kAPI, 1, "passNegative", PassNegative, nullptr, nullptr},
    {kAPI, 1, "stop", Stop, nullptr, nullptr},
    {kAPI, 1, "stopSilently", StopSilently, nullptr, nullptr},
    {kAPI, 1, "throwException", ThrowException, nullptr, nullptr},
    {kAPI, 1, "throwNumber", ThrowNumber, nullptr, nullptr},
    {kAPI, 1, "noFunction", nullptr, nullptr, nullptr},
    {nullptr, 0, nullptr, nullptr, nullptr, nullptr},
};

}  // namespace

WEBAPI_LIBRARY_EXPORT TALO::_tag_API_TABLE* GetAPITable() {
    return table;
}

WEBAPI_LIBRARY_EXPORT TALO::_tag_API_CHECK_TABLE* GetAPICheckTable() {
    return checks;
}
