#include "hosts/linux/cgi/UploadName.h"

#include <fcntl.h>
#include <sys/random.h>
#include <unistd.h>

#include <charconv>

#include "hosts/linux/util/Descriptor.h"

namespace host {

namespace {

const char kPrefix[] = "webapi-upload-";
constexpr size_t kRandomBytes = 12;

template <typename Number>
bool ReadNumber(const std::string& text, Number* number) {
    Number value = 0;
    const char* end = text.data() + text.size();
    const auto result = std::from_chars(text.data(), end, value);
    if (text.empty() || text[0] == '-' || result.ec != std::errc() || result.ptr != end) {
        return false;
    }
    *number = value;
    return true;
}

bool IsRandomText(const std::string& text) {
    return text.size() == 2 * kRandomBytes &&
           text.find_first_not_of("0123456789abcdef") == std::string::npos;
}

}  // namespace

// Fields 20, 22 and 23 of the line; the second one, the program's name, may hold
// anything, blanks and parentheses too.
unsigned long long ProcessStart(pid_t pid) {
    constexpr int kThreads = 18;  // counted from the name
    constexpr int kStart = 20;
    constexpr int kMemory = 21;
    const std::string path = "/proc/" + std::to_string(pid) + "/stat";
    const Descriptor file(open(path.c_str(), O_RDONLY | O_CLOEXEC));
    char buffer[1024];
    const ssize_t got = file.Get() < 0 ? -1 : read(file.Get(), buffer, sizeof buffer);
    if (got <= 0) {
        return 0;
    }
    const std::string line(buffer, static_cast<size_t>(got));
    unsigned long long numbers[kMemory + 1] = {};
    size_t at = line.rfind(')');
    for (int field = 0; field <= kMemory && at != std::string::npos; ++field) {
        (void)ReadNumber(line.substr(at + 1, line.find(' ', at + 1) - at - 1), &numbers[field]);
        at = line.find(' ', at + 1);
    }
    // Who was killed has given its memory back long before its parent hears of it;
    // a first thread that leaves the others behind has, too.
    const bool hasEnded = numbers[kMemory] == 0 && numbers[kThreads] <= 1;
    return hasEnded ? 0 : numbers[kStart];
}

std::string NewUploadName() {
    static const char kDigits[] = "0123456789abcdef";
    unsigned char bytes[kRandomBytes];
    if (getrandom(bytes, sizeof bytes, 0) != static_cast<ssize_t>(sizeof bytes)) {
        return std::string();
    }
    const pid_t pid = getpid();
    std::string name =
        kPrefix + std::to_string(pid) + "-" + std::to_string(ProcessStart(pid)) + "-";
    for (const unsigned char byte : bytes) {
        name += kDigits[byte >> 4];
        name += kDigits[byte & 15];
    }
    return name;
}

bool ParseUploadName(const std::string& name, pid_t* pid, unsigned long long* start) {
    const size_t prefix = sizeof kPrefix - 1;
    if (name.compare(0, prefix, kPrefix) != 0) {
        return false;
    }
    const size_t first = name.find('-', prefix);
    const size_t second = first == std::string::npos ? first : name.find('-', first + 1);
    pid_t process = 0;
    unsigned long long ticks = 0;
    if (second == std::string::npos || !IsRandomText(name.substr(second + 1)) ||
        !ReadNumber(name.substr(prefix, first - prefix), &process) || process <= 0 ||
        !ReadNumber(name.substr(first + 1, second - first - 1), &ticks)) {
        return false;
    }
    *pid = process;
    *start = ticks;
    return true;
}

}  // namespace host
