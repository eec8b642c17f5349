#ifndef TALO_PROGRAMS_WEBAPI_SERVER_SOCKETS_H
#define TALO_PROGRAMS_WEBAPI_SERVER_SOCKETS_H

// The descriptors of what was forked off the master: no others, and no connection.
constexpr int kControlSocket = 3;   // to the master, of this process alone
constexpr int kListenerSocket = 4;  // where the web server connects

struct Sockets {
    int control;
    int listener;  // -1 where there is none any more
};

// Gives them these numbers, and closes all other descriptors but the standard ones.
void KeepOnly(const Sockets& sockets);

#endif
