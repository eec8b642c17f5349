#ifndef TALO_SRC_BASE_LOG_H
#define TALO_SRC_BASE_LOG_H

#include <syslog.h>

namespace TALO {

// Receives a finished line. The default hands it to syslog.
typedef void (*LogSink)(int priority, const char* line);

// Replaces the sink, null restores the default. Answers the one before.
LogSink SetLogSink(LogSink sink);

// Logs "SOURCE:LINE MESSAGE". Control characters in the message are escaped, so
// that what came from outside cannot forge a line; a long message is cut. %m is
// the error at the call, and errno is left as it was.
void LogAt(int priority, const char* source, int line, const char* format, ...)
    __attribute__((format(printf, 4, 5)));

// The same without the place in front, for messages that carry it in another form.
void LogMessage(int priority, const char* format, ...) __attribute__((format(printf, 2, 3)));

}  // namespace TALO

// A file that logs names itself in a constant kSource.
#define LOG_ERROR(...) ::TALO::LogAt(LOG_ERR, kSource, __LINE__, __VA_ARGS__)
#define LOG_DETAIL(...) ::TALO::LogAt(LOG_DEBUG, kSource, __LINE__, __VA_ARGS__)

#endif
