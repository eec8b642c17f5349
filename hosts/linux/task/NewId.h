#ifndef TALO_HOSTS_LINUX_TASK_NEWID_H
#define TALO_HOSTS_LINUX_TASK_NEWID_H

#include <string>

#include "hosts/linux/task/Connection.h"
#include "hosts/linux/task/TaskModule.h"

namespace host {

// An id that no record of the user has, and that nobody else gets.
TaloTaskAnswer MakeNewId(Connection* connection, const std::string& user, const std::string& prefix,
                         std::string* id);

}  // namespace host

#endif
