#ifndef TALO_HOSTS_LINUX_UTIL_HOSTLOG_H
#define TALO_HOSTS_LINUX_UTIL_HOSTLOG_H

namespace host {

// Logs "SOURCE:LINE MESSAGE" at error priority. Control characters become "?",
// so that a file's name cannot forge a line. errno is kept and %m understood.
void LogAt(const char* source, int line, const char* format, ...)
    __attribute__((format(printf, 3, 4)));

}  // namespace host

#define HOST_LOG(...) ::host::LogAt(kSource, __LINE__, __VA_ARGS__)

#endif
