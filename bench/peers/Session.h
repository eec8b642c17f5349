#ifndef BENCH_PEERS_SESSION_H
#define BENCH_PEERS_SESSION_H

#include <string>

// Whether the file `folder`/`id` holds a session of that client which has not timed
// out; it counts as used then.
bool CheckSession(const std::string& folder, const std::string& id, const std::string& address);

#endif
