#ifndef WEBAPI_APIAUTH_H
#define WEBAPI_APIAUTH_H

#include "webapi/APIExport.h"

namespace TALO {

class APIRequest;
class APIResponse;

/// The entry's permission check for code that has no entry object, such as an
/// API library that acts for another session. Static operations, no state.
///
///     if (!APIAuth::CheckPermission(request, response, sessionId, false)) {
///         return;   // the response carries 105, 106 or 107
///     }
///
/// User, administrator flag and the API's description are taken from the request.
class WEBAPI_EXPORT APIAuth {
  public:
    /// Checks the session, the user's class and the application privilege. False
    /// with the error set on the response: 105 not permitted (or a null session
    /// id), 106 timed out, 107 the session was refused for this client.
    static bool CheckPermission(APIRequest* request, APIResponse* response, const char* sessionId,
                                bool allowTimeout);

    /// Whether the API's "allowUser" list has the user's class. An API without a
    /// list admits nobody.
    static bool CheckAllowUser(APIRequest* request, const char* userName);

    /// Sets the last use of the request's session to now. False when its id does
    /// not name exactly a file of the session folder.
    static bool UpdateTimeout(APIRequest* request);
};

}  // namespace TALO

#endif
