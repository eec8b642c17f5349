#ifndef TALO_PROGRAMS_WEBAPI_SERVER_SETTINGS_H
#define TALO_PROGRAMS_WEBAPI_SERVER_SETTINGS_H

#include <string>

// How the server works. Each has an option of the command line.
struct Settings {
    std::string socket;  // path of the socket to listen on; "" for a socket
                         // that systemd hands over
    int minWorkers = 2;  // that stand ready or work
    int maxWorkers = 32;
    int queue = 512;  // requests that wait for a worker
    // For a request whose API says nothing; 0 without limit. The caller of a background
    // task that tells nothing waits for 60 seconds.
    int deadlineSeconds = 90;
    int workerRequests = 10000;   // that a living worker serves
    int workerGrowthKiB = 16384;  // of a living worker's private memory
    int workerSeconds = 3600;     // of a living worker's age
};

#endif
