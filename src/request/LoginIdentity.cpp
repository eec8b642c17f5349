#include "platform/Cgi.h"
#include "src/base/JsonConvert.h"
#include "src/base/UserClass.h"
#include "src/request/APIRequestPrivate.h"
#include "webapi/APIRequest.h"

namespace TALO {

namespace {
constexpr unsigned int kNoUser = 4294967295u;
}

int APIRequest::GetAllowUser() const {
    const int known = ToInt(d->GetData("session", "allowUser", 0), 0);
    if (known != 0) {
        return known;
    }
    const Json::Value list = d->GetData("reqLib", "allowUser", Json::Value(Json::arrayValue));
    if (!list.isArray() || list.empty()) {
        return 0;
    }
    int mask = 0;
    for (const Json::Value& entry : list) {
        mask |= entry.isString() ? UserClassBit(entry.asString()) : 0;
    }
    d->SetData("session", "allowUser", mask, false);
    return mask;
}

unsigned int APIRequest::GetLoginUID() const {
    return d->GetLoginUID();
}

// The answer is handed to the store in a form that it refuses, so that the
// platform is asked again on every call: the session may have ended meanwhile.
unsigned int APIRequestPrivate::GetLoginUID() {
    if (HasData("session", "uid")) {
        return ToUInt(GetData("session", "uid", Json::Value()), kNoUser);
    }
    const std::string session = ToText(GetData("cookie", "id", ""));
    const std::string user = ToText(GetData("session", "username", ""));
    if (user.empty()) {
        return kNoUser;
    }
    const int uid = TaloCgiUIDGet(session.c_str(), user.c_str());
    SetData("session", Json::Value("uid"), uid != 0);
    return static_cast<unsigned int>(uid);
}

}  // namespace TALO
