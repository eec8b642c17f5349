#ifndef WEBAPI_APITABLE_H
#define WEBAPI_APITABLE_H

namespace TALO {

class APIRequest;
class APIResponse;

/// The function that serves a method. It reads the request and reports through
/// the response: SetSuccess or SetError. A function that reports nothing, or
/// throws, leaves error 117. Neither pointer is null; both stay the framework's.
typedef void (*APIMethodFunc)(APIRequest* request, APIResponse* response);

/// A function that vets a request before its method runs. Nonzero lets the
/// request through; 0 stops it, with the error that it has set on the response.
typedef int (*APICheckFunc)(APIRequest* request, APIResponse* response);

/// One row of the method table that every API library exports:
///
///     static TALO::_tag_API_TABLE table[] = {
///         {"Acme.Light", 1, "switch", SwitchLight},
///         {nullptr, 0, nullptr, nullptr},
///     };
///     WEBAPI_LIBRARY_EXPORT TALO::_tag_API_TABLE* GetAPITable() { return table; }
///
/// The first row whose name, version and method equal the request's serves it.
/// A row with a null `apiName` ends the table. The table lives as long as the
/// library is loaded.
struct _tag_API_TABLE {
    const char* apiName;  ///< the API's name, exactly as requested
    int version;          ///< one version; a method of two versions has two rows
    const char* method;   ///< the method's name
    APIMethodFunc func;   ///< not null in a row that can match
};

/// One row of the optional check table, exported by "GetAPICheckTable". Rows
/// match as in the method table. The row with a null `apiName` ends the table;
/// if that row has a function, it is the check of every method not listed.
struct _tag_API_CHECK_TABLE {
    const char* apiName;
    int version;
    const char* method;
    APICheckFunc check;
    void* reserved1;  ///< null; the framework does not read it
    void* reserved2;  ///< null; the framework does not read it
};

static_assert(sizeof(void*) != 4 || sizeof(_tag_API_TABLE) == 16, "row of the method table");
static_assert(sizeof(void*) != 4 || sizeof(_tag_API_CHECK_TABLE) == 24, "row of the check table");

/// The shapes of the two exported functions, "GetAPITable" and "GetAPICheckTable".
typedef _tag_API_TABLE* (*APITableFunc)();
typedef _tag_API_CHECK_TABLE* (*APICheckTableFunc)();

}  // namespace TALO

#endif
