#include <sys/stat.h>
#include <unistd.h>

#include "platform/System.h"

extern "C" {

int TLIBCFileExist(const char* path) {
    struct stat facts = {};
    return path != nullptr && stat(path, &facts) == 0 && S_ISREG(facts.st_mode) ? 1 : 0;
}

int TLIBCSysUnlink(const char* path) {
    return unlink(path);
}

}  // extern "C"
