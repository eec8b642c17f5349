#include "hosts/linux/net/Address.h"

#include <arpa/inet.h>
#include <sys/socket.h>

namespace host {

// These are the numbers that every caller of the platform knows.
static_assert(AF_INET == 2 && AF_INET6 == 10 && AF_UNSPEC == 0, "families of addresses");

int AddressFamily(const char* text) {
    unsigned char bytes[sizeof(in6_addr)];
    if (text == nullptr) {
        return AF_UNSPEC;
    }
    if (inet_pton(AF_INET, text, bytes) == 1) {
        return AF_INET;
    }
    return inet_pton(AF_INET6, text, bytes) == 1 ? AF_INET6 : AF_UNSPEC;
}

}  // namespace host
