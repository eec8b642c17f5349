#include "webapi/APIExport.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"
#include "webapi/APITable.h"

namespace {

// Leaves two cookie lines, which carry no header name.
void Add(TALO::APIRequest*, TALO::APIResponse* response) {
    (void)response->AddCookie("/", "first", "one two");
    (void)response->AddCookie("/sub", "second", "2");
    response->SetSuccess(Json::Value());
}

// Sets a cookie the way that reaches every client.
void Set(TALO::APIRequest*, TALO::APIResponse* response) {
    (void)response->SetHeader("Set-Cookie", "third=3; Path=/");
    response->SetSuccess(Json::Value());
}

void Redirect(TALO::APIRequest*, TALO::APIResponse* response) {
    (void)response->Redirect("elsewhere");
    response->SetSuccess(Json::Value());
}

TALO::_tag_API_TABLE table[] = {
    {"Test.Cookie", 1, "add", Add},
    {"Test.Cookie", 1, "set", Set},
    {"Test.Cookie", 1, "redirect", Redirect},
    {nullptr, 0, nullptr, nullptr},
};

}  // namespace

WEBAPI_LIBRARY_EXPORT TALO::_tag_API_TABLE* GetAPITable() {
    return table;
}
