#ifndef TALO_HOSTS_LINUX_FILE_GUARD_H
#define TALO_HOSTS_LINUX_FILE_GUARD_H

#include <exception>

#include "hosts/linux/util/HostLog.h"

namespace host {

// Memory, jsoncpp and a caller's visitor may throw; what is offered to others
// may not.
template <typename Result, typename Body>
Result Guarded(Result fallback, Body body) {
    try {
        return body();
    } catch (const std::exception& caught) {
        LogAt("file", 0, "%s", caught.what());
        return fallback;
    }
}

}  // namespace host

#endif
