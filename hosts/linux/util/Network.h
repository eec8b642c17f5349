#ifndef TALO_HOSTS_LINUX_UTIL_NETWORK_H
#define TALO_HOSTS_LINUX_UTIL_NETWORK_H

#include <string>

namespace host {

// Whether an address lies in a network: "192.168.0.0/16", "fd00::/8", or a
// single address. IPv4 written as IPv6 ("::ffff:10.0.0.1") is that IPv4 address,
// and a network of at least 96 bits in that form is the IPv4 network. The
// network's bits behind the prefix are ignored. False for a text that is no
// address or no network: host names, scopes ("%eth0"), short forms ("10.1") and
// prefixes with a sign, a blank or a leading zero are none.
bool InNetwork(const std::string& address, const std::string& network);

// Whether InNetwork understands the text as an address, or as a network.
bool IsAddress(const std::string& address);
bool IsNetwork(const std::string& network);

// The one spelling of an address by which it can be compared and counted: an
// IPv4 address for IPv4 written as IPv6, IPv6 shortened and in lower case. ""
// for a text that is no address.
std::string CanonicalAddress(const std::string& address);

}  // namespace host

#endif
