#ifndef TALO_PROGRAMS_COMMON_CRASHREPLY_H
#define TALO_PROGRAMS_COMMON_CRASHREPLY_H

#include <signal.h>

// The reply of a request whose method ends the process: by a fault, abort(), exit()
// or _exit(). A client that has been sent nothing gets ReplyFor(ReplyStatus::kCrashed)
// on standard output, and the process then ends as it would have, core file
// included. *begun is not 0 once a reply has begun; it becomes 1 when this one
// leaves.
//
// From BeginCrashReply() to EndCrashReply(), which puts the signals' actions back,
// and in the calling process alone: a child has no client. A method that ends the
// process by SIGKILL leaves nobody here to answer.
void BeginCrashReply(volatile sig_atomic_t* begun);
void EndCrashReply();

#endif
