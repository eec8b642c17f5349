#include "hosts/linux/sdk/Cipher.h"

#include <ctime>
#include <string>

#include "Session.h"
#include "webapi/APIResponse.h"

void Cipher(TALO::APIRequest*, TALO::APIResponse* response) {
    talo::CipherKey key;
    const std::string token = talo::NewCipherToken();
    if (token.empty() || !talo::PublicCipherKey(&key)) {
        response->SetError(kNoCipher, Json::Value());
        return;
    }
    Json::Value data(Json::objectValue);
    data["key"] = key.key;
    data["key_id"] = key.id;
    data["token"] = token;
    data["time"] = static_cast<Json::Int64>(time(nullptr));
    response->SetSuccess(data);
}
