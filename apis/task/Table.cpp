#include "Task.h"
#include "webapi/APIExport.h"
#include "webapi/APITable.h"

namespace {

TALO::_tag_API_TABLE table[] = {
    {"TALO.Task", 1, "status", Status}, {"TALO.Task", 1, "progress", Progress},
    {"TALO.Task", 1, "stop", Stop},     {"TALO.Task", 1, "list", List},
    {nullptr, 0, nullptr, nullptr},
};

}  // namespace

WEBAPI_LIBRARY_EXPORT TALO::_tag_API_TABLE* GetAPITable() {
    return table;
}
