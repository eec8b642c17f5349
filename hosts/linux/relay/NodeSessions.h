#ifndef TALO_HOSTS_LINUX_RELAY_NODESESSIONS_H
#define TALO_HOSTS_LINUX_RELAY_NODESESSIONS_H

#include <string>

#include "hosts/linux/cgi/Caller.h"
#include "hosts/linux/sdk/Nodes.h"

namespace host {

// The sessions that this appliance has at others, one for each appliance, user and
// language: to open one for every call would cost a second request each time. They
// lie in a folder that only the web API's user may enter and are gone with a
// restart. One that is lost is opened anew, so nothing here fails a call.

// Whether a text may stand in a cookie as it is. Other ids are not sent.
bool IsNodeSession(const std::string& id);

// "" when none is kept. What is kept counts only for the place and the number that
// it was opened with: an appliance that moved is not told the session of the one
// that was there before.
std::string KeptNodeSession(const talo::Node& node, const Caller& caller);

void KeepNodeSession(const talo::Node& node, const Caller& caller, const std::string& id);
void ForgetNodeSession(const talo::Node& node, const Caller& caller);

}  // namespace host

#endif
