#include "hosts/linux/task/ProcessIdentity.h"

#include <fcntl.h>
#include <string.h>
#include <unistd.h>

#include <charconv>

#include "hosts/linux/util/Descriptor.h"

namespace host {

namespace {

constexpr int kStartField = 22;  // counted from 1, as proc(5) does
constexpr int kStateField = 3;

// Files of the kernel have no size, and no more than a page here.
std::string ReadKernelFile(const std::string& path) {
    const Descriptor file(open(path.c_str(), O_RDONLY | O_CLOEXEC));
    char content[4096];
    const ssize_t size = file.Get() < 0 ? -1 : read(file.Get(), content, sizeof content);
    return size > 0 ? std::string(content, static_cast<size_t>(size)) : std::string();
}

std::string BootId() {
    std::string id = ReadKernelFile("/proc/sys/kernel/random/boot_id");
    while (!id.empty() && id.back() == '\n') {
        id.pop_back();
    }
    return id;
}

}  // namespace

bool ParseProcessLine(const std::string& line, char* state, unsigned long long* start) {
    size_t at = line.rfind(')');
    if (at == std::string::npos || at + 2 >= line.size() || line[at + 1] != ' ') {
        return false;
    }
    at += 2;
    const char found = line[at];
    for (int field = kStateField; field < kStartField; ++field) {
        at = line.find(' ', at);
        if (at == std::string::npos) {
            return false;
        }
        ++at;
    }
    unsigned long long ticks = 0;
    const char* end = line.data() + line.size();
    const auto result = std::from_chars(line.data() + at, end, ticks);
    if (result.ec != std::errc() || (result.ptr != end && *result.ptr != ' ')) {
        return false;
    }
    *state = found;
    *start = ticks;
    return true;
}

bool IdentifyProcess(int pid, TaloTaskProcess* process) {
    TaloTaskProcess found = {};
    char state = 0;
    const std::string boot = BootId();
    if (pid <= 0 || boot.empty() || boot.size() >= sizeof found.boot ||
        !ParseProcessLine(ReadKernelFile("/proc/" + std::to_string(pid) + "/stat"), &state,
                          &found.start) ||
        state == 'Z' || state == 'X' || state == 'x') {
        return false;
    }
    found.pid = pid;
    memcpy(found.boot, boot.c_str(), boot.size() + 1);
    *process = found;
    return true;
}

bool ProcessLives(const TaloTaskProcess& process) {
    TaloTaskProcess found = {};
    return IdentifyProcess(process.pid, &found) && found.start == process.start &&
           strncmp(found.boot, process.boot, sizeof found.boot) == 0;
}

}  // namespace host
