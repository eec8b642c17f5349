#ifndef TALO_HOSTS_LINUX_FILE_ERRORS_H
#define TALO_HOSTS_LINUX_FILE_ERRORS_H

#include "hosts/linux/sdk/Places.h"

namespace host {

// What an errno means for a caller; what has no name of its own is logged.
talo::FileError ErrorOf(int error);

}  // namespace host

#endif
