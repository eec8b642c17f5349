#ifndef TALO_HOSTS_LINUX_TASK_WAIT_H
#define TALO_HOSTS_LINUX_TASK_WAIT_H

#include <string>

#include "hosts/linux/task/TaskModule.h"

namespace host {

// Waits until the record has the property, for so many seconds at most. Ends at
// once when the record is gone or the store cannot be used.
TaloTaskAnswer WaitForProperty(long long number, const std::string& name, unsigned long seconds);

}  // namespace host

#endif
