#include "System.h"
#include "webapi/APIExport.h"
#include "webapi/APITable.h"

namespace {

TALO::_tag_API_TABLE table[] = {
    {"TALO.System", 1, "ping", Ping},
    {"TALO.System", 2, "ping", Ping},
    {"TALO.System", 2, "info", Info},
    {nullptr, 0, nullptr, nullptr},
};

}  // namespace

WEBAPI_LIBRARY_EXPORT TALO::_tag_API_TABLE* GetAPITable() {
    return table;
}
