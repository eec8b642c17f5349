// Test.NullCheck: asked for its check table, it has none, and serves all the same.
#include "webapi/APIExport.h"
#include "webapi/APIResponse.h"
#include "webapi/APITable.h"

namespace {

void Ok(TALO::APIRequest*, TALO::APIResponse* response) {
    response->SetSuccess("served");
}

TALO::_tag_API_TABLE table[] = {
    {"Test.NullCheck", 1, "ok", Ok},
    {nullptr, 0, nullptr, nullptr},
};

}  // namespace

WEBAPI_LIBRARY_EXPORT TALO::_tag_API_TABLE* GetAPITable() {
    return table;
}

WEBAPI_LIBRARY_EXPORT TALO::_tag_API_CHECK_TABLE* GetAPICheckTable() {
    return nullptr;
}
