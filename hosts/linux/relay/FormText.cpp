#include "hosts/linux/relay/FormText.h"

#include <algorithm>
#include <iterator>

#include "hosts/linux/util/Percent.h"

namespace host {

namespace {

const char* const kDropped[] = {"_sid", "api", "method", "relay_nd", "relay_timeout", "version"};

bool IsDropped(const std::string& name) {
    return std::find(std::begin(kDropped), std::end(kDropped), name) != std::end(kDropped);
}

// 17 digits bring every double back as it was.
Json::StreamWriterBuilder Writer() {
    Json::StreamWriterBuilder builder;
    builder["indentation"] = "";
    builder["emitUTF8"] = true;
    builder["precision"] = 17;
    return builder;
}

}  // namespace

std::string CallText(const std::string& api, int version, const std::string& method) {
    return "api=" + PercentEncode(api) + "&version=" + std::to_string(version) +
           "&method=" + PercentEncode(method);
}

std::string FormText(const std::string& api, int version, const std::string& method,
                     const Json::Value& params) {
    std::string text = CallText(api, version, method);
    const Json::StreamWriterBuilder writer = Writer();
    for (Json::Value::const_iterator at = params.begin(); at != params.end(); ++at) {
        const std::string name = at.name();
        if (!IsDropped(name)) {
            text += "&" + PercentEncode(name) + "=";
            text += PercentEncode(Json::writeString(writer, *at));
        }
    }
    return text;
}

std::string WithoutQuery(const std::string& url) {
    return url.substr(0, url.find('?'));
}

std::string WithQuery(const std::string& url, const std::string& query) {
    const size_t mark = url.find('?');
    if (mark == std::string::npos) {
        return url + "?" + query;
    }
    return mark + 1 == url.size() || url.back() == '&' ? url + query : url + "&" + query;
}

}  // namespace host
