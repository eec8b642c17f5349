#include "webapi/APIExport.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"
#include "webapi/APITable.h"

// The API library behind the tests of permissions: several APIs with different
// rights, whose methods tell whom they see.

namespace {

using TALO::APIRequest;
using TALO::APIResponse;

void Who(APIRequest* request, APIResponse* response) {
    Json::Value data(Json::objectValue);
    data["user"] = request->GetLoginUserName();
    data["admin"] = request->IsAdmin();
    data["authorized"] = request->IsAuthorized();
    data["timeout"] = request->GetTimeoutDuration();
    data["application"] = request->GetApplication();
    data["priv"] = request->HasAppPriv("Photos");
    data["session"] = request->GetSessionID();
    response->SetSuccess(data);
}

// Each API has the method "who", "tolerant" (it allows a timed-out session),
// "passive" (it runs in the background), and "tolerantPassive".
#define METHODS_OF(api)                                                          \
    {api, 1, "who", Who}, {api, 1, "tolerant", Who}, {api, 1, "passive", Who}, { \
        api, 1, "tolerantPassive", Who                                           \
    }

TALO::_tag_API_TABLE table[] = {
    METHODS_OF("Test.Rights"),       METHODS_OF("Test.Rights.Admin"),
    METHODS_OF("Test.Rights.Open"),  METHODS_OF("Test.Rights.Optional"),
    METHODS_OF("Test.Rights.Photo"), {nullptr, 0, nullptr, nullptr},
};

}  // namespace

WEBAPI_LIBRARY_EXPORT TALO::_tag_API_TABLE* GetAPITable() {
    return table;
}
