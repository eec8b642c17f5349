#ifndef TALO_SRC_RESPONSE_APIRESPONSEPRIVATE_H
#define TALO_SRC_RESPONSE_APIRESPONSEPRIVATE_H

#include <string>

#include "webapi/APIBase.h"
#include "webapi/APIResponse.h"

namespace ORB {
class Task;
}

namespace TALO {

class APIResponsePrivate : public APIBase {
  public:
    APIResponsePrivate(APIRequest* request, APIResponse* owner);
    virtual ~APIResponsePrivate();

    void SetError(int code, const Json::Value& details);
    void TakeResult(int code, Json::Value* details);
    // Zero minutes keep the cookie for the browser session, negative ones delete
    // it. Mind the order: the public form takes the path first.
    bool AddCookie(const std::string& name, const std::string& value, const std::string& path,
                   long expireMinutes, const std::string& domain, bool secure, bool httponly);
    bool Redirect(const std::string& path);
    void SetCallbackFunc(APIResponse::CallbackFunc function, void* argument);

    APIRequest* request;
    APIResponse* owner;
    ORB::Task* task = nullptr;
    int error = 0;
    APIResponse::CallbackList callbacks;

  private:
    void OpenTask();
    void RecordResult();
};

}  // namespace TALO

#endif
