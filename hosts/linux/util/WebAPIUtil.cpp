#include "platform/WebAPIUtil.h"

#include <exception>

#include "hosts/linux/util/HostLog.h"
#include "hosts/linux/util/JsonFile.h"
#include "hosts/linux/util/ParameterLine.h"
#include "hosts/linux/util/Percent.h"
#include "hosts/linux/util/SzHash.h"

namespace TALO {

namespace {
constexpr char kSource[] = "WebAPIUtil.cpp";
}

bool WebAPIUtil::ReadJsonFile(Json::Value& out, const char* path) {
    std::string reason;
    try {
        if (host::ReadJsonFile(out, path, &reason)) {
            return true;
        }
    } catch (const std::exception& exception) {
        reason = exception.what();
    }
    HOST_LOG("cannot read %s: %s", path != nullptr ? path : "(null)", reason.c_str());
    return false;
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
    try {
        return host::MergeParameterLine(line, out, decode, parseJson);
    } catch (const std::exception& exception) {
        HOST_LOG("cannot read a parameter line: %s", exception.what());
        return false;
    }
}

bool WebAPIUtil::SzHashToJsonObj(const TALOSZHASH* hash, Json::Value& out) {
    try {
        return host::HashToJson(hash, out);
    } catch (const std::exception& exception) {
        HOST_LOG("cannot copy a hash: %s", exception.what());
        return false;
    }
}

}  // namespace TALO
