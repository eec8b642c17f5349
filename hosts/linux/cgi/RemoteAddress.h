#ifndef TALO_HOSTS_LINUX_CGI_REMOTEADDRESS_H
#define TALO_HOSTS_LINUX_CGI_REMOTEADDRESS_H

#include <string>

namespace host {

// The client's address: the peer, or, when the peer is a trusted proxy, the last
// hop of the forwarded-for header that is none. A hop that is no address ends
// the search at the proxy that reported it: what lies before may be invented.
// `trusted` is a list of networks separated by commas. "" for a peer that is no
// address.
std::string ClientAddress(const std::string& peer, const std::string& forwardedFor,
                          const std::string& trusted);

// The same out of the environment and the host's configuration.
std::string ClientAddress();

}  // namespace host

#endif
