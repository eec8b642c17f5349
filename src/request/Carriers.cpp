#include "src/request/Carriers.h"

#include "src/base/JsonConvert.h"

namespace TALO {

const char kCipherText[] = "__cIpHeRtExT";
const char kCipherToken[] = "__cIpHeRtOkEn";
const char kAESText[] = "__tXeTrEhPiC";
const char kAESToken[] = "__nEkOtReHpIc";
const char kNestedObject[] = "webapi";

Carrier TakeCarrier(Json::Value& params, const char* name, std::string* text) {
    const Json::Value* found = FindMember(&params, name);
    if (found == nullptr) {
        return Carrier::kAbsent;
    }
    const bool readable = found->isString();
    if (readable && text != nullptr) {
        *text = found->asString();
    }
    params.removeMember(name);
    return readable ? Carrier::kText : Carrier::kUnreadable;
}

Json::Value* NestedObject(Json::Value& params) {
    const Json::Value* found = FindMember(&params, kNestedObject);
    return found != nullptr && found->isObject() ? &params[kNestedObject] : nullptr;
}

bool DecryptAESCarriers(Json::Value& params) {
    if (FindMember(&params, kAESToken) == nullptr || FindMember(&params, kAESText) == nullptr) {
        return true;
    }
    // No cipher is on board: the carriers go, and what they held is missing.
    (void)TakeCarrier(params, kAESToken, nullptr);
    (void)TakeCarrier(params, kAESText, nullptr);
    return false;
}

}  // namespace TALO
