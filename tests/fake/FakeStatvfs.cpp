#include <dlfcn.h>
#include <errno.h>
#include <sys/statvfs.h>

#include "tests/fake/FakePlatform.h"

// Stands before the C library's for the whole executable: a path that no test has
// scripted gets the true answer.
extern "C" int statvfs(const char* path, struct statvfs* facts) noexcept {
    const auto found = fake::Now().fileSystems.find(path);
    if (found == fake::Now().fileSystems.end()) {
        typedef int (*Statvfs)(const char*, struct statvfs*);
        static const Statvfs real = reinterpret_cast<Statvfs>(dlsym(RTLD_NEXT, "statvfs"));
        return real(path, facts);
    }
    fake::Now().fileSystemCalls.push_back(path);
    if (fake::Now().Called("statvfs")) {
        errno = EIO;
        return -1;
    }
    *facts = {};
    facts->f_bsize = found->second.blockSize;
    facts->f_frsize = found->second.fragmentSize;
    facts->f_bfree = found->second.freeBlocks;
    facts->f_bavail = found->second.availableBlocks;
    return 0;
}
