#include "hosts/linux/cgi/CrossSite.h"

#include <strings.h>

#include <cstdlib>

#include "hosts/linux/sdk/Sessions.h"

namespace host {

namespace {

std::string Variable(const char* name) {
    const char* value = std::getenv(name);
    return value != nullptr ? value : "";
}

// "https://nas.local:5001" is of the host "nas.local:5001".
bool IsOriginOf(const std::string& origin, const std::string& host) {
    const size_t scheme = origin.find("://");
    return scheme != std::string::npos && !host.empty() &&
           strcasecmp(origin.c_str() + scheme + 3, host.c_str()) == 0;
}

}  // namespace

bool IsOwnSite(const RequestOrigin& request) {
    if (!request.origin.empty() && !IsOriginOf(request.origin, request.host)) {
        return false;
    }
    return request.fetchSite.empty() || request.fetchSite == "same-origin" ||
           request.fetchSite == "none";
}

bool IsOwnSite() {
    return IsOwnSite(
        {Variable("HTTP_ORIGIN"), Variable("HTTP_SEC_FETCH_SITE"), Variable("HTTP_HOST")});
}

}  // namespace host

bool talo::ComesFromOwnSite() {
    return host::IsOwnSite();
}
