#include "apis/common/TextParameter.h"

#include "webapi/APIRequest.h"

bool ReadTypedText(const TALO::APIRequest& request, const std::string& name, std::string* out) {
    if (!request.HasParam(name)) {
        return false;
    }
    const Json::Value value = request.GetParam(name, Json::Value());
    switch (value.type()) {
        case Json::nullValue:
            *out = "null";
            return true;
        case Json::stringValue:
        case Json::intValue:
        case Json::uintValue:
        case Json::booleanValue:
            *out = value.asString();
            return true;
        default:
            return false;
    }
}
