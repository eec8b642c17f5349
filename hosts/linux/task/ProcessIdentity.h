#ifndef TALO_HOSTS_LINUX_TASK_PROCESSIDENTITY_H
#define TALO_HOSTS_LINUX_TASK_PROCESSIDENTITY_H

#include <string>

#include "hosts/linux/task/TaskModule.h"

namespace host {

// What tells the process of an id from one that gets the id later: when it
// started, and in which life of the machine. False when none of that id lives; a
// process that has ended and was not waited for does not.
bool IdentifyProcess(int pid, TaloTaskProcess* process);

// Whether that very process lives.
bool ProcessLives(const TaloTaskProcess& process);

// State and start time out of a line of /proc/PID/stat. The name in it is the
// process's own choice and may look like anything.
bool ParseProcessLine(const std::string& line, char* state, unsigned long long* start);

}  // namespace host

#endif
