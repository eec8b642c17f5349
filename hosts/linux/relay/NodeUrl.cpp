#include "hosts/linux/relay/NodeUrl.h"

#include <string.h>
#include <sys/socket.h>

#include "hosts/linux/net/Address.h"
#include "hosts/linux/net/NameRules.h"

namespace host {

namespace {

constexpr char kScheme[] = "https://";
constexpr int kLastPort = 65535;

bool IsDigit(char byte) {
    return byte >= '0' && byte <= '9';
}

bool IsHexDigit(char byte) {
    return IsDigit(byte) || (byte >= 'a' && byte <= 'f') || (byte >= 'A' && byte <= 'F');
}

bool IsLetterOrDigit(char byte) {
    return IsDigit(byte) || (byte >= 'a' && byte <= 'z') || (byte >= 'A' && byte <= 'Z');
}

bool IsHost(const std::string& text) {
    if (!text.empty() && text.front() == '[') {
        return text.size() > 2 && text.back() == ']' &&
               AddressFamily(text.substr(1, text.size() - 2).c_str()) == AF_INET6;
    }
    return AddressFamily(text.c_str()) == AF_INET || IsHostName(text.c_str());
}

bool IsPort(const std::string& text) {
    int port = 0;
    if (text.empty() || text[0] == '0') {
        return false;
    }
    for (const char digit : text) {
        if (!IsDigit(digit) || (port = port * 10 + (digit - '0')) > kLastPort) {
            return false;
        }
    }
    return true;
}

// The brackets of an IPv6 address have colons of their own.
bool IsAuthority(const std::string& text) {
    const size_t bracket = text.rfind(']');
    const size_t colon = text.find(':', bracket == std::string::npos ? 0 : bracket);
    return IsHost(text.substr(0, colon)) &&
           (colon == std::string::npos || IsPort(text.substr(colon + 1)));
}

// A path with its query, in the characters of RFC 3986.
bool IsTarget(const std::string& text) {
    for (size_t at = 0; at < text.size(); ++at) {
        const char byte = text[at];
        if (byte == '%') {
            if (at + 2 >= text.size() || !IsHexDigit(text[at + 1]) || !IsHexDigit(text[at + 2])) {
                return false;
            }
        } else if (byte == '\0' ||
                   (!IsLetterOrDigit(byte) && strchr("-._~!$&'()*+,;=:@/?", byte) == nullptr)) {
            return false;
        }
    }
    return true;
}

}  // namespace

bool IsNodeUrl(const std::string& url) {
    constexpr size_t kStart = sizeof kScheme - 1;
    if (url.size() > kMaxUrlBytes || url.compare(0, kStart, kScheme) != 0 ||
        url.find('\0') != std::string::npos) {
        return false;
    }
    const size_t path = url.find('/', kStart);
    return path != std::string::npos && IsAuthority(url.substr(kStart, path - kStart)) &&
           IsTarget(url.substr(path));
}

}  // namespace host
