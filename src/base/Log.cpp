#include "src/base/Log.h"

#include <cerrno>
#include <cstdarg>
#include <cstdio>
#include <string>

namespace TALO {

namespace {

// A client can send a name of megabytes; a log line need not carry it.
constexpr int kMaxLine = 1024;

void ToSyslog(int priority, const char* line) {
    syslog(priority, "%s", line);
}

LogSink currentSink = ToSyslog;

std::string EscapeControls(const char* text) {
    std::string out;
    for (; *text != '\0'; ++text) {
        const unsigned char byte = static_cast<unsigned char>(*text);
        if (byte < 0x20 || byte == 0x7F) {
            char escape[5];
            (void)std::snprintf(escape, sizeof escape, "\\x%02x", byte);
            out += escape;
        } else {
            out += *text;
        }
    }
    return out;
}

}  // namespace

LogSink SetLogSink(LogSink sink) {
    LogSink before = currentSink;
    currentSink = sink != nullptr ? sink : ToSyslog;
    return before;
}

void LogAt(int priority, const char* source, int line, const char* format, ...) {
    const int keptErrno = errno;
    char message[kMaxLine];
    int prefix = std::snprintf(message, sizeof message, "%s:%d ", source, line);
    prefix = prefix < 0 || prefix >= kMaxLine ? 0 : prefix;
    va_list arguments;
    va_start(arguments, format);
    errno = keptErrno;
    (void)std::vsnprintf(message + prefix, sizeof message - static_cast<size_t>(prefix), format,
                         arguments);
    va_end(arguments);
    currentSink(priority, EscapeControls(message).c_str());
    errno = keptErrno;
}

}  // namespace TALO
