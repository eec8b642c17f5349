// Test.Basic: everything that a method may do, without a check table.
#include "Methods.h"
#include "webapi/APIExport.h"
#include "webapi/APITable.h"

namespace {

constexpr char kAPI[] = "Test.Basic";

// A second row of the same identity never serves: the first match wins.
void Never(TALO::APIRequest*, TALO::APIResponse* response) {
    response->SetError(499, Json::Value());
}

void SecondVersion(TALO::APIRequest*, TALO::APIResponse* response) {
    response->SetSuccess("version 2");
}

TALO::_tag_API_TABLE table[] = {
    {kAPI, 1, "ok", basic::Ok},
    {kAPI, 1, "ok", Never},
    {kAPI, 2, "ok", SecondVersion},
    {kAPI, 1, "echo", basic::Echo},
    {kAPI, 1, "fail", basic::Fail},
    {kAPI, 1, "nothing", basic::Nothing},
    {kAPI, 1, "throwException", basic::ThrowException},
    {kAPI, 1, "throwNumber", basic::ThrowNumber},
    {kAPI, 1, "throwAfterSuccess", basic::ThrowAfterSuccess},
    {kAPI, 1, "status", basic::Status},
    {kAPI, 1, "header", basic::Header},
    {kAPI, 1, "serverError", basic::ServerError},
    {kAPI, 1, "restart", basic::Restart},
    {kAPI, 1, "later", basic::Later},
    {kAPI, 1, "print", basic::Print},
    {kAPI, 1, "readInput", basic::ReadInput},
    {kAPI, 1, "upload", basic::ReadInput},
    {kAPI, 1, "uploadDeferred", basic::ReadInput},
    {kAPI, 1, "uploadEcho", basic::Echo},
    {kAPI, 1, "download", basic::Download},
    {kAPI, 1, "printRaw", basic::Print},
    {kAPI, 1, "process", basic::Process},
    {kAPI, 1, "caller", basic::Caller},
    {nullptr, 0, nullptr, nullptr},
};

}  // namespace

WEBAPI_LIBRARY_EXPORT TALO::_tag_API_TABLE* GetAPITable() {
    return table;
}
