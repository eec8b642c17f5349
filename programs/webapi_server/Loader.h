#ifndef TALO_PROGRAMS_WEBAPI_SERVER_LOADER_H
#define TALO_PROGRAMS_WEBAPI_SERVER_LOADER_H

// Begins the program again, in the same process, with what the system's loader and
// allocator take from the environment and from nowhere else: every library is bound
// at once, so that no worker has to do it after the fork, and freed memory is kept
// for the next request. Returns in the second beginning, with an environment that
// tells nothing of it; also when there can be no second one.
void BeginWithLoaderSettings(char** argv);

#endif
