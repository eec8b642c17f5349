#ifndef TALO_HOSTS_LINUX_CGI_SESSIONSTORE_H
#define TALO_HOSTS_LINUX_CGI_SESSIONSTORE_H

#include <string>

#include "hosts/linux/sdk/Sessions.h"

namespace host {

// The folder of the session files, without links in its path; it is made when
// it is missing. Every request looks for it anew when it begins, and takes the
// one found from then on.
std::string FindSessionDir();
std::string SessionDir();

// Whether the session has gone unused for longer than it may: its own minutes, or
// those given. A last use in the future, after a clock was set back, counts as
// now.
bool HasTimedOut(const talo::Session& session, int defaultMinutes, long long now);

// Ends every session that the appliance has opened.
void EndSessionsOfNode(long long node);

}  // namespace host

#endif
