#include <strings.h>

#include "platform/Cgi.h"
#include "src/base/JsonConvert.h"
#include "src/request/APIRequestPrivate.h"
#include "webapi/APIRequest.h"

namespace TALO {

// The flag is handed to the store in a form that it refuses, so the parts are
// parsed again on every use. Callers change the environment in between and rely
// on seeing it.
void APIRequestPrivate::InitURL() {
    if (HasData("url", "initialized")) {
        return;
    }
    SetData("url", Json::Value("initialized"), true);
    (void)ParseProtocol();
    (void)ParseHostAndPort();
    (void)ParsePathAndName();
}

bool APIRequestPrivate::ParseProtocol() {
    const std::string https = ToText(GetData("environ", "HTTPS", ""));
    const std::string forwarded = ToText(GetData("environ", "HTTP_X_FORWARDED_PROTO", ""));
    if (strcasecmp(https.c_str(), "ON") == 0 || strcasecmp(forwarded.c_str(), "https") == 0) {
        return SetData("url", "urlProto", "https", true);
    }
    const std::string uri = ToText(GetData("environ", "SCRIPT_URI", ""));
    return SetData("url", "urlProto", uri.substr(0, uri.find(':')), true);
}

bool APIRequestPrivate::ParseHostAndPort() {
    const std::string text = ToText(GetData("environ", "HTTP_HOST", ""));
    if (text.empty()) {
        return false;
    }
    size_t hostEnd = text.rfind(':');
    if (text[0] == '[') {
        const size_t bracket = text.rfind(']');
        if (bracket == std::string::npos) {
            return false;
        }
        hostEnd = bracket + 1;
    }
    const std::string host = text.substr(0, hostEnd);
    const size_t colon = text.find(':', host.size());
    std::string port = colon == std::string::npos ? std::string() : text.substr(colon + 1);
    if (port.empty()) {
        const std::string scheme = ToText(GetData("url", "urlProto", ""));
        port = scheme == "http" ? "80" : scheme == "https" ? "443" : "";
    }
    return SetData("url", "urlHost", host, true) && SetData("url", "urlPort", port, true);
}

// Path and name are worked out and not kept: the getters answer their default.
bool APIRequestPrivate::ParsePathAndName() {
    const std::string script = ToText(GetData("environ", "SCRIPT_NAME", ""));
    return script.find('/') != std::string::npos;
}

std::string APIRequest::GetURLProto(const std::string& fallback) const {
    d->InitURL();
    return ToText(d->GetData("url", "urlProto", fallback));
}

std::string APIRequest::GetURLHost(const std::string& fallback) const {
    d->InitURL();
    return ToText(d->GetData("url", "urlHost", fallback));
}

int APIRequest::GetURLPort(int fallback) const {
    d->InitURL();
    return ToInt(d->GetData("url", "urlPort", fallback), fallback);
}

std::string APIRequest::GetURLName(const std::string& fallback) const {
    d->InitURL();
    return ToText(d->GetData("url", "urlName", fallback));
}

std::string APIRequest::GetURLPath(const std::string& fallback) const {
    d->InitURL();
    return ToText(d->GetData("url", "urlPath", fallback));
}

std::string APIRequest::GetRemoteIP() const {
    if (!d->HasData("environ", "talo_remoteIP")) {
        char address[65] = {};
        if (TaloCgiGetRemoteIP(address, sizeof address) == 0) {
            d->SetData("environ", "talo_remoteIP", address, true);
        }
    }
    return ToText(d->GetData("environ", "talo_remoteIP", ""));
}

}  // namespace TALO
