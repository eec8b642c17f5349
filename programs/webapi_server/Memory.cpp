#include "programs/webapi_server/Memory.h"

#include <fcntl.h>
#include <unistd.h>

#include <cstdio>

PrivateMemory::PrivateMemory() : statm_(open("/proc/self/statm", O_RDONLY | O_CLOEXEC)) {}

PrivateMemory::~PrivateMemory() {
    if (statm_ >= 0) {
        (void)close(statm_);
    }
}

long long PrivateMemory::KiB() const {
    char text[128];
    const ssize_t size = pread(statm_, text, sizeof text - 1, 0);
    if (size <= 0) {
        return -1;
    }
    text[size] = '\0';
    long long resident = 0;
    long long shared = 0;
    if (std::sscanf(text, "%*d %lld %lld", &resident, &shared) != 2) {
        return -1;
    }
    return (resident - shared) * (sysconf(_SC_PAGESIZE) / 1024);
}
