#ifndef TALO_HOSTS_LINUX_TASK_RECORDCHANGES_H
#define TALO_HOSTS_LINUX_TASK_RECORDCHANGES_H

#include <cstddef>

#include "hosts/linux/task/Connection.h"
#include "hosts/linux/task/TaskModule.h"

namespace host {

// Each is stored whole or not at all, and none makes a record that is gone.
TaloTaskAnswer WriteProperties(Connection* connection, long long number,
                               const TaloTaskText* properties, size_t count);
TaloTaskAnswer SetProcess(Connection* connection, long long number, const TaloTaskProcess& process);
TaloTaskAnswer FinishRecord(Connection* connection, long long number, bool autoRemove);
TaloTaskAnswer RemoveRecord(Connection* connection, long long number);

}  // namespace host

#endif
