#include "Relay.h"
#include "webapi/APIExport.h"
#include "webapi/APITable.h"

namespace {

TALO::_tag_API_TABLE table[] = {
    {"TALO.Relay", 1, "open", Open},
    {nullptr, 0, nullptr, nullptr},
};

}  // namespace

WEBAPI_LIBRARY_EXPORT TALO::_tag_API_TABLE* GetAPITable() {
    return table;
}
