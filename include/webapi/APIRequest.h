#ifndef WEBAPI_APIREQUEST_H
#define WEBAPI_APIREQUEST_H

#include <json/json.h>

#include <string>

#include "webapi/APIExport.h"
#include "webapi/APIParameter.h"

namespace TALO {

class APIRequestPrivate;

/// What a method sees of the request that it serves: environment, cookies,
/// parameters (query and body merged), the description of the API, the login
/// session, and free attributes. The framework builds one per request, owns it,
/// and hands it to the method by pointer; it lives until the request ends and
/// serves one thread.
///
///     void SwitchLight(APIRequest* request, APIResponse* response) {
///         auto room = request->GetAndCheckString("room", APIRequest::REQUIRED, nullptr);
///         if (room.IsInvalid()) {
///             response->SetError(400, Json::Value());
///             return;
///         }
///         response->SetSuccess(Switch(request->GetLoginUserName(), room.Get()));
///     }
///
/// Nothing here logs or reports an error: an accessor answers the caller's
/// default for what is absent, and converts what has another type (text "12"
/// reads as the integer 12, a non-empty text as true). A stored JSON null is
/// present: no default applies to it.
class WEBAPI_EXPORT APIRequest {
  public:
    /// Whether a parameter must be there. Any value but REQUIRED counts as optional.
    enum PARAM_NECESSITY : int { REQUIRED = 0, OPTIONAL = 1 };

    /// Builds a request from an environment document, an object with the optional
    /// members "environ", "getParam", "postParam", "reqLib" and "session". Any
    /// other document gives an empty request. Throws Json::LogicError when the
    /// parameters carry an "api", "version" or "method" of an impossible type.
    explicit APIRequest(const Json::Value& document);
    virtual ~APIRequest();
    APIRequest(const APIRequest&) = delete;
    APIRequest& operator=(const APIRequest&) = delete;

    /// Adds environment variables (string members only), then reads cookies and
    /// the request method from what the environment holds by then. Anything but
    /// a filled object changes nothing.
    void InitEnv(const Json::Value& environ);

    /// The same for an object that the caller can do without: nothing is copied, and
    /// what it has afterwards is of no meaning.
    void TakeEnv(Json::Value* environ);

    /// Merges "getParam" and then "postParam" of the document into the parameters,
    /// so that the body wins, and takes the API identity from both. With `clear`
    /// the parameters are emptied first. Throws as the constructor does.
    void InitParam(const Json::Value& document, bool clear);

    /// Replace the API's description, and the session facts.
    void InitAPIInfo(const Json::Value& description);
    void InitSession(const Json::Value& session);

    /// A parameter, or the default; with an empty name the whole section. The
    /// reference form is valid while the request lives and is not changed (and
    /// while the default lives).
    Json::Value GetParam(const std::string& name, const Json::Value& fallback) const;
    const Json::Value& GetParamRef(const std::string& name, const Json::Value& fallback) const;
    bool HasParam(const std::string& name) const;

    /// An environment variable, a key of the API's description, an attribute.
    Json::Value GetEnv(const std::string& name, const Json::Value& fallback) const;
    bool HasEnv(const std::string& name) const;
    Json::Value GetAPIInfo(const std::string& key, const Json::Value& fallback) const;
    Json::Value GetAttr(const std::string& key, const Json::Value& fallback) const;
    bool HasAttr(const std::string& key) const;

    /// Stores an attribute of any JSON type for the rest of the request. False
    /// only for an empty key.
    bool SetAttr(const std::string& key, const Json::Value& value);

    /// A cookie of the request. SetCookie changes this request's view only; what
    /// the client keeps is the response's business. False for an empty name.
    std::string GetCookie(const std::string& name, const std::string& fallback) const;
    bool HasCookie(const std::string& name) const;
    bool SetCookie(const std::string& name, const std::string& value);

    /// Identity: API name, method, version, and the HTTP method as a code: 1 GET,
    /// 2 POST, 3 HEAD, 0 any other.
    std::string GetAPIClass() const;
    std::string GetAPIMethod() const;
    int GetAPIVersion() const;
    int GetRequestMethod() const;

    /// The session identifier: the cookie "id", or "".
    std::string GetSessionID() const;
    /// Always false.
    bool IsDemoMode() const;

