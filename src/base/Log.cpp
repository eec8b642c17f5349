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

// Builds the line, with its place unless `source` is null, and hands it over.
__attribute__((format(printf, 4, 0))) void Finish(int priority, const char* source, int line,
                                                  const char* format, va_list arguments) {
    const int keptErrno = errno;
    char message[kMaxLine];
    int prefix =
        source != nullptr ? std::snprintf(message, sizeof message, "%s:%d ", source, line) : 0;
    prefix = prefix < 0 || prefix >= kMaxLine ? 0 : prefix;
    errno = keptErrno;
    (void)std::vsnprintf(message + prefix, sizeof message - static_cast<size_t>(prefix), format,
                         arguments);
    currentSink(priority, EscapeControls(message).c_str());
    errno = keptErrno;
}

}  // namespace

LogSink SetLogSink(LogSink sink) {
    LogSink before = currentSink;
    currentSink = sink != nullptr ? sink : ToSyslog;
    return before;
}

void LogAt(int priority, const char* source, int line, const char* format, ...) {
    va_list arguments;
    va_start(arguments, format);
    Finish(priority, source, line, format, arguments);
    va_end(arguments);
}

void LogMessage(int priority, const char* format, ...) {
    va_list arguments;
    va_start(arguments, format);
    Finish(priority, nullptr, 0, format, arguments);
    va_end(arguments);
}

}  // namespace TALO
