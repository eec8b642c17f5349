// Test.NoTable: a library that is none of an API.
#include "webapi/APIExport.h"

WEBAPI_LIBRARY_EXPORT int SomethingElse() {
    return 1;
}
