#include "hosts/linux/util/JsonGrammar.h"
#include "hosts/linux/util/ParameterLine.h"
#include "hosts/linux/util/Percent.h"
#include "platform/WebAPIUtil.h"
#include "tests/fake/FakePlatform.h"

namespace TALO {

bool WebAPIUtil::ReadJsonFile(Json::Value& out, const char* path) {
    if (fake::Now().Called("ReadJsonFile") || path == nullptr) {
        return false;
    }
    const auto file = fake::Now().files.find(path);
    if (file == fake::Now().files.end() || file->second.size() > kMaxJsonFileBytes) {
        return false;
    }
    const std::string& text = file->second;
    Json::Value value;
    host::JsonError error;
    if (!host::ParseJson(text.data(), text.data() + text.size(), kMaxJsonDepth, &value, &error) ||
        !(value.isObject() || value.isArray())) {
        return false;
    }
    out.swap(value);
    return true;
}

std::string WebAPIUtil::URLDecode(const std::string& text, bool plusIsBlank) {
    return host::PercentDecode(text, plusIsBlank);
}

std::string WebAPIUtil::URLEncode(const std::string& text) {
    return host::PercentEncode(text);
}

Json::Value WebAPIUtil::ParseToArray(const std::string& text, const std::string& separator) {
    return host::SplitTrimmed(text, separator);
}

bool WebAPIUtil::strPairToJsonObj(const std::string& line, Json::Value& out, bool decode,
                                  bool parseJson) {
    return !fake::Now().Called("strPairToJsonObj") &&
           host::MergeParameterLine(line, out, decode, parseJson);
}

}  // namespace TALO
