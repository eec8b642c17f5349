#ifndef TALO_HOSTS_LINUX_NET_ADDRESS_H
#define TALO_HOSTS_LINUX_NET_ADDRESS_H

namespace host {

// The family of a textual address: AF_INET, AF_INET6, or 0 for neither. Only full
// forms count: no short IPv4 ("10.1"), no octal or hexadecimal part, no blank, no
// bracket, no prefix, no zone id ("fe80::1%eth0"), which means something on one
// machine only.
int AddressFamily(const char* text);

}  // namespace host

#endif
