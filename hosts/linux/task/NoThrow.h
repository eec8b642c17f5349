#ifndef TALO_HOSTS_LINUX_TASK_NOTHROW_H
#define TALO_HOSTS_LINUX_TASK_NOTHROW_H

#include <exception>

#include "hosts/linux/util/HostLog.h"

namespace host {

// Nothing throws over the platform's boundary: what does answers the fallback.
template <typename Result, typename Step>
Result NoThrow(const Result& fallback, Step step) {
    static constexpr char kSource[] = "NoThrow.h";
    try {
        return step();
    } catch (const std::exception& problem) {
        HOST_LOG("the task manager failed: %s", problem.what());
        return fallback;
    }
}

}  // namespace host

#endif
