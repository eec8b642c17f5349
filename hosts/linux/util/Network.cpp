#include "hosts/linux/util/Network.h"

#include <arpa/inet.h>
#include <string.h>
#include <sys/socket.h>

namespace host {

namespace {

constexpr unsigned char kMappedPrefix[12] = {0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0xff, 0xff};
constexpr unsigned kMappedBits = 96;

struct Address {
    int family = AF_UNSPEC;
    unsigned bits = 0;
    unsigned char bytes[16] = {};
};

// Without the mapping of IPv4 in IPv6. inet_pton stops at a NUL, which a text
// that came from outside may hold.
bool ParseAsWritten(const std::string& text, Address* address) {
    if (text.find('\0') != std::string::npos) {
        return false;
    }
    if (inet_pton(AF_INET, text.c_str(), address->bytes) == 1) {
        address->family = AF_INET;
        address->bits = 32;
        return true;
    }
    if (inet_pton(AF_INET6, text.c_str(), address->bytes) == 1) {
        address->family = AF_INET6;
        address->bits = 128;
        return true;
    }
    return false;
}

bool IsMapped(const Address& address) {
    return address.family == AF_INET6 &&
           memcmp(address.bytes, kMappedPrefix, sizeof kMappedPrefix) == 0;
}

void Unmap(Address* address) {
    memmove(address->bytes, address->bytes + sizeof kMappedPrefix, 4);
    address->family = AF_INET;
    address->bits = 32;
}

bool ParseAddress(const std::string& text, Address* address) {
    if (!ParseAsWritten(text, address)) {
        return false;
    }
    if (IsMapped(*address)) {
        Unmap(address);
    }
    return true;
}

bool ParsePrefix(const std::string& text, unsigned max, unsigned* prefix) {
    if (text.empty() || text.size() > 3 || (text.size() > 1 && text[0] == '0')) {
        return false;
    }
    unsigned value = 0;
    for (const char digit : text) {
        if (digit < '0' || digit > '9') {
            return false;
        }
        value = value * 10 + static_cast<unsigned>(digit - '0');
    }
    *prefix = value;
    return value <= max;
}

bool ParseNetwork(const std::string& text, Address* address, unsigned* prefix) {
    const size_t slash = text.find('/');
    if (!ParseAsWritten(text.substr(0, slash), address)) {
        return false;
    }
    *prefix = address->bits;
    if (slash != std::string::npos && !ParsePrefix(text.substr(slash + 1), address->bits, prefix)) {
        return false;
    }
    if (IsMapped(*address) && *prefix >= kMappedBits) {
        Unmap(address);
        *prefix -= kMappedBits;
    }
    return true;
}

bool SameBits(const unsigned char* left, const unsigned char* right, unsigned bits) {
    const unsigned whole = bits / 8;
    if (memcmp(left, right, whole) != 0) {
        return false;
    }
    const unsigned rest = bits % 8;
    return rest == 0 || (left[whole] ^ right[whole]) >> (8 - rest) == 0;
}

}  // namespace

bool InNetwork(const std::string& address, const std::string& network) {
    Address caller;
    Address base;
    unsigned prefix = 0;
    return ParseAddress(address, &caller) && ParseNetwork(network, &base, &prefix) &&
           caller.family == base.family && SameBits(caller.bytes, base.bytes, prefix);
}

bool IsAddress(const std::string& address) {
    Address parsed;
    return ParseAddress(address, &parsed);
}

bool IsNetwork(const std::string& network) {
    Address base;
    unsigned prefix = 0;
    return ParseNetwork(network, &base, &prefix);
}

std::string CanonicalAddress(const std::string& address) {
    Address parsed;
    char text[INET6_ADDRSTRLEN];
    if (!ParseAddress(address, &parsed) ||
        inet_ntop(parsed.family, parsed.bytes, text, sizeof text) == nullptr) {
        return std::string();
    }
    return text;
}

}  // namespace host