    /// Facts about the login session. A request without session facts counts as
    /// timed out, and as exempt from the address check, on purpose.
    int GetTimeoutDuration() const;  ///< minutes
    std::string GetApplication() const;
    std::string GetSessionFilePath() const;
    std::string GetUILanguage() const;               ///< "enu" when unknown
    bool HasAppPriv(const std::string& name) const;  ///< exactly this application
    bool IsAuthorized() const;
    bool IsTimeout() const;
    bool IsSkipCheckIP() const;
    bool IsAdmin() const;
    std::string GetLoginUserName() const;
    std::string GetWebAPIPriv() const;

    /// The user's numeric id, 4294967295 when there is no user. Each call asks the
    /// platform unless the session facts hold it.
    unsigned int GetLoginUID() const;

    /// The classes of user that the API admits, as a mask: 1 admin.local,
    /// 2 admin.domain, 4 admin.ldap, 8 normal.local, 16 normal.domain, 32 normal.ldap.
    int GetAllowUser() const;

    /// The URL under which the client reached the entry: scheme, host (IPv6
    /// literals with their brackets) and port, or the default. Name and path are
    /// not kept: these two always answer their default.
    std::string GetURLProto(const std::string& fallback) const;
    std::string GetURLHost(const std::string& fallback) const;
    int GetURLPort(int fallback) const;
    std::string GetURLName(const std::string& fallback) const;
    std::string GetURLPath(const std::string& fallback) const;

    /// The client's address, "" when it is not known.
    std::string GetRemoteIP() const;

    /// Client types are not kept: all of these always answer false.
    bool IsMobile() const;
    bool IsIPhone() const;
    bool IsAndroid() const;
    bool IsIEMobile() const;
    bool IsIPad() const;
    bool IsPlayBook() const;
    bool IsBlackBerry6() const;
    bool IsWebKit() const;
    bool IsSupportWebApp() const;

    /// The preference folder of the login user, or of a group; "/tmp" when there is none.
    std::string GetPreferenceDir() const;
    std::string GetGroupPreferenceDir(const std::string& group) const;

    /// Whether the body is one slice of a file, or any upload (multipart or slice).
    bool IsSliceUploadRequest() const;
    bool IsUploadRequest() const;

    /// Whether this is the child that runs a background task, and the task's full id.
    bool IsPollingTask() const;
    std::string GetPollingTaskId() const;

    /// Typed parameters: each checks the JSON type, then asks the validator
    /// (null accepts all). See APIParameter for the states of the result.
    APIParameter<int> GetAndCheckInt(const std::string& name, PARAM_NECESSITY necessity,
                                     APIParameter<int>::Validator validator) const;
    APIParameter<bool> GetAndCheckBool(const std::string& name, PARAM_NECESSITY necessity,
                                       APIParameter<bool>::Validator validator) const;
    APIParameter<double> GetAndCheckReal(const std::string& name, PARAM_NECESSITY necessity,
                                         APIParameter<double>::Validator validator) const;
    APIParameter<std::string> GetAndCheckString(
        const std::string& name, PARAM_NECESSITY necessity,
        APIParameter<std::string>::Validator validator) const;
    APIParameter<Json::Value> GetAndCheckObject(
        const std::string& name, PARAM_NECESSITY necessity,
        APIParameter<Json::Value>::Validator validator) const;
    APIParameter<Json::Value> GetAndCheckArray(
        const std::string& name, PARAM_NECESSITY necessity,
        APIParameter<Json::Value>::Validator validator) const;

    /// An array, or a single value wrapped into one. A null is wrapped too, so
    /// this operation never answers the null state.
    APIParameter<Json::Value> GetAndCheckUnitArray(
        const std::string& name, PARAM_NECESSITY necessity,
        APIParameter<Json::Value>::Validator validator) const;

    /// For unsigned int, long long and unsigned long long.
    template <typename T>
    APIParameter<T> GetAndCheckIntegral(const std::string& name, PARAM_NECESSITY necessity,
                                        typename APIParameter<T>::Validator validator) const;

  private:
    APIRequestPrivate* d;
};

extern template WEBAPI_EXPORT APIParameter<unsigned int> APIRequest::GetAndCheckIntegral(
    const std::string&, PARAM_NECESSITY, APIParameter<unsigned int>::Validator) const;
extern template WEBAPI_EXPORT APIParameter<long long> APIRequest::GetAndCheckIntegral(
    const std::string&, PARAM_NECESSITY, APIParameter<long long>::Validator) const;
extern template WEBAPI_EXPORT APIParameter<unsigned long long> APIRequest::GetAndCheckIntegral(
    const std::string&, PARAM_NECESSITY, APIParameter<unsigned long long>::Validator) const;

}  // namespace TALO

#endif
