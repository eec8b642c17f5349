// Test.Guard: a check table whose terminating row has a function, the check of
// every method without a row of its own. The parameter "refuse" makes it stop.
#include "webapi/APIExport.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"
#include "webapi/APITable.h"

namespace {

using TALO::APIRequest;
using TALO::APIResponse;

constexpr char kAPI[] = "Test.Guard";

void Serve(APIRequest* request, APIResponse* response) {
    response->SetSuccess(request->GetAttr("checked", "unchecked"));
}

int OwnRow(APIRequest* request, APIResponse*) {
    request->SetAttr("checked", "by its row");
    return 1;
}

int Rest(APIRequest* request, APIResponse* response) {
    request->SetAttr("checked", "by the last row");
    if (request->HasParam("refuse")) {
        response->SetError(402, "refused");
        return 0;
    }
    return 1;
}

TALO::_tag_API_TABLE table[] = {
    {kAPI, 1, "listed", Serve},
    {kAPI, 1, "unlisted", Serve},
    {nullptr, 0, nullptr, nullptr},
};

TALO::_tag_API_CHECK_TABLE checks[] = {
    {kAPI, 1, "listed", OwnRow, nullptr, nullptr},
    {nullptr, 0, nullptr, Rest, nullptr, nullptr},
};

}  // namespace

WEBAPI_LIBRARY_EXPORT TALO::_tag_API_TABLE* GetAPITable() {
    return table;
}

WEBAPI_LIBRARY_EXPORT TALO::_tag_API_CHECK_TABLE* GetAPICheckTable() {
    return checks;
}
