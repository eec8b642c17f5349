#include "apis/common/RequireSession.h"
#include "apis/system/System.h"
#include "bench/module/Reply.h"
#include "webapi/APIExport.h"
#include "webapi/APITable.h"

namespace {

TALO::_tag_API_TABLE table[] = {
    {"Bench.Once", 1, "info", Info},
    {"Bench.Reply", 1, "rows", Rows},
    {nullptr, 0, nullptr, nullptr},
};

int CheckInfo(TALO::APIRequest* request, TALO::APIResponse* response) {
    return RequireSession(request, response, SessionUse::kRenew) ? 1 : 0;
}

TALO::_tag_API_CHECK_TABLE checkTable[] = {
    {"Bench.Once", 1, "info", CheckInfo, nullptr, nullptr},
    {nullptr, 0, nullptr, nullptr, nullptr, nullptr},
};

}  // namespace

WEBAPI_LIBRARY_EXPORT TALO::_tag_API_TABLE* GetAPITable() {
    return table;
}

WEBAPI_LIBRARY_EXPORT TALO::_tag_API_CHECK_TABLE* GetAPICheckTable() {
    return checkTable;
}
