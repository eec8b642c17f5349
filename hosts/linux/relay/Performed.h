#ifndef TALO_HOSTS_LINUX_RELAY_PERFORMED_H
#define TALO_HOSTS_LINUX_RELAY_PERFORMED_H

#include <vector>

#include "hosts/linux/relay/NodeCall.h"

namespace host {

// Makes the calls that were prepared and waits until each is done.
void PerformNodeCalls(const std::vector<NodeCall*>& calls);

}  // namespace host

#endif
