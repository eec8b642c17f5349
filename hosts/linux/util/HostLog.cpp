#include "hosts/linux/util/HostLog.h"

#include <syslog.h>

#include <cctype>
#include <cerrno>
#include <cstdarg>
#include <cstdio>

namespace host {

void LogAt(const char* source, int line, const char* format, ...) {
    const int keptErrno = errno;
    char message[1024];
    va_list arguments;
    va_start(arguments, format);
    (void)std::vsnprintf(message, sizeof message, format, arguments);
    va_end(arguments);
    for (char* at = message; *at != '\0'; ++at) {
        if (std::iscntrl(static_cast<unsigned char>(*at))) {
            *at = '?';
        }
    }
    syslog(LOG_ERR, "%s:%d %s", source, line, message);
    errno = keptErrno;
}

}  // namespace host
