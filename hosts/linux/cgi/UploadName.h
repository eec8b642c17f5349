#ifndef TALO_HOSTS_LINUX_CGI_UPLOADNAME_H
#define TALO_HOSTS_LINUX_CGI_UPLOADNAME_H

#include <sys/types.h>

#include <string>

namespace host {

// The names of the files that uploads go to:
//
//     webapi-upload-PID-START-RANDOM
//
// with the id and the start time (in clock ticks since boot) of the process that
// made the file, and 24 hexadecimal digits that nobody guesses.

// A new name, "" with errno set when the kernel gives no random bytes.
std::string NewUploadName();

// The process of such a name. False, and the outputs untouched, for other names.
bool ParseUploadName(const std::string& name, pid_t* pid, unsigned long long* start);

// When a process started, 0 when there is none, also none but its remains that its
// parent has not seen yet, or it cannot be told.
unsigned long long ProcessStart(pid_t pid);

}  // namespace host

#endif
