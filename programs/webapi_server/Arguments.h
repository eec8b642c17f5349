#ifndef TALO_PROGRAMS_WEBAPI_SERVER_ARGUMENTS_H
#define TALO_PROGRAMS_WEBAPI_SERVER_ARGUMENTS_H

#include <string>

#include "programs/webapi_server/Settings.h"

// The command line, understood.
struct Arguments {
    Settings settings;
    bool help = false;
};

// Reads the command line. False for wrong usage; `problem` then says what is wrong.
bool ParseArguments(int argc, char** argv, Arguments* arguments, std::string* problem);

// What systemd handed over, by the variables LISTEN_PID and LISTEN_FDS.
enum class HandedOver { kNothing, kSocket, kUnusable };

// Reads the two variables and takes them out of the environment: they are for this
// process alone. `problem` says why what was handed over cannot be used.
HandedOver ReadHandedOver(std::string* problem);

extern const char kUsage[];

#endif
