#ifndef TALO_HOSTS_LINUX_RELAY_HOPS_H
#define TALO_HOSTS_LINUX_RELAY_HOPS_H

namespace host {

// The header by which appliances count how many of them a call came over, so that
// one that goes in circles ends.
constexpr char kHopsHeader[] = "X-Relay-Hops";
constexpr char kHopsVariable[] = "HTTP_X_RELAY_HOPS";
constexpr int kMostHops = 4;

// The number that a call goes on with, out of the one that it came with (may be
// null). What is no number in decimal digits did not come from an appliance and is
// none. False, and `hops` untouched, when it came over too many.
bool NextHop(const char* came, int* hops);

}  // namespace host

#endif
