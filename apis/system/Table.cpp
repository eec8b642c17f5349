#include "System.h"
#include "apis/common/RequireSession.h"
#include "webapi/APIExport.h"
#include "webapi/APITable.h"

namespace {

TALO::_tag_API_TABLE table[] = {
    {"TALO.System", 1, "ping", Ping},
    {"TALO.System", 2, "ping", Ping},
    {"TALO.System", 2, "info", Info},
    {nullptr, 0, nullptr, nullptr},
};

int CheckInfo(TALO::APIRequest* request, TALO::APIResponse* response) {
    return RequireSession(request, response, SessionUse::kRenew) ? 1 : 0;
}

TALO::_tag_API_CHECK_TABLE checkTable[] = {
    {"TALO.System", 2, "info", CheckInfo, nullptr, nullptr},
    {nullptr, 0, nullptr, nullptr, nullptr, nullptr},
};

}  // namespace

WEBAPI_LIBRARY_EXPORT TALO::_tag_API_TABLE* GetAPITable() {
    return table;
}

WEBAPI_LIBRARY_EXPORT TALO::_tag_API_CHECK_TABLE* GetAPICheckTable() {
    return checkTable;
}
