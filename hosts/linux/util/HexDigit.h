#ifndef TALO_HOSTS_LINUX_UTIL_HEXDIGIT_H
#define TALO_HOSTS_LINUX_UTIL_HEXDIGIT_H

namespace host {

// What a hexadecimal digit stands for, in whatever locale; -1 for another byte.
inline int HexValue(char byte) {
    if (byte >= '0' && byte <= '9') {
        return byte - '0';
    }
    if (byte >= 'a' && byte <= 'f') {
        return byte - 'a' + 10;
    }
    if (byte >= 'A' && byte <= 'F') {
        return byte - 'A' + 10;
    }
    return -1;
}

}  // namespace host

#endif
