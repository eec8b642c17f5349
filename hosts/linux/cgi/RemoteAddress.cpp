#include "hosts/linux/cgi/RemoteAddress.h"

#include <string.h>

#include <cstdlib>

#include "hosts/linux/conf/KeyValueFile.h"
#include "hosts/linux/util/Network.h"
#include "hosts/linux/util/ParameterLine.h"
#include "platform/Cgi.h"

namespace host {

namespace {

// A header of more hops is read from its end only so far.
constexpr int kMaxHops = 32;

bool IsTrusted(const std::string& address, const Json::Value& networks) {
    for (const Json::Value& network : networks) {
        if (InNetwork(address, network.asString())) {
            return true;
        }
    }
    return false;
}

std::string Variable(const char* name) {
    const char* value = std::getenv(name);
    return value != nullptr ? value : "";
}

}  // namespace

std::string ClientAddress(const std::string& peer, const std::string& forwardedFor,
                          const std::string& trusted) {
    std::string client = CanonicalAddress(peer);
    if (client.empty() || forwardedFor.empty() || trusted.empty()) {
        return client;
    }
    const Json::Value networks = SplitTrimmed(trusted, ",");
    const Json::Value hops = SplitTrimmed(forwardedFor, ",");
    int looked = 0;
    for (Json::ArrayIndex hop = hops.size(); hop > 0 && looked < kMaxHops; --hop, ++looked) {
        if (!IsTrusted(client, networks)) {
            break;
        }
        const std::string before = CanonicalAddress(hops[hop - 1].asString());
        if (before.empty()) {
            break;
        }
        client = before;
    }
    return client;
}

std::string ClientAddress() {
    return ClientAddress(Variable("REMOTE_ADDR"), Variable("HTTP_X_FORWARDED_FOR"),
                         HostSetting("trusted_proxies", ""));
}

}  // namespace host

extern "C" int TaloCgiGetRemoteIP(char* buffer, size_t size) {
    const std::string address = host::ClientAddress();
    if (buffer == nullptr || address.empty() || address.size() >= size) {
        return -1;
    }
    memcpy(buffer, address.c_str(), address.size() + 1);
    return 0;
}
