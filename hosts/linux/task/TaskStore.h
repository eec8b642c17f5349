#ifndef TALO_HOSTS_LINUX_TASK_TASKSTORE_H
#define TALO_HOSTS_LINUX_TASK_TASKSTORE_H

#include <string>

#include "hosts/linux/task/TaskModule.h"

namespace host {

// The module with the store, opened when it is first wanted and ready for use.
// Null, logged, when it is missing.
const TaloTaskModule* TaskStore();

// Opens a module. Null when it is missing or is none; the reason is logged. It
// stays for the life of the process.
const TaloTaskModule* OpenTaskModule(const std::string& path);

}  // namespace host

#endif
