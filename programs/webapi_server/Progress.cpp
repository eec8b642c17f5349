#include "programs/webapi_server/Progress.h"

#include <fcntl.h>
#include <string.h>
#include <unistd.h>

#include <charconv>
#include <cstdio>

namespace {

unsigned long long NumberAfter(const char* text, const char* name) {
    const char* const found = strstr(text, name);
    unsigned long long number = 0;
    if (found != nullptr) {
        const char* const digits = found + strlen(name);
        (void)std::from_chars(digits, digits + strcspn(digits, "\n"), number);
    }
    return number;
}

}  // namespace

unsigned long long TransferredBytes(pid_t pid) {
    char path[64] = {};
    (void)snprintf(path, sizeof path, "/proc/%d/io", static_cast<int>(pid));
    const int file = open(path, O_RDONLY | O_CLOEXEC);
    if (file < 0) {
        return 0;
    }
    char text[512] = {};
    const ssize_t got = read(file, text, sizeof text - 1);
    (void)close(file);
    return got > 0 ? NumberAfter(text, "rchar: ") + NumberAfter(text, "wchar: ") : 0;
}
