#ifndef TALO_HOSTS_LINUX_TASK_SWEEP_H
#define TALO_HOSTS_LINUX_TASK_SWEEP_H

#include "hosts/linux/task/Connection.h"

namespace host {

// Tidies the store, unless some process has done so within the last minute: ends
// the records of processes that are gone, and drops finished ones whose time is
// over. A failure is logged and left to the next one.
void SweepIfDue(Connection* connection);

}  // namespace host

#endif
