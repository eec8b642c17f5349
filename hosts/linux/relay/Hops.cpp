#include "hosts/linux/relay/Hops.h"

namespace host {

bool NextHop(const char* came, int* hops) {
    int count = 0;
    for (const char* at = came != nullptr ? came : ""; *at != '\0'; ++at) {
        if (*at < '0' || *at > '9') {
            count = 0;
            break;
        }
        // However long the number is, it stays just too large.
        count = count > kMostHops ? count : count * 10 + (*at - '0');
    }
    if (count >= kMostHops) {
        return false;
    }
    *hops = count + 1;
    return true;
}

}  // namespace host
