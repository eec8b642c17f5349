#ifndef TALO_HOSTS_LINUX_RELAY_OPENING_H
#define TALO_HOSTS_LINUX_RELAY_OPENING_H

#include <string>

#include "hosts/linux/cgi/Caller.h"
#include "hosts/linux/sdk/Nodes.h"

namespace host {

// How a session at another appliance is opened: a call that proves which appliance
// asks and says for whom.

// The form of the call, and how long its answer can be.
std::string OpeningText(const talo::Node& node, const Caller& caller);
constexpr size_t kMostOpeningBytes = 64 << 10;

// The id of the session out of the answer; "" when it holds none: refused.
std::string SessionOfAnswer(const std::string& answer);

}  // namespace host

#endif
