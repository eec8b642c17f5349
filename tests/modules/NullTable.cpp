// Test.NullTable: asked for its method table, it has none.
#include "webapi/APIExport.h"
#include "webapi/APITable.h"

WEBAPI_LIBRARY_EXPORT TALO::_tag_API_TABLE* GetAPITable() {
    return nullptr;
}
