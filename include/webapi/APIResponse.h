#ifndef WEBAPI_APIRESPONSE_H
#define WEBAPI_APIRESPONSE_H

#include <json/json.h>

#include <list>
#include <string>
#include <utility>

#include "webapi/APIExport.h"
#include "webapi/HTTPStatus.h"

namespace TALO {

class APIRequest;
class APIResponsePrivate;

/// What a method fills in: the result document, header lines, an HTTP status,
/// and work to be done after the reply has left. The framework owns it and
/// prints it when the method has returned.
///
///     if (!Switch(room)) {
///         response->SetError(401, Json::Value(room));   // "errors" carries the room
///         return;
///     }
///     response->SetSuccess(Json::Value());              // {"success":true}
///
/// Nothing here logs; a store that cannot be made answers false.
class WEBAPI_EXPORT APIResponse {
  public:
    typedef void (*CallbackFunc)(void* argument);
    typedef std::list<std::pair<CallbackFunc, void*>> CallbackList;

    /// A response with the header "Content-type" and nothing else. The request
    /// (may be null) is not owned and must outlive the response.
    explicit APIResponse(APIRequest* request);
    ~APIResponse();
    APIResponse(const APIResponse&) = delete;
    APIResponse& operator=(const APIResponse&) = delete;

    /// Replaces the result by {"success": false, "error": {"code": code}}, with
    /// "errors" when details are not null. Code 0 is a success with the details
    /// as "data".
    void SetError(int code, const Json::Value& details);

    /// Replaces the result by {"success": true}, with "data" when not null.
    void SetSuccess(const Json::Value& data);

    /// The same for data that the caller can do without, as the large reply of a list:
    /// nothing is copied, and what it has afterwards is of no meaning.
    void TakeSuccess(Json::Value* data);

    /// The code set last; 0 after a success or when nothing was set.
    int GetError() const;

    /// Header lines, one value per name; names are case-sensitive here. Values
    /// are printed as they stand: never pass a client's text with CR, LF or NUL.
    /// False for an empty name.
    bool SetHeader(const std::string& name, const std::string& value);
    std::string GetHeader(const std::string& name, const std::string& fallback) const;
    bool HasHeader(const std::string& name) const;
    Json::Value GetHeaders() const;

    /// Takes a header line out, such as the "Content-type" that every response
    /// begins with, where the content's own type follows. False when it is not there.
    bool RemoveHeader(const std::string& name);

    /// A text for the client's log, sent as the header line "x-request-error".
    void SetServerError(const std::string& text);
    bool HasServerError() const;
    std::string GetServerError() const;  ///< "" when there is none

    /// The HTTP status, sent as the header line "Status". GetStatus answers 200
    /// when none was set, 0 when the header holds no number.
    bool SetStatus(_tag_HTTP_STATUS_CODE code, const std::string& message);
    int GetStatus() const;

    /// Adds a cookie for the browser session; the value is percent-encoded. The
    /// path comes first, then name and value. A name is letters, digits, "_" and
    /// "-". The line leaves as "NAME=VALUE; path=PATH", without a header name in
    /// front: to set a cookie on the wire, use SetHeader("Set-Cookie", ...).
    bool AddCookie(const std::string& path, const std::string& name, const std::string& value);

    /// Sends the client to a path of the host that it used, with status 302. A
    /// whole URL is not recognised as one. False without a request; throws
    /// std::out_of_range for an empty path.
    bool Redirect(const std::string& path);

    /// Whether the framework prints header and body. A method that has written
    /// its own answer switches it off.
    void SetEnableOutput(bool enable);
    bool IsEnableOutput() const;

    /// Asks for a restart of the web server after the reply.
    void SetHttpdRestart(bool restart);
    bool GetHttpdRestart() const;

    /// The result document ({} while nothing was set) and the cookie lines. The
    /// reference form is valid until the next result is set.
    Json::Value GetBody() const;
    const Json::Value& GetBodyRef() const;
    Json::Value GetCookies() const;

    /// Work for after the reply, run in a detached process in the order of
    /// registration. A null function and a pair that is there already are ignored.
    void SetCallbackFunc(CallbackFunc function, void* argument);
    /// Registers every pair of a CallbackList, as another response's
    /// GetCallbackFuncs answers it. Null is ignored.
    void SetCallbackFuncs(void* list);
    /// The list itself, owned by the response. Never null.
    CallbackList* GetCallbackFuncs() const;

  private:
    APIResponsePrivate* d;
};

}  // namespace TALO

#endif
