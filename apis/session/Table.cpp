#include <string>

#include "Session.h"
#include "apis/common/RequireSession.h"
#include "webapi/APIExport.h"
#include "webapi/APIRequest.h"
#include "webapi/APITable.h"

namespace {

TALO::_tag_API_TABLE table[] = {
    {"TALO.Session", 1, "open", Open},     {"TALO.Session", 1, "close", Close},
    {"TALO.Session", 1, "renew", Renew},   {"TALO.Session", 1, "info", Info},
    {"TALO.Session", 1, "list", List},     {"TALO.Session", 1, "end", End},
    {"TALO.Session", 1, "cipher", Cipher}, {nullptr, 0, nullptr, nullptr},
};

// The terminating row checks every method.
TALO::_tag_API_CHECK_TABLE checkTable[] = {
    {nullptr, 0, nullptr, CheckSession, nullptr, nullptr},
};

}  // namespace

int CheckSession(TALO::APIRequest* request, TALO::APIResponse* response) {
    const std::string method = request->GetAPIMethod();
    if (method == "open" || method == "cipher") {
        return 1;
    }
    const SessionUse use = method == "close"  ? SessionUse::kEvenTimedOut
                           : method == "info" ? SessionUse::kLook
                                              : SessionUse::kRenew;
    return RequireSession(request, response, use) ? 1 : 0;
}

WEBAPI_LIBRARY_EXPORT TALO::_tag_API_TABLE* GetAPITable() {
    return table;
}

WEBAPI_LIBRARY_EXPORT TALO::_tag_API_CHECK_TABLE* GetAPICheckTable() {
    return checkTable;
}
