#ifndef TALO_HOSTS_LINUX_TASK_SCHEMA_H
#define TALO_HOSTS_LINUX_TASK_SCHEMA_H

#include "hosts/linux/task/Connection.h"

namespace host {

// Makes the tables of a new database, and readies the connection. False, logged,
// when that fails or the database is not one of this version's.
bool PrepareSchema(Connection* connection);

}  // namespace host

#endif
