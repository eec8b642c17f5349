#ifndef TALO_HOSTS_LINUX_TASK_CLOCK_H
#define TALO_HOSTS_LINUX_TASK_CLOCK_H

namespace host {

// Of the clock that nobody sets.
long long SteadyMilliseconds();

// Of the day, in seconds: the only clock that survives a restart.
long long SecondsOfDay();

// A number from 0 up to, and without, the limit, for pauses that shall differ
// from process to process.
int Spread(int limit);

}  // namespace host

#endif
