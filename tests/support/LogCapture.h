#ifndef TESTS_SUPPORT_LOGCAPTURE_H
#define TESTS_SUPPORT_LOGCAPTURE_H

#include <string>
#include <vector>

namespace support {

struct LogLine {
    int priority;
    std::string text;
};

// Collects what the framework logs as long as it lives.
class LogCapture {
  public:
    LogCapture();
    ~LogCapture();
    LogCapture(const LogCapture&) = delete;
    LogCapture& operator=(const LogCapture&) = delete;

    const std::vector<LogLine>& Lines() const;

    // Whether a line is "SOURCE:NUMBER MESSAGE" with exactly this message.
    bool Has(const std::string& source, const std::string& message) const;
};

}  // namespace support

#endif
