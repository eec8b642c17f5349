#ifndef TALO_PROGRAMS_WEBAPI_SERVER_WORKER_H
#define TALO_PROGRAMS_WEBAPI_SERVER_WORKER_H

#include "programs/webapi_server/Settings.h"
#include "programs/webapi_server/Slot.h"

struct WorkerTask {
    int control;   // to the master
    int listener;  // nonblocking
    Slot* slot;
};

// The life of a worker, in a process that was just forked off the template: says
// kIdle, serves what the master hands over and, where it may, who connects by itself,
// and goes on or ends as the descriptions of the called APIs say. The working directory
// is that of the descriptions already. The exit status of the process.
int RunWorker(const WorkerTask& task, const Settings& settings);

#endif
