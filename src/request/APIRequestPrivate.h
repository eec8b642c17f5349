#ifndef TALO_SRC_REQUEST_APIREQUESTPRIVATE_H
#define TALO_SRC_REQUEST_APIREQUESTPRIVATE_H

#include <string>

#include "webapi/APIBase.h"
#include "webapi/APIRequest.h"

namespace TALO {

// What GetRequestMethod answers.
enum RequestMethod { kMethodOther = 0, kMethodGet = 1, kMethodPost = 2, kMethodHead = 3 };

class APIRequestPrivate : public APIBase {
  public:
    explicit APIRequestPrivate(APIRequest* owner);
    virtual ~APIRequestPrivate();

    void SetAPIDesc(const Json::Value& params);
    void InitRequestMethod();
    void InitCookie();

    // Deciphers the carriers of enciphered parameters in place. False when one
    // could not be read; it is gone from the object all the same.
    bool DecryptParam(Json::Value& params);
    bool DecryptAESParam(Json::Value& params);

    // The parts of the URL and the client flags are worked out on each use.
    void InitURL();
    bool ParseProtocol();
    bool ParseHostAndPort();
    bool ParsePathAndName();
    void InitUA();
    bool ClientFlag(const char* key);

    unsigned int GetLoginUID();

    template <typename T>
    APIParameter<T> GetAndCheckParam(const std::string& name, bool required, Json::ValueType type,
                                     typename APIParameter<T>::Validator validator) {
        APIParameter<T> parameter;
        if (HasData("param", name)) {
            parameter.CheckValueTypeAndGet(GetData("param", name, Json::Value::nullSingleton()),
                                           type, validator);
        } else if (required) {
            parameter.MarkInvalid();
        }
        return parameter;
    }

    APIParameter<Json::Value> GetAndCheckUnitArrayParam(
        const std::string& name, bool required, APIParameter<Json::Value>::Validator validator);

    std::string api;
    int version = 0;
    std::string method;
    int requestMethod = kMethodOther;
    APIRequest* owner;
    Json::Value unused;
};

}  // namespace TALO

#endif
