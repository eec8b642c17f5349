#ifndef TALO_HOSTS_LINUX_TASK_CHANGEMARK_H
#define TALO_HOSTS_LINUX_TASK_CHANGEMARK_H

#include <array>

#include "hosts/linux/task/Connection.h"

namespace host {

// Differs after every change of the store, whoever has made it; that it differs
// does not prove a change.
typedef std::array<unsigned, 12> ChangeMark;

// Reads the mark without a call to the system, so that hundreds of looks a second
// cost next to nothing. False when it cannot be had.
bool ReadChangeMark(Connection* connection, ChangeMark* mark);

}  // namespace host

#endif
