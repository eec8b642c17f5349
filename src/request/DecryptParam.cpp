#include "platform/Cgi.h"
#include "platform/WebAPIUtil.h"
#include "src/request/APIRequestPrivate.h"
#include "src/request/Carriers.h"

namespace TALO {

// Goes down the nested objects. What a client can send in one piece is no deeper
// than the bound; an enciphered line could hang another such piece to the deepest
// object of the one before, and so on. Nobody reads what is further down.
bool APIRequestPrivate::DecryptParam(Json::Value& params) {
    Json::Value* object = &params;
    for (size_t depth = 0; depth <= WebAPIUtil::kMaxJsonDepth; ++depth) {
        std::string text;
        if (TakeCarrier(*object, kCipherText, &text) &&
            !MergeDeciphered(text, TaloCgiDecryptParam, *object)) {
            return false;
        }
        if (!object->empty() && !DecryptAESParam(*object)) {
            return false;
        }
        object = NestedObject(*object);
        if (object == nullptr) {
            return true;
        }
    }
    return false;
}

bool APIRequestPrivate::DecryptAESParam(Json::Value& params) {
    return DecryptAESCarriers(params);
}

}  // namespace TALO
