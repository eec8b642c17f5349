#include "tests/support/LogCapture.h"

#include "src/base/Log.h"

namespace support {

namespace {

std::vector<LogLine> lines;

void Collect(int priority, const char* line) {
    lines.push_back({priority, line});
}

}  // namespace

LogCapture::LogCapture() {
    lines.clear();
    TALO::SetLogSink(Collect);
}

LogCapture::~LogCapture() {
    TALO::SetLogSink(nullptr);
}

const std::vector<LogLine>& LogCapture::Lines() const {
    return lines;
}

bool LogCapture::Has(const std::string& source, const std::string& message) const {
    for (const LogLine& line : lines) {
        const std::string& text = line.text;
        const size_t blank = text.find(' ');
        const size_t colon = text.find(':');
        if (blank == std::string::npos || colon == std::string::npos || colon > blank) {
            continue;
        }
        const std::string number = text.substr(colon + 1, blank - colon - 1);
        if (text.substr(0, colon) == source && !number.empty() &&
            number.find_first_not_of("0123456789") == std::string::npos &&
            text.substr(blank + 1) == message) {
            return true;
        }
    }
    return false;
}

}  // namespace support
