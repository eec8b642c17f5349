#ifndef TALO_HOSTS_LINUX_CGI_CALLER_H
#define TALO_HOSTS_LINUX_CGI_CALLER_H

#include <string>

#include "hosts/linux/sdk/Sessions.h"

struct TALOCGI;

namespace host {

// For whom this process works: the user of the session that it accepted last.
struct Caller {
    std::string user;
    std::string language;  // "" for the default
};

// What a context accepted is forgotten with that context.
void SetCaller(const TALOCGI* context, const talo::Session& session);
void ForgetCaller(const TALOCGI* context);

// Forgets it whoever's it is: a context that an API library made and did not free
// must not speak for the next request.
void ForgetCaller();

// False, and `caller` untouched, when there is none.
bool FindCaller(Caller* caller);

}  // namespace host

#endif
