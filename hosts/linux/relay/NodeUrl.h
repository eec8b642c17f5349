#ifndef TALO_HOSTS_LINUX_RELAY_NODEURL_H
#define TALO_HOSTS_LINUX_RELAY_NODEURL_H

#include <cstddef>
#include <string>

namespace host {

constexpr size_t kMaxUrlBytes = 2048;

// Whether an appliance can be called by the URL: "https://HOST[:PORT]/PATH[?QUERY]"
// and nothing else that a URL may have. A user's name would go on to the other
// side, and a fragment never does. HOST is a name in its ASCII form, an IPv4
// address or an IPv6 address in brackets; what cannot stand in a request line as
// it is has to be percent-encoded.
bool IsNodeUrl(const std::string& url);

}  // namespace host

#endif
