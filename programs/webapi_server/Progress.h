#ifndef TALO_PROGRAMS_WEBAPI_SERVER_PROGRESS_H
#define TALO_PROGRAMS_WEBAPI_SERVER_PROGRESS_H

#include <sys/types.h>

// The bytes that a process has read and written since it began; 0 when that cannot
// be told.
unsigned long long TransferredBytes(pid_t pid);

#endif
