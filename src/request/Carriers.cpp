#include "src/request/Carriers.h"

#include <vector>

#include "platform/Cgi.h"
#include "platform/CredRequest.h"
#include "platform/WebAPIUtil.h"
#include "src/base/JsonConvert.h"

namespace TALO {

namespace {

// The text of a key and its final zero.
constexpr size_t kKeyBytes = 33;

}  // namespace

const char kCipherText[] = "__cIpHeRtExT";
const char kCipherToken[] = "__cIpHeRtOkEn";
const char kAESText[] = "__tXeTrEhPiC";
const char kAESToken[] = "__nEkOtReHpIc";
const char kNestedObject[] = "webapi";

bool TakeCarrier(Json::Value& params, const char* name, std::string* text) {
    const Json::Value* found = FindMember(&params, name);
    if (found == nullptr) {
        return false;
    }
    *text = ToText(*found);
    params.removeMember(name);
    return true;
}

Json::Value* NestedObject(Json::Value& params) {
    const Json::Value* found = FindMember(&params, kNestedObject);
    return found != nullptr && found->isObject() ? &params[kNestedObject] : nullptr;
}

bool MergeDeciphered(const std::string& text, int (*decipher)(char*), Json::Value& params) {
    std::vector<char> copy(text.c_str(), text.c_str() + text.size() + 1);
    return decipher(copy.data()) != 0 &&
           WebAPIUtil::strPairToJsonObj(copy.data(), params, true, true);
}

bool DecryptAESCarriers(Json::Value& params) {
    if (FindMember(&params, kAESToken) == nullptr || FindMember(&params, kAESText) == nullptr) {
        return true;
    }
    std::string token;
    std::string text;
    (void)TakeCarrier(params, kAESToken, &token);
    (void)TakeCarrier(params, kAESText, &text);
    if (token.empty() || text.empty()) {
        return false;
    }
    char key[kKeyBytes] = {};
    std::string line;
    return TALONdtokenGenerateToken(token.c_str(), key, sizeof key) >= 0 &&
           CredRequestUtil::GetDecryptAESString(key, text, line) &&
           WebAPIUtil::strPairToJsonObj(line, params, true, true);
}

}  // namespace TALO
