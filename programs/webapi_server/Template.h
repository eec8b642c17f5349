#ifndef TALO_PROGRAMS_WEBAPI_SERVER_TEMPLATE_H
#define TALO_PROGRAMS_WEBAPI_SERVER_TEMPLATE_H

#include <signal.h>
#include <sys/resource.h>

#include "programs/webapi_server/Settings.h"
#include "programs/webapi_server/SlotTable.h"
#include "programs/webapi_server/Sockets.h"

// What workers get back of what the master changed for itself.
struct OriginalProcess {
    sigset_t mask;
    struct rlimit files;
};

struct TemplateTask {
    Sockets sockets;
    bool endsListener;  // with the master: nobody else has it
    SlotTable* slots;
    const Settings* settings;
    const OriginalProcess* original;
    bool loadsLibraries;  // false where one of them is the end of the process
};

// The life of the template, in a process that was just forked off the master: works
// in the web API directory, loads all that is described there, then forks a worker
// per order, and tells the master of their ends. It never has a connection. It ends
// when the master closes its side.
[[noreturn]] void RunTemplate(const TemplateTask& task);

#endif
