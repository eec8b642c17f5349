#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <string>

#include "hosts/linux/util/JsonGrammar.h"
#include "platform/WebAPIUtil.h"
#include "src/base/JsonText.h"

// A parameter line: the first byte chooses the switches, the rest is the line.

namespace {

void Require(bool condition) {
    if (!condition) {
        abort();
    }
}

void CheckAccepted(const std::string& line, const Json::Value& params) {
    Require(params.isObject());
    Require(params.size() <= TALO::WebAPIUtil::kMaxPairs);
    // What came in has to go out again as JSON that anybody can read.
    const std::string text = TALO::toString(params);
    host::JsonError error;
    Require(host::AcceptJson(text.data(), text.data() + text.size(),
                             TALO::WebAPIUtil::kMaxJsonDepth + 1, &error));
    Require(text.find_first_of("<>&") == std::string::npos);
    // The same line again changes nothing.
    Json::Value again = params;
    Require(TALO::WebAPIUtil::strPairToJsonObj(line, again, true, true));
    Json::Value once;
    Require(TALO::WebAPIUtil::strPairToJsonObj(line, once, true, true));
    Require(TALO::toString(again) == TALO::toString(once));
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    if (size == 0) {
        return 0;
    }
    const std::string line(reinterpret_cast<const char*>(data) + 1, size - 1);
    const bool decode = (data[0] & 1) != 0;
    const bool parseJson = (data[0] & 2) != 0;
    Json::Value params;
    const bool accepted = TALO::WebAPIUtil::strPairToJsonObj(line, params, decode, parseJson);
    if (accepted && decode && parseJson) {
        CheckAccepted(line, params);
    }
    Require(TALO::WebAPIUtil::URLDecode(TALO::WebAPIUtil::URLEncode(line), true) == line);
    (void)TALO::WebAPIUtil::ParseToArray(line, ";");
    return 0;
}
