#ifndef TALO_HOSTS_LINUX_CGI_STATE_H
#define TALO_HOSTS_LINUX_CGI_STATE_H

#include <map>
#include <string>

#include "hosts/linux/sdk/Sessions.h"

// What hangs on a context.
struct TALOCGIState {
    std::string prefix;
    std::map<std::string, std::string> cookies;  // by name; the last of a name counts
    bool allowTimeout = false;                   // timed-out sessions count
    talo::Session session;                       // the one found last
    std::string timeoutText;                     // its time-out as TaloCgiGetOption answers it
};

#endif
