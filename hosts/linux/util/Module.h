#ifndef TALO_HOSTS_LINUX_UTIL_MODULE_H
#define TALO_HOSTS_LINUX_UTIL_MODULE_H

namespace host {

// What a module of the platform's module folder offers under a name; null when
// it is missing, which is logged with `lost`, the thing that cannot be done.
const void* OpenModule(const char* file, const char* symbol, const char* lost);

}  // namespace host

#endif
