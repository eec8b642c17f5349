#include "src/request/APIRequestPrivate.h"
#include "src/request/Carriers.h"

namespace TALO {

bool APIRequestPrivate::DecryptParam(Json::Value& params) {
    if (TakeCarrier(params, kCipherText, nullptr) != Carrier::kAbsent) {
        return false;
    }
    if (!params.empty() && !DecryptAESParam(params)) {
        return false;
    }
    Json::Value* nested = NestedObject(params);
    return nested == nullptr || DecryptParam(*nested);
}

bool APIRequestPrivate::DecryptAESParam(Json::Value& params) {
    return DecryptAESCarriers(params);
}

}  // namespace TALO
