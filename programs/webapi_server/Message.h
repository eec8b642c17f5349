#ifndef TALO_PROGRAMS_WEBAPI_SERVER_MESSAGE_H
#define TALO_PROGRAMS_WEBAPI_SERVER_MESSAGE_H

#include <sys/types.h>

#include <cstddef>

// Messages over a SOCK_SEQPACKET socket, each with a descriptor or none.

// False when it did not leave; errno says why. The descriptor is the caller's still.
bool SendMessage(int socket, const void* data, size_t size, int descriptor, int flags);

// The size of the message; 0 at the end, -1 when there is none. `descriptor` is -1
// where none came, else it is the caller's and close-on-exec.
ssize_t ReceiveMessage(int socket, void* data, size_t size, int* descriptor, int flags);

// What the master wants of the template: a worker for the slot. The worker's end
// of its control socket comes along. Without one, the template is to end.
struct StartOrder {
    int slot;
    unsigned serial;
};

enum class Report : int {
    kReady,    // everything is loaded
    kChanged,  // what was loaded is no longer what lies there
    kStarted,  // a worker, whose process descriptor comes along
    kFailed,   // to start one
    kEnded,    // a worker, with its status
};

struct TemplateReport {
    Report kind;
    int slot;
    unsigned serial;
    pid_t pid;
    int status;
};

#endif
