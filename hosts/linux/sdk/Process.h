#ifndef TALO_HOSTS_LINUX_SDK_PROCESS_H
#define TALO_HOSTS_LINUX_SDK_PROCESS_H

#include "platform/Platform.h"

// For programs that serve more than one request with one process.
namespace talo {

// Forgets what this process knows of its request: the body of an upload with the
// names in it (files that nobody took are removed), for whom it worked, and the
// error recorded last by this thread. What is kept is looked at again before each
// use, or is the same for everybody. Called between two requests, when nothing of
// the first one lives any more. Throws nothing.
TALO_PLATFORM void ForgetRequest();

}  // namespace talo

#endif
